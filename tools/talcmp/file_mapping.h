// A whole file, mapped into memory for reading.

#ifndef TALCMP_FILE_MAPPING_H
#define TALCMP_FILE_MAPPING_H

#include <cstddef>
#include <string>

namespace talcmp {

class FileMapping {
  public:
    // Throws Trouble when `path` is no regular file that can be read.
    explicit FileMapping(const std::string& path);
    FileMapping(const FileMapping&) = delete;
    FileMapping& operator=(const FileMapping&) = delete;
    ~FileMapping();

    const unsigned char* data() const { return data_; }
    std::size_t size() const { return size_; }

  private:
    const unsigned char* data_ = nullptr;
    std::size_t size_ = 0;
};

} // namespace talcmp

#endif
