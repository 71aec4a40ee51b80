// File descriptors: closing them, reading from them, and the error when reading fails.

#pragma once

#include "trouble.h"

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <string>
#include <system_error>
#include <utility>

#include <unistd.h>

namespace talcmp {

class Descriptor {
  public:
    explicit Descriptor(const int number) : number_(number) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    Descriptor(Descriptor&& other) noexcept : number_(other.release()) {}
    Descriptor& operator=(Descriptor&&) = delete;
    ~Descriptor() {
        if (number_ >= 0) {
            ::close(number_);
        }
    }
    int number() const { return number_; }

    // Leaves closing it to the caller.
    int release() { return std::exchange(number_, -1); }

  private:
    int number_;
};

// With the text of the system's last error.
[[noreturn]] inline void throw_system_trouble(const std::string& path, const char* what_failed) {
    throw Trouble(path, std::string(what_failed) + ": " + std::generic_category().message(errno));
}

// Reads up to `count` bytes of a file on disk from `offset` and returns how many, fewer only at the
// end. Throws Trouble, which names `path`.
inline std::size_t read_at(const int file, const std::string& path, const std::uint64_t offset,
                           void* const bytes, const std::size_t count) {
    std::size_t done = 0;
    while (done < count) {
        const ssize_t got = ::pread(file, static_cast<char*>(bytes) + done, count - done,
                                    static_cast<off_t>(offset + done));
        if (got < 0 && errno != EINTR) {
            throw_system_trouble(path, "cannot be read");
        }
        if (got == 0) {
            break;
        }
        done += got > 0 ? static_cast<std::size_t>(got) : 0;
    }
    return done;
}

} // namespace talcmp
