#include "pipe.h"

namespace talcmp {

std::size_t Pipe::read_next(void* const bytes, const std::size_t count) {
    ssize_t got = 0;
    do {
        got = ::read(pipe_.number(), bytes, count);
    } while (got < 0 && errno == EINTR);
    if (got < 0) {
        throw_system_trouble(name_, "cannot be read");
    }
    return static_cast<std::size_t>(got);
}

} // namespace talcmp
