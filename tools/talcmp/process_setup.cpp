#include "process_setup.h"

#include "descriptor.h"

#include <csignal>

#include <fcntl.h>

namespace talcmp {
namespace {

void open_if_closed(const int standard) {
    if (::fcntl(standard, F_GETFD) >= 0) {
        return;
    }
    // open() takes the lowest free number. A descriptor of O_PATH can be neither read nor written.
    if (::open("/", O_PATH) != standard) {
        throw_system_trouble("standard descriptor " + std::to_string(standard), "cannot be opened");
    }
}

} // namespace

void set_up_process() {
    for (const int standard : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
        open_if_closed(standard);
    }
    std::signal(SIGXFSZ, SIG_IGN);
}

} // namespace talcmp
