// The header of a netCDF file in a classic format: its variables and where their elements are.
//
// The formats: "CDF" and a byte for the version, 1, 2 (64-bit offsets) or 5 (64-bit sizes as well);
// the number of records; lists of dimensions, attributes and variables, the last of which say where
// their elements begin. All numbers are big-endian; names and values are padded to 4 bytes. The
// elements of a variable are in one piece, in C order, unless its first dimension is that of the
// records: then each record has a piece of each such variable, one after another.

#pragma once

#include "array_source.h"
#include "byte_source.h"
#include "stored_type.h"

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace talcmp {

struct NetcdfVariable {
    std::string name;
    std::optional<StoredType> type; // nothing where the elements are characters
    Shape shape;                    // outermost dimension first, which may be that of the records
    bool in_records = false;        // whether it is
    std::uint64_t begin = 0;        // bytes from the beginning of the file to the first element
    std::uint64_t piece_bytes = 0;  // of the elements in one piece, without padding
    std::uint64_t record_bytes = 0; // from a piece to that in the next record
};

// The byte after the last element; nothing where that is 2^64 or more.
std::optional<std::uint64_t> end_of(const NetcdfVariable& variable);

// What is wrong with a header or not supported in it: a sentence without its subject, the file.
struct NetcdfError : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// Reads the header of a file of known size. Whether the file is long enough for the elements is not
// checked, except where it gives the number of records. Throws NetcdfError, or what reading throws.
std::vector<NetcdfVariable> read_netcdf_header(ByteSource& file);

} // namespace talcmp
