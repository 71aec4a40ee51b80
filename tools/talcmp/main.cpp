// talcmp: are the arrays in two files the same, where are they not, and by how much?

#include "run.h"

#include <memory>
#include <utility>

#include <unistd.h>

int main(int argc, char** argv) {
    const auto single_process = [](talcmp::Reporter report) {
        return std::make_unique<talcmp::SingleProcess>(std::move(report));
    };
    return talcmp::run(argc, argv,
                       {talcmp::Terminal::of(STDOUT_FILENO), STDERR_FILENO, true, single_process});
}
