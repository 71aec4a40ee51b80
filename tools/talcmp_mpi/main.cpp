// talcmp-mpi: talcmp on many machines, which share the work.

#include "launcher.h"
#include "mpi_group.h"
#include "run.h"
#include "watch.h"

#include <cstdio>
#include <memory>
#include <utility>

#include <unistd.h>

int main(int argc, char** argv) {
    talcmp::Watched watched;
    const talcmp::Mpi mpi;
    watched.has_started();
    const bool speaks = talcmp::rank() == 0;
    const talcmp::Descriptor output = talcmp::shown_by_launcher(STDOUT_FILENO);
    const talcmp::Descriptor status = talcmp::shown_by_launcher(STDERR_FILENO);
    talcmp::Terminal terminal = talcmp::Terminal::of(output.number());
    talcmp::broadcast(&terminal, sizeof terminal);
    if (!terminal.is_terminal()) {
        std::setvbuf(stdout, nullptr, _IOFBF, BUFSIZ);
    }
    const auto ranks = [](talcmp::Reporter report, const talcmp::Question& question) {
        return std::make_unique<talcmp::MpiGroup>(std::move(report), question);
    };
    const int exit_status =
        talcmp::run(argc, argv, {terminal, status.number(), speaks, ranks, talcmp::end_run});
    return speaks ? exit_status : 0;
}
