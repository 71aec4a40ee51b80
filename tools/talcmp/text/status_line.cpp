#include "status_line.h"

#include "blocked_signals.h"

#include <atomic>
#include <csignal>
#include <cstddef>
#include <ctime>
#include <string_view>

#include <unistd.h>

namespace talcmp {
namespace {

constexpr std::string_view empty_line = "\r\x1B[K";

std::atomic<bool> line_is_shown = false;
std::atomic<bool> is_written = false; // at the moment
static_assert(std::atomic<bool>::is_always_lock_free, "a signal handler uses them");

// In one piece, so that no other output comes between. Failure is ignored: nobody would see a
// message.
void write_to_terminal(const std::string_view text) {
    [[maybe_unused]] const ssize_t ignored = ::write(STDERR_FILENO, text.data(), text.size());
}

// Waits until no thread is writing, and keeps all threads from writing. Returns false if that takes
// too long: the terminal may have been stopped.
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
    if (stop_writing() && line_is_shown) {
        write_to_terminal(empty_line);
    }
    // Ends the process when the handler returns, as its action is the default again.
    ::raise(signal);
}

void write_status(const std::string& text, const bool shown) {
    // The handler of these signals would wait for the write that it has interrupted.
    const BlockedSignals blocked;
    if (!is_written.exchange(true)) {
        line_is_shown = shown;
        write_to_terminal(text);
        is_written = false;
    }
}

} // namespace

void show_status(const std::string& text) {
    write_status("\r" + text + "\x1B[K", true);
}

void clear_status() {
    if (line_is_shown) {
        write_status(std::string(empty_line), false);
    }
}

void clear_status_at_signals() {
    for (const int signal : {SIGHUP, SIGINT, SIGTERM}) {
        struct sigaction action = {};
        if (::sigaction(signal, nullptr, &action) != 0 || action.sa_handler != SIG_DFL) {
            continue;
        }
        action.sa_handler = end_by_signal;
        action.sa_mask = BlockedSignals::ending_signals();
        action.sa_flags = static_cast<int>(SA_RESETHAND);
        ::sigaction(signal, &action, nullptr);
    }
}

} // namespace talcmp
