#include "pipe.h"

namespace talcmp {

const std::string& Pipe::beginning() {
    if (!beginning_) {
        constexpr std::size_t enough = 8;
        beginning_.emplace(enough, '\0');
        std::size_t there = 0;
        for (std::size_t got = 1; there < enough && got != 0; there += got) {
            got = read_from_system(beginning_->data() + there, enough - there);
        }
        beginning_->resize(there);
    }
    return *beginning_;
}

std::size_t Pipe::read_next(void* const bytes, const std::size_t count) {
    if (beginning_ && taken_ < beginning_->size()) {
        const std::size_t copied = beginning_->copy(static_cast<char*>(bytes), count, taken_);
        taken_ += copied;
        return copied;
    }
    return read_from_system(bytes, count);
}

std::size_t Pipe::read_from_system(void* const bytes, const std::size_t count) {
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
