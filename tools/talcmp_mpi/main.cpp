// talcmp-mpi: talcmp on many machines, which share the work.

#include "launcher.h"
#include "mpi_group.h"
#include "process_setup.h"
#include "run.h"
#include "watch.h"

#include <cstddef>
#include <cstdio>
#include <exception>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <unistd.h>

namespace {

// The words of the first rank's command line, so that all ranks do the same.
class FirstRanksWords {
  public:
    FirstRanksWords(const int argc, const char* const* argv) {
        const char separator = '\0'; // which no word has
        std::string text;
        for (const char* const word : std::vector<const char*>(argv, argv + argc)) {
            text += word;
            text += separator;
        }
        text_ = talcmp::broadcast(std::move(text));
        for (std::size_t begin = 0; begin < text_.size();
             begin = text_.find(separator, begin) + 1) {
            words_.push_back(text_.data() + begin);
        }
    }

    int count() const { return static_cast<int>(words_.size()); }
    const char* const* words() const { return words_.data(); }

  private:
    std::string text_;
    std::vector<const char*> words_;
};

int compare(const int argc, const char* const* argv) {
    talcmp::set_up_process();
    talcmp::Watched watched;
    // Before MPI starts: it leaves the marks of a launcher where there is none.
    const talcmp::Descriptor output = talcmp::shown_by_launcher(STDOUT_FILENO);
    const talcmp::Descriptor status = talcmp::shown_by_launcher(STDERR_FILENO);
    const talcmp::Mpi mpi;
    watched.has_started();
    const bool speaks = talcmp::rank() == 0;
    talcmp::Terminal terminal = talcmp::Terminal::of(output.number());
    talcmp::broadcast(&terminal, sizeof terminal);
    if (!terminal.is_terminal()) {
        std::setvbuf(stdout, nullptr, _IOFBF, BUFSIZ);
    }
    const FirstRanksWords line(argc, argv);
    const auto ranks = [](talcmp::Reporter report, const talcmp::Question& question) {
        return std::make_unique<talcmp::MpiGroup>(std::move(report), question);
    };
    const int exit_status = talcmp::run(
        line.count(), line.words(), {terminal, status.number(), speaks, ranks, talcmp::end_run});
    return speaks ? exit_status : 0;
}

} // namespace

int main(int argc, char** argv) {
    try {
        return compare(argc, argv);
    } catch (const std::exception& error) {
        talcmp::end_run(error.what());
    }
}
