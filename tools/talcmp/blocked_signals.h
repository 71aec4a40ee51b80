// Signals that wait until a few steps are done.

#pragma once

#include <csignal>

namespace talcmp {

// Keeps SIGHUP, SIGINT and SIGTERM from this thread while the object lives.
class BlockedSignals {
  public:
    BlockedSignals() {
        const sigset_t set = ending_signals();
        ::pthread_sigmask(SIG_BLOCK, &set, &before_);
    }
    BlockedSignals(const BlockedSignals&) = delete;
    BlockedSignals& operator=(const BlockedSignals&) = delete;
    ~BlockedSignals() { ::pthread_sigmask(SIG_SETMASK, &before_, nullptr); }

    static sigset_t ending_signals() {
        sigset_t set;
        ::sigemptyset(&set);
        for (const int signal : {SIGHUP, SIGINT, SIGTERM}) {
            ::sigaddset(&set, signal);
        }
        return set;
    }

  private:
    sigset_t before_ = {};
};

} // namespace talcmp
