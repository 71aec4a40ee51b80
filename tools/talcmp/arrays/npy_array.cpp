#include "npy_array.h"

#include "trouble.h"

#include <algorithm>
#include <cstring>
#include <vector>

namespace talcmp {
namespace {

NpyHeader header_of(const std::string& name, ByteSource& file) {
    try {
        return read_npy_header(file);
    } catch (const NpyError& error) {
        throw Trouble(name, error.what());
    }
}

template <typename Bits, Bits (*reversed)(Bits)>
void reverse_each_as(unsigned char* const parts, const std::size_t bytes) {
    for (std::size_t i = 0; i < bytes; i += sizeof(Bits)) {
        Bits part = 0;
        std::memcpy(&part, parts + i, sizeof part);
        part = reversed(part);
        std::memcpy(parts + i, &part, sizeof part);
    }
}

std::uint16_t reversed16(const std::uint16_t bits) {
    return __builtin_bswap16(bits);
}
std::uint32_t reversed32(const std::uint32_t bits) {
    return __builtin_bswap32(bits);
}
std::uint64_t reversed64(const std::uint64_t bits) {
    return __builtin_bswap64(bits);
}

void reverse_each(unsigned char* const parts, const std::size_t bytes,
                  const std::size_t part_size) {
    static_assert(largest_element_size == 2 * sizeof(std::uint64_t),
                  "there is a case for each size");
    switch (part_size) {
    case sizeof(std::uint16_t):
        return reverse_each_as<std::uint16_t, reversed16>(parts, bytes);
    case sizeof(std::uint32_t):
        return reverse_each_as<std::uint32_t, reversed32>(parts, bytes);
    default:
        return reverse_each_as<std::uint64_t, reversed64>(parts, bytes);
    }
}

} // namespace

NpyArray::NpyArray(std::string name, std::unique_ptr<ByteSource> file)
    : name_(std::move(name)), file_(std::move(file)), header_(header_of(name_, *file_)) {}

void NpyArray::read(const std::uint64_t first, const std::uint64_t count, void* const elements) {
    const std::size_t size = type().size;
    // As many elements as memory holds.
    const std::size_t bytes = static_cast<std::size_t>(count) * size;
    const std::size_t there = file_->read(header_.data_offset + first * size, elements, bytes);
    if (there < bytes) {
        throw Trouble(name_, "ends after " + std::to_string(first + there / size) + " of "
                                 + std::to_string(header_.element_count)
                                 + " elements; is it complete, or is it still being written?");
    }
    if (header_.bytes_swapped) {
        reverse_each(static_cast<unsigned char*>(elements), bytes, type().part_size);
    }
    if (!file_->random_access()) {
        next_ = first + count;
    }
}

void NpyArray::check_to_end() {
    if (file_->random_access()) {
        return; // its size was compared with its header
    }
    std::vector<unsigned char> passed_over(std::size_t{64} * 1024);
    while (next_ < header_.element_count) {
        read(next_,
             std::min<std::uint64_t>(passed_over.size() / type().size,
                                     header_.element_count - next_),
             passed_over.data());
    }
    check_end();
}

void NpyArray::check_end() {
    unsigned char surplus = 0;
    if (file_->read(header_.data_offset + header_.element_count * type().size, &surplus, 1) != 0) {
        throw Trouble(name_, "has more data than its shape says; save one array per file");
    }
}

} // namespace talcmp
