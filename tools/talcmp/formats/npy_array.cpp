#include "npy_array.h"

#include "trouble.h"

#include <algorithm>
#include <vector>

namespace talcmp {
namespace {

NpyHeader header_of(const std::string& name, ByteSource& file) {
    try {
        return read_npy_header(file);
    } catch (const NpyTypeError& error) {
        throw NotNumbers(name, error.what());
    } catch (const NpyError& error) {
        throw Trouble(name, error.what());
    }
}

} // namespace

NpyArray::NpyArray(std::string name, std::unique_ptr<ByteSource> file)
    : name_(std::move(name)), file_(std::move(file)), header_(header_of(name_, *file_)) {}

void NpyArray::read(const std::uint64_t first, const std::uint64_t count, void* const elements) {
    const StoredType& stored = header_.type;
    // As many elements as memory holds.
    const auto in_memory = static_cast<std::size_t>(count);
    const std::size_t bytes = in_memory * stored.size;
    const std::size_t there = file_->read(header_.data_offset + first * stored.size,
                                          room_for_stored(stored, elements, in_memory), bytes);
    if (there < bytes) {
        throw Trouble(name_, "ends after " + std::to_string(first + there / stored.size) + " of "
                                 + std::to_string(header_.element_count)
                                 + " elements; is it complete, or is it still being written?");
    }
    decode(stored, elements, in_memory);
    if (!file_->random_access()) {
        next_ = first + count;
    }
}

void NpyArray::check_to_end() {
    if (file_->random_access()) {
        file_->check_to_end(); // its size was compared with its header
        return;
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
    if (file_->read(header_.data_offset + header_.element_count * header_.type.size, &surplus, 1)
        != 0) {
        throw Trouble(name_, "has more data than its shape says; save one array per file");
    }
}

} // namespace talcmp
