#include "byte_stream.h"

#include <algorithm>
#include <array>
#include <cassert>

namespace talcmp {

std::size_t ByteStream::read(const std::uint64_t offset, void* const bytes,
                             const std::size_t count) {
    assert(offset >= position_);
    std::array<char, 65536> passed_over; // NOLINT(*-member-init): only written to
    while (position_ < offset) {
        const auto wanted = std::min<std::uint64_t>(passed_over.size(), offset - position_);
        if (read_all(passed_over.data(), static_cast<std::size_t>(wanted)) < wanted) {
            return 0;
        }
    }
    return read_all(bytes, count);
}

std::size_t ByteStream::read_all(void* const bytes, const std::size_t count) {
    std::size_t done = 0;
    while (done < count) {
        const std::size_t got = read_next(static_cast<char*>(bytes) + done, count - done);
        if (got == 0) {
            break;
        }
        done += got;
        position_ += got;
    }
    return done;
}

} // namespace talcmp
