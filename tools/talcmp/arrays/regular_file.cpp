#include "regular_file.h"

#include <algorithm>
#include <utility>

namespace talcmp {

RegularFile::RegularFile(std::string path, Descriptor file, const std::uint64_t size)
    : path_(std::move(path)), file_(std::move(file)), size_(size),
      beginning_(static_cast<std::size_t>(std::min<std::uint64_t>(size, 4096)), '\0') {
    beginning_.resize(read_at(file_.number(), path_, 0, beginning_.data(), beginning_.size()));
}

std::size_t RegularFile::read(const std::uint64_t offset, void* const bytes,
                              const std::size_t count) {
    if (offset <= beginning_.size() && count <= beginning_.size() - offset) {
        return beginning_.copy(static_cast<char*>(bytes), count, static_cast<std::size_t>(offset));
    }
    return read_at(file_.number(), path_, offset, bytes, count);
}

} // namespace talcmp
