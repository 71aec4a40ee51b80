#include "status_line.h"

#include <atomic>
#include <csignal>
#include <cstddef>
#include <ctime>
#include <string_view>

#include <unistd.h>

namespace talcmp {
namespace {

constexpr int ending_signals[] = {SIGHUP, SIGINT, SIGTERM};
constexpr std::string_view nothing = "\r\x1B[K";

std::atomic<bool> is_shown = false;
std::atomic<bool> is_written = false; // at the moment
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler uses them");

sigset_t set_of_ending_signals() {
    sigset_t set;
    ::sigemptyset(&set);
    for (const int signal : ending_signals) {
        ::sigaddset(&set, signal);
    }
    return set;
}

// Keeps them from this thread: their handler would wait for what it has interrupted.
class BlockedSignals {
  public:
    BlockedSignals() {
        const sigset_t set = set_of_ending_signals();
        ::pthread_sigmask(SIG_BLOCK, &set, &before_);
    }
    BlockedSignals(const BlockedSignals&) = delete;
    BlockedSignals& operator=(const BlockedSignals&) = delete;
    ~BlockedSignals() { ::pthread_sigmask(SIG_SETMASK, &before_, nullptr); }

  private:
    sigset_t before_ = {};
};

// In one piece, so that nothing else comes between. If the terminal takes nothing, nobody sees it.
void write_to_terminal(const std::string_view text) {
    [[maybe_unused]] const ssize_t ignored = ::write(STDERR_FILENO, text.data(), text.size());
}

// Waits until no thread writes, and keeps all from it; not for long, as the terminal may have been
// stopped. Returns whether that has come about.
bool stop_writing() {
    constexpr int most_tries = 100;
    constexpr struct timespec millisecond = {0, 1000000};
    for (int tries = 0; is_written.exchange(true); ++tries) {
        if (tries == most_tries) {
            return false;
        }
        ::nanosleep(&millisecond, nullptr);
    }
    return true;
}

// Only calls what a signal handler may call.
void end_by_signal(const int signal) {
    if (stop_writing() && is_shown) {
        write_to_terminal(nothing);
    }
    ::raise(
        signal); // ends the process when the handler returns, as its action is the default again
}

void write_status(const std::string& text, const bool shown) {
    const BlockedSignals blocked;
    if (!is_written.exchange(true)) {
        is_shown = shown;
        write_to_terminal(text);
        is_written = false;
    }
}

} // namespace

void show_status(const std::string& text) {
    write_status("\r" + text + "\x1B[K", true);
}

void clear_status() {
    if (is_shown) {
        write_status(std::string(nothing), false);
    }
}

void clear_status_at_signals() {
    for (const int signal : ending_signals) {
        struct sigaction action = {};
        if (::sigaction(signal, nullptr, &action) != 0 || action.sa_handler != SIG_DFL) {
            continue;
        }
        action.sa_handler = end_by_signal;
        action.sa_mask = set_of_ending_signals();
        action.sa_flags = static_cast<int>(SA_RESETHAND);
        ::sigaction(signal, &action, nullptr);
    }
}

} // namespace talcmp
