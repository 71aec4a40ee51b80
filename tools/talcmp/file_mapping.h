// A whole file, mapped into memory for reading.

#ifndef TALCMP_FILE_MAPPING_H
#define TALCMP_FILE_MAPPING_H

#include <cstddef>
#include <string>

namespace talcmp {

// A file that is cut short while it is mapped ends the program by a signal when the missing part is
// read; nothing else may be writing it.
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
