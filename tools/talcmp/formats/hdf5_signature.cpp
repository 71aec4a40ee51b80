#include "hdf5_signature.h"

#include <array>

namespace talcmp {
namespace {

bool has_signature_at(const std::uint64_t offset, RegularFile& file) {
    std::array<char, hdf5_signature.size()> bytes = {};
    return file.read(offset, bytes.data(), bytes.size()) == bytes.size()
           && std::string_view(bytes.data(), bytes.size()) == hdf5_signature;
}

} // namespace

bool has_hdf5_after_user_block(RegularFile& file) {
    constexpr std::uint64_t smallest_user_block = 512;
    const std::uint64_t size = file.size().value_or(0);
    bool found = false;
    for (std::uint64_t offset = smallest_user_block; !found && offset < size; offset *= 2) {
        found = has_signature_at(offset, file);
    }
    return found;
}

} // namespace talcmp
