#include "regular_file.h"

#include <fcntl.h>
#include <sys/stat.h>

namespace talcmp {

RegularFile::RegularFile(const std::string& path)
    : path_(path), file_(::open(path.c_str(), O_RDONLY | O_CLOEXEC)) {
    struct stat status = {};
    if (file_.number() < 0 || ::fstat(file_.number(), &status) != 0) {
        throw_system_trouble(path, "cannot be opened");
    }
    if (S_ISDIR(status.st_mode)) {
        throw Trouble(path, "is a folder; name a file in it, or two folders");
    }
    if (!S_ISREG(status.st_mode)) {
        throw Trouble(path, "is neither a file nor a pipe; save the array to a file first");
    }
    size_ = static_cast<std::uint64_t>(status.st_size);
}

std::size_t RegularFile::read(const std::uint64_t offset, void* const bytes,
                              const std::size_t count) {
    return read_at(file_.number(), path_, offset, bytes, count);
}

} // namespace talcmp
