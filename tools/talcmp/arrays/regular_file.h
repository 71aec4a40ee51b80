// A file on disk.

#pragma once

#include "byte_source.h"
#include "descriptor.h"

#include <string>
#include <string_view>

namespace talcmp {

// It is read, not mapped into memory: if a file is cut short while it is read, a message says so,
// whereas a mapped file would end the program. Nor does the address space limit its size.
class RegularFile : public ByteSource {
  public:
    // `file` is a regular file of `size` bytes, and `path` what messages call it. Throws Trouble.
    RegularFile(std::string path, Descriptor file, std::uint64_t size);

    bool random_access() const override { return true; }
    std::optional<std::uint64_t> size() const override { return size_; }
    std::size_t read(std::uint64_t offset, void* bytes, std::size_t count) override;

    const std::string& path() const { return path_; }

    // The first bytes: enough to recognise a format by, and usually the header.
    std::string_view beginning() const { return beginning_; }

    // Stays open as long as this object lives.
    int descriptor() const { return file_.number(); }

  private:
    std::string path_;
    Descriptor file_;
    std::uint64_t size_;
    std::string beginning_;
};

} // namespace talcmp
