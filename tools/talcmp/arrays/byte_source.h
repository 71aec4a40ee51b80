// Where the bytes of a file come from.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>

namespace talcmp {

class ByteSource {
  public:
    ByteSource() = default;
    ByteSource(const ByteSource&) = delete;
    ByteSource& operator=(const ByteSource&) = delete;
    virtual ~ByteSource() = default;

    // Whether bytes may be read in any order, by several threads at once. Otherwise `offset` may
    // never be below what has been read, and only one thread reads.
    virtual bool random_access() const = 0;

    // In bytes; nothing if the size is not known before the end.
    virtual std::optional<std::uint64_t> size() const = 0;

    // Reads up to `count` bytes from `offset` into `bytes` and returns how many, fewer only at the
    // end. Throws Trouble.
    virtual std::size_t read(std::uint64_t offset, void* bytes, std::size_t count) = 0;

    // Where bytes may be read in any order, reads those that were not if only all of them show
    // whether they were right. Throws Trouble.
    virtual void check_to_end() {}
};

} // namespace talcmp
