// Files in memory.

#pragma once

#include "byte_stream.h"

#include <algorithm>
#include <cstring>
#include <string_view>

class MemoryBytes : public talcmp::ByteSource {
  public:
    explicit MemoryBytes(const std::string_view bytes) : bytes_(bytes) {}

    bool random_access() const override { return true; }
    std::optional<std::uint64_t> size() const override { return bytes_.size(); }

    std::size_t read(const std::uint64_t offset, void* const bytes,
                     const std::size_t count) override {
        const std::size_t begin =
            static_cast<std::size_t>(std::min<std::uint64_t>(offset, bytes_.size()));
        const std::size_t there = std::min(count, bytes_.size() - begin);
        if (there != 0) {
            std::memcpy(bytes, bytes_.data() + begin, there);
        }
        return there;
    }

  private:
    std::string_view bytes_;
};

// Can be read only once, and hands out no more than `at_once` bytes.
class MemoryStream : public talcmp::ByteStream {
  public:
    explicit MemoryStream(const std::string_view bytes,
                          const std::size_t at_once = std::string_view::npos)
        : bytes_(bytes), at_once_(at_once) {}

    std::optional<std::uint64_t> size() const override { return std::nullopt; }

  private:
    std::size_t read_next(void* const bytes, const std::size_t count) override {
        const std::size_t there = bytes_.copy(static_cast<char*>(bytes), std::min(count, at_once_));
        bytes_.remove_prefix(there);
        return there;
    }

    std::string_view bytes_;
    std::size_t at_once_;
};
