// A file that is one .npy array.

#ifndef TALCMP_NPY_FILE_H
#define TALCMP_NPY_FILE_H

#include "array_file.h"
#include "byte_source.h"

namespace talcmp {

class NpyFile : public ArrayFile {
  public:
    explicit NpyFile(const std::string& path);
    // `name` is what messages call the file.
    NpyFile(std::string name, std::unique_ptr<ByteSource> bytes);

    bool is_archive() const override { return false; }
    std::vector<std::string> members() const override { return {""}; }
    std::unique_ptr<ArraySource> open(const std::string& member) override;

  private:
    std::string name_;
    std::unique_ptr<ByteSource> bytes_;
};

} // namespace talcmp

#endif
