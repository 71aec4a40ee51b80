// A file on disk.

#ifndef TALCMP_REGULAR_FILE_H
#define TALCMP_REGULAR_FILE_H

#include "byte_source.h"
#include "descriptor.h"

#include <string>

namespace talcmp {

// It is read, not mapped into memory: a file that is cut short meanwhile is told, where a mapped
// one would end the program, and its size is not bound by the address space.
class RegularFile : public ByteSource {
  public:
    // Throws Trouble when `path` is no regular file that can be read.
    explicit RegularFile(const std::string& path);

    bool random_access() const override { return true; }
    std::optional<std::uint64_t> size() const override { return size_; }
    std::size_t read(std::uint64_t offset, void* bytes, std::size_t count) override;

  private:
    std::string path_;
    Descriptor file_;
    std::uint64_t size_ = 0;
};

} // namespace talcmp

#endif
