#include "pipe.h"

#include <fcntl.h>

namespace talcmp {

Pipe::Pipe(const std::string& path) : Pipe(path, ::open(path.c_str(), O_RDONLY | O_CLOEXEC)) {
    if (pipe_.number() < 0) {
        throw_system_trouble(path, "cannot be opened");
    }
}

Pipe::Pipe(std::string name, const int descriptor) : name_(std::move(name)), pipe_(descriptor) {}

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
