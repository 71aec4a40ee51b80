#include "watch.h"

#include "environment.h"
#include "shown.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <sstream>
#include <string>
#include <system_error>
#include <thread>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

namespace talcmp {
namespace {

constexpr int trouble = 2;

// The number of this rank as whatever starts ranks tells it; empty if nothing does.
std::string rank_from_environment() {
    for (const char* const variable : {"OMPI_COMM_WORLD_RANK", "PMIX_RANK", "PMI_RANK"}) {
        if (std::string rank = environment(variable); !rank.empty()) {
            return rank;
        }
    }
    return "";
}

std::string this_process() {
    std::array<char, 256> host = {};
    ::gethostname(host.data(), host.size() - 1);
    const std::string rank = rank_from_environment();
    return rank.empty() ? std::string("the process") : "rank " + rank + " on " + host.data();
}

[[noreturn]] void end_with(const std::string& text) {
    std::fprintf(stderr, "talcmp: %s\n", text.c_str());
    std::fflush(stderr);
    ::_exit(trouble);
}

std::string contents_of(const Descriptor& file) {
    std::string text(std::size_t{64} * 1024, '\0');
    text.resize(read_at(file.number(), "standard error", 0, text.data(), text.size()));
    return text;
}

// Open MPI says this, and waits, before it ends the whole run with a status that stands for arrays
// that differ.
constexpr const char* before_end = "before aborting";

// The first paragraph of what MPI says, in one line, without its frame and lines for its
// developers.
std::string first_words(const std::string& text) {
    constexpr std::size_t most = 300;
    std::istringstream lines(text);
    std::string words;
    for (std::string line; std::getline(lines, line);) {
        const auto begin = line.find_first_not_of(' ');
        if (begin != std::string::npos && line[begin] != '-' && line[begin] != '[') {
            words += (words.empty() ? "" : " ") + line.substr(begin);
        } else if (!words.empty()) {
            break;
        }
    }
    if (words.empty()) {
        return "";
    }
    return ": " + shown(words.size() > most ? words.substr(0, most) + "..." : words);
}

// Where MPI starts on no rank, the first one speaks for all, and its end ends the others.
void let_first_rank_speak() {
    const std::string rank = rank_from_environment();
    if (!rank.empty() && rank != "0") {
        constexpr int seconds = 5; // mpirun takes one
        std::this_thread::sleep_for(std::chrono::seconds(seconds));
    }
}

// How a process has ended.
struct End {
    int status = 0;               // as the system tells it
    bool is_start_failed = false; // whether MPI was going to end the run before it had started
};

// Waits for the end of the process; ends it where its start fails.
End end_of(const pid_t process, const std::atomic<bool>& has_started, const Descriptor& kept) {
    constexpr auto while_it_starts = std::chrono::milliseconds(20);
    End end;
    while (!has_started && ::waitpid(process, &end.status, WNOHANG) == 0) {
        std::this_thread::sleep_for(while_it_starts);
        if (contents_of(kept).find(before_end) != std::string::npos) {
            end.is_start_failed = true;
            ::kill(process, SIGKILL);
        }
    }
    if (has_started) {
        while (::waitpid(process, &end.status, 0) < 0 && errno == EINTR) {
        }
    }
    return end;
}

[[noreturn]] void watch(const pid_t process, const std::atomic<bool>& has_started,
                        const Descriptor& kept) {
    const End end = end_of(process, has_started, kept);
    if (WIFSIGNALED(end.status) && !end.is_start_failed) {
        const int signal = WTERMSIG(end.status);
        const char* const name = ::sigdescr_np(signal); // those of real time have none
        end_with(this_process() + " was killed (signal " + std::to_string(signal)
                 + (name == nullptr ? "" : std::string(", ") + name) + "); there is no answer");
    }
    if (has_started) {
        ::_exit(WEXITSTATUS(end.status));
    }
    let_first_rank_speak();
    end_with("MPI cannot be started (" + this_process() + ")" + first_words(contents_of(kept))
             + "; is Open MPI installed completely? "
             + (environment("SLURM_STEP_ID").empty() ? "mpirun says more without the option -q"
                                                     : "srun starts it with --mpi=pmix"));
}

std::atomic<bool>& shared_flag() {
    void* const memory = ::mmap(nullptr, sizeof(std::atomic<bool>), PROT_READ | PROT_WRITE,
                                MAP_SHARED | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED) {
        end_with("there is not enough memory");
    }
    return *new (memory) std::atomic<bool>(false);
}

} // namespace

Watched::Watched()
    : has_started_(shared_flag()), kept_(::memfd_create("standard error", MFD_CLOEXEC)),
      standard_error_(::fcntl(STDERR_FILENO, F_DUPFD_CLOEXEC, STDERR_FILENO + 1)) {
    const pid_t watching = ::getpid();
    const pid_t process = ::fork();
    if (process < 0) {
        end_with("no process can be started: " + std::generic_category().message(errno));
    }
    if (process > 0) {
        watch(process, has_started_, kept_);
    }
    ::prctl(PR_SET_PDEATHSIG, SIGKILL);
    if (::getppid() != watching) {
        ::_exit(trouble); // it has ended already
    }
    // NOLINTBEGIN(concurrency-mt-unsafe): there is one thread.
    ::setenv("OMPI_MCA_mpi_abort_delay", "10", 1); // seconds, for the other process to notice
    ::setenv("OMPI_MCA_opal_signal", "", 0);       // or it prints the stack when a signal comes
    // NOLINTEND(concurrency-mt-unsafe)
    ::dup2(kept_.number(), STDERR_FILENO);
}

void Watched::has_started() {
    ::dup2(standard_error_.number(), STDERR_FILENO);
    std::fputs(contents_of(kept_).c_str(), stderr);
    has_started_ = true;
}

} // namespace talcmp
