// Where the bytes of a file come from.

#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

namespace talcmp {

// The CRC-32 of the bytes from `begin` to `end` - 1.
struct SummedPart {
    std::uint64_t begin = 0;
    std::uint64_t end = 0;
    std::uint32_t sum = 0;
};

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

    // The sums of what was read, if `check_to_end` needs sums.
    virtual std::vector<SummedPart> summed_parts() const { return {}; }

    // Takes these parts, of the same bytes, as read here. Those that overlap others are left out.
    virtual void add_summed_parts(const std::vector<SummedPart>& /*parts*/) {}
};

} // namespace talcmp
