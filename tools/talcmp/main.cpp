// talcmp: are the arrays in two files the same, where are they not, and by how much?

#include "run.h"

#include <memory>
#include <utility>

#include <unistd.h>

int main(int argc, char** argv) {
    const auto single_process = [](talcmp::Reporter report, const talcmp::Question& /*question*/) {
        return std::make_unique<talcmp::SingleProcess>(std::move(report));
    };
    const auto terminal = talcmp::Terminal::of(STDOUT_FILENO);
    return talcmp::run(argc, argv,
                       {terminal, STDERR_FILENO, true, single_process, talcmp::complain});
}
