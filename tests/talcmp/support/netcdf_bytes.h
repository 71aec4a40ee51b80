// The bytes of netCDF files in the classic formats, well-formed or not.

#pragma once

#include "npy_bytes.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace netcdf {

// The types of values, by their numbers.
enum Type : std::uint32_t {
    type_byte = 1,
    type_char,
    type_short,
    type_int,
    type_float,
    type_double,
    type_ubyte,
    type_ushort,
    type_uint,
    type_int64,
    type_uint64
};

struct Dimension {
    std::string name;
    std::uint64_t length; // 0 for that of the records
};

struct Attribute {
    std::string name;
    std::uint32_t type;
    std::uint64_t count;
    std::string values; // without padding
};

struct Variable {
    std::string name;
    std::vector<std::uint64_t> dimensions; // by their places in the file's list
    std::uint32_t type;
    std::uint64_t place = 0; // bytes from the end of the header to the first element
    std::vector<Attribute> attributes = {};
};

struct File {
    int version;
    std::uint64_t records;
    std::vector<Dimension> dimensions;
    std::vector<Attribute> attributes;
    std::vector<Variable> variables;
};

inline std::string big_endian(const std::uint64_t value, const std::size_t width) {
    std::string bytes = npy::little_endian(value, width);
    std::reverse(bytes.begin(), bytes.end());
    return bytes;
}

inline std::string padded(std::string bytes) {
    bytes.resize((bytes.size() + 3) / 4 * 4);
    return bytes;
}

template <typename T>
std::string elements(const std::vector<T>& values) {
    return npy::elements(values, '>');
}

// Numbers and names, as a version writes them.
class Writer {
  public:
    explicit Writer(const int version) : version_(version) {}

    std::string size(const std::uint64_t value) const {
        return big_endian(value, version_ == 5 ? 8 : 4);
    }

    std::string offset(const std::uint64_t value) const {
        return big_endian(value, version_ == 1 ? 4 : 8);
    }

    std::string name(const std::string& text) const { return size(text.size()) + padded(text); }

    std::string list(const std::uint32_t tag, const std::size_t length) const {
        return big_endian(length == 0 ? 0 : tag, 4) + size(length);
    }

    std::string attributes(const std::vector<Attribute>& attributes) const {
        std::string bytes = list(12, attributes.size());
        for (const Attribute& attribute : attributes) {
            bytes += name(attribute.name) + big_endian(attribute.type, 4) + size(attribute.count)
                     + padded(attribute.values);
        }
        return bytes;
    }

  private:
    int version_;
};

inline std::string magic(const int version) {
    return "CDF" + std::string(1, static_cast<char>(version));
}

inline std::string header_ending_at(const std::uint64_t end, const File& file) {
    const Writer writer(file.version);
    std::string bytes =
        magic(file.version) + writer.size(file.records) + writer.list(10, file.dimensions.size());
    for (const Dimension& dimension : file.dimensions) {
        bytes += writer.name(dimension.name) + writer.size(dimension.length);
    }
    bytes += writer.attributes(file.attributes) + writer.list(11, file.variables.size());
    for (const Variable& variable : file.variables) {
        bytes += writer.name(variable.name) + writer.size(variable.dimensions.size());
        for (const std::uint64_t dimension : variable.dimensions) {
            bytes += writer.size(dimension);
        }
        // Nobody relies on the size of a piece.
        bytes += writer.attributes(variable.attributes) + big_endian(variable.type, 4)
                 + writer.size(0x01020304) + writer.offset(end + variable.place);
    }
    return bytes;
}

inline std::string header(const File& file) {
    return header_ending_at(header_ending_at(0, file).size(), file);
}

} // namespace netcdf
