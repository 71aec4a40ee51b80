// How a child process ends.

#pragma once

#include <cerrno>
#include <ostream>
#include <system_error>

#include <sys/wait.h>
#include <unistd.h>

struct ChildEnd {
    int exit_status; // -1 if it was killed
    int signal;      // 0 if it was not
};

inline bool operator==(const ChildEnd& end1, const ChildEnd& end2) {
    return end1.exit_status == end2.exit_status && end1.signal == end2.signal;
}

inline std::ostream& operator<<(std::ostream& text, const ChildEnd& end) {
    return end.signal == 0 ? text << "exit status " << end.exit_status
                           : text << "killed by signal " << end.signal;
}

inline constexpr ChildEnd success = {0, 0};

constexpr ChildEnd killed_by(const int signal) {
    return {-1, signal};
}

// Runs `body` in a forked child, whose exit status is what `body` returns. A child that hangs is
// killed by SIGALRM.
template <typename Body>
ChildEnd in_child(const Body& body) {
    constexpr unsigned seconds = 60;
    const pid_t child = ::fork();
    if (child == 0) {
        ::alarm(seconds);
        ::_exit(body());
    }
    int status = 0;
    if (child < 0 || ::waitpid(child, &status, 0) != child) {
        throw std::system_error(errno, std::generic_category(), "fork or waitpid");
    }
    return WIFEXITED(status) ? ChildEnd{WEXITSTATUS(status), 0} : killed_by(WTERMSIG(status));
}
