// The header of an .npy file: what its elements are and where they begin.
//
// The format: 6 bytes "\x93NUMPY", a byte each for the major and minor version, the length of a
// dictionary (2 bytes in version 1, 4 in versions 2 and 3, little-endian), the dictionary as a
// Python literal with the keys 'descr', 'fortran_order' and 'shape', and then the elements.

#pragma once

#include "array_source.h"
#include "byte_source.h"
#include "stored_type.h"

#include <cstdint>
#include <stdexcept>

namespace talcmp {

struct NpyHeader {
    StoredType type;
    Shape shape;                     // outermost dimension first
    std::uint64_t element_count = 0; // the product of `shape`
    std::uint64_t data_offset = 0;   // bytes from the beginning of the file to the first element
    bool fortran_order = false;      // whether the first index varies fastest
};

// What is wrong with a header or not supported in it: a sentence without its subject, the file.
struct NpyError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Elements of a type that is not supported.
struct NpyTypeError : NpyError {
    using NpyError::NpyError;
};

// Reads the header of an .npy file and checks, where the size of the file is known, that the
// elements fill the rest of it. Throws NpyError, or what reading throws.
NpyHeader read_npy_header(ByteSource& file);

} // namespace talcmp
