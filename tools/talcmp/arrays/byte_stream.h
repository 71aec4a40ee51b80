// Bytes that can be read only once.

#pragma once

#include "byte_source.h"

namespace talcmp {

// A derived class provides the next bytes.
class ByteStream : public ByteSource {
  public:
    bool random_access() const final { return false; }
    std::size_t read(std::uint64_t offset, void* bytes, std::size_t count) final;

  private:
    // Reads up to `count` bytes into `bytes` and returns how many; 0 at the end. Throws Trouble.
    virtual std::size_t read_next(void* bytes, std::size_t count) = 0;

    // Reads until `count` bytes or the end.
    std::size_t read_all(void* bytes, std::size_t count);

    std::uint64_t position_ = 0;
};

} // namespace talcmp
