// The header of an .npy file: what its elements are and where they begin.
//
// The format: 6 bytes "\x93NUMPY", a byte each for the major and minor version, the length of a
// dictionary (2 bytes in version 1, 4 in versions 2 and 3, little-endian), the dictionary as a
// Python literal with the keys 'descr', 'fortran_order' and 'shape', and behind it the elements.

#ifndef TALCMP_NPY_HEADER_H
#define TALCMP_NPY_HEADER_H

#include "array_source.h"

#include <cstddef>
#include <cstdint>
#include <stdexcept>

namespace talcmp {

struct NpyHeader {
    type_t element_type = 0;         // an id of `TalNumericArrayTypeId` from 1 to 12
    Shape shape;                     // outermost dimension first
    std::uint64_t element_count = 0; // the product of `shape`
    std::size_t data_offset = 0;     // bytes from the beginning of the file to the first element
    bool bytes_swapped = false;      // whether the elements are in the other byte order than ours
};

// What is wrong with a header, or not supported, as a sentence without its subject, the file.
struct NpyError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Reads the header of the file that consists of the `size` bytes at `bytes`, and checks that the
// elements fill the rest of it. Throws NpyError.
NpyHeader read_npy_header(const unsigned char* bytes, std::size_t size);

} // namespace talcmp

#endif
