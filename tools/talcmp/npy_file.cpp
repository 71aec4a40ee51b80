#include "npy_file.h"

#include "element_type.h"
#include "trouble.h"

#include <algorithm>
#include <cstring>

namespace talcmp {
namespace {

NpyHeader header_of(const std::string& path, const FileMapping& file) {
    try {
        return read_npy_header(file.data(), file.size());
    } catch (const NpyError& error) {
        throw Trouble(path, error.what());
    }
}

void reverse_each(unsigned char* const parts, const std::size_t bytes,
                  const std::size_t part_size) {
    for (std::size_t i = 0; i < bytes; i += part_size) {
        std::reverse(parts + i, parts + i + part_size);
    }
}

} // namespace

NpyFile::NpyFile(const std::string& path) : file_(path), header_(header_of(path, file_)) {}

const void* NpyFile::elements(const std::uint64_t first, const std::uint64_t count) {
    const ElementType& type = talcmp::element_type(header_.element_type);
    // The elements lie in the file, so that both products are below its size.
    const unsigned char* const slice = file_.data() + header_.data_offset + first * type.size;
    if (header_.data_offset % type.alignment == 0 && !header_.bytes_swapped) {
        return slice;
    }
    const std::size_t bytes = static_cast<std::size_t>(count) * type.size;
    copy_.resize(bytes / sizeof(std::max_align_t) + 1);
    auto* const copy = reinterpret_cast<unsigned char*>(copy_.data());
    std::memcpy(copy, slice, bytes);
    if (header_.bytes_swapped) {
        reverse_each(copy, bytes, type.part_size);
    }
    return copy;
}

} // namespace talcmp
