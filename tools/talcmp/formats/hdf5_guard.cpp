#include "hdf5_guard.h"

#include "shown.h"

#include <algorithm>
#include <array>
#include <atomic>
#include <csignal>
#include <cstddef>
#include <ctime>

#include <pthread.h>
#include <unistd.h>

namespace talcmp::hdf5 {
namespace {

// ---- What the handlers use, which may only read it and call the system

constexpr int time_is_up = SIGVTALRM;
constexpr std::array<int, 6> guarded_signals = {SIGSEGV, SIGBUS,  SIGFPE,
                                                SIGILL,  SIGABRT, time_is_up};

std::atomic<bool> is_active = false;
std::atomic<pthread_t> guarded_thread;
std::array<char, 1200> message; // longer than a name that is shown
std::size_t message_length = 0;
std::array<struct sigaction, guarded_signals.size()> actions_before;

[[noreturn]] void end_process() {
    constexpr int trouble = 2;
    // Nobody can be told that it has failed.
    [[maybe_unused]] const ssize_t written = ::write(STDERR_FILENO, message.data(), message_length);
    ::_exit(trouble);
}

// Not the guarded thread's: the signal comes again, if it was a crash, and is handled as without
// this.
void leave_to_others(const int signal) {
    const auto* const place = std::find(guarded_signals.begin(), guarded_signals.end(), signal);
    ::sigaction(signal,
                &actions_before.at(static_cast<std::size_t>(place - guarded_signals.begin())),
                nullptr);
}

void handle_crash(const int signal) {
    if (is_active && ::pthread_equal(guarded_thread, ::pthread_self()) != 0) {
        end_process();
    }
    leave_to_others(signal);
}

// Any thread may get this signal. One that comes too late is ignored.
void handle_time(int /*signal*/) {
    if (is_active) {
        end_process();
    }
}

bool install_handlers() {
    for (std::size_t i = 0; i < guarded_signals.size(); ++i) {
        struct sigaction action = {};
        action.sa_handler = guarded_signals[i] == time_is_up ? handle_time : handle_crash;
        action.sa_flags = SA_RESTART;
        ::sigaction(guarded_signals[i], &action, &actions_before[i]);
    }
    return true;
}

// ---- The processor's time

// That of the thread which has made the timer.
class Timer {
  public:
    Timer() {
        struct sigevent event = {};
        event.sigev_notify = SIGEV_SIGNAL;
        event.sigev_signo = time_is_up;
        is_there_ = ::timer_create(CLOCK_THREAD_CPUTIME_ID, &event, &timer_) == 0;
    }
    Timer(const Timer&) = delete;
    Timer& operator=(const Timer&) = delete;
    ~Timer() {
        if (is_there_) {
            ::timer_delete(timer_);
        }
    }

    // No time for zero seconds.
    void set(const std::chrono::seconds limit) {
        if (is_there_) {
            struct itimerspec time = {};
            time.it_value.tv_sec = static_cast<time_t>(limit.count());
            ::timer_settime(timer_, 0, &time, nullptr);
        }
    }

  private:
    timer_t timer_ = {};
    bool is_there_ = false; // systems may refuse it
};

Timer& timer_of_thread() {
    thread_local Timer timer;
    return timer;
}

void set_message(const std::string& name) {
    const std::string text =
        "talcmp: " + shown(name) + ": the HDF5 library failed on it; is the file damaged?\n";
    message_length = text.copy(message.data(), message.size());
}

} // namespace

Guard::Guard(const std::string& name, const std::chrono::seconds limit) {
    static const bool installed = install_handlers();
    static_cast<void>(installed);
    set_message(name);
    guarded_thread = ::pthread_self();
    is_active = true;
    timer_of_thread().set(limit);
}

Guard::~Guard() {
    timer_of_thread().set(std::chrono::seconds(0));
    is_active = false;
}

} // namespace talcmp::hdf5
