// An .npy file as a source of elements.

#ifndef TALCMP_NPY_FILE_H
#define TALCMP_NPY_FILE_H

#include "array_source.h"
#include "file_mapping.h"
#include "npy_header.h"

#include <cstdint>
#include <string>
#include <vector>

namespace talcmp {

class NpyFile : public ArraySource {
  public:
    // Throws Trouble when the file cannot be read, is broken or not supported.
    explicit NpyFile(const std::string& path);

    type_t element_type() const override { return header_.element_type; }
    const Shape& shape() const override { return header_.shape; }
    std::uint64_t element_count() const override { return header_.element_count; }
    const void* elements(std::uint64_t first, std::uint64_t count) override;

  private:
    FileMapping file_;
    NpyHeader header_;
    std::vector<std::max_align_t> copy_; // of elements that cannot be used where they lie
};

} // namespace talcmp

#endif
