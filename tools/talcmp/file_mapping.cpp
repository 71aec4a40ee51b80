#include "file_mapping.h"

#include "trouble.h"

#include <cerrno>
#include <cstdint>
#include <limits>
#include <system_error>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

namespace talcmp {
namespace {

class Descriptor {
  public:
    explicit Descriptor(const std::string& path)
        // Without O_NONBLOCK the open of a pipe would wait for its writer.
        : number_(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK)) {}
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    ~Descriptor() {
        if (number_ >= 0) {
            ::close(number_);
        }
    }
    int number() const { return number_; }

  private:
    int number_;
};

[[noreturn]] void throw_system_trouble(const std::string& path, const char* what_failed) {
    throw Trouble(path, std::string(what_failed) + ": " + std::generic_category().message(errno));
}

} // namespace

FileMapping::FileMapping(const std::string& path) {
    const Descriptor file(path);
    struct stat status = {};
    if (file.number() < 0 || ::fstat(file.number(), &status) != 0) {
        throw_system_trouble(path, "cannot be opened");
    }
    if (S_ISDIR(status.st_mode)) {
        throw Trouble(path, "is a folder; name a file in it");
    }
    if (!S_ISREG(status.st_mode)) {
        throw Trouble(path, "is not a regular file; save the array to a file first");
    }
    const auto file_size = static_cast<std::uint64_t>(status.st_size);
    if (file_size > std::numeric_limits<std::size_t>::max()) {
        throw Trouble(path, "is larger than this machine's address space");
    }
    if (file_size == 0) {
        return; // nothing to map; an empty mapping is refused by the system
    }
    size_ = static_cast<std::size_t>(file_size);
    void* const address = ::mmap(nullptr, size_, PROT_READ, MAP_PRIVATE, file.number(), 0);
    if (address == MAP_FAILED) {
        throw_system_trouble(path, "cannot be mapped into memory");
    }
    data_ = static_cast<const unsigned char*>(address);
}

FileMapping::~FileMapping() {
    if (data_ != nullptr) {
        ::munmap(const_cast<unsigned char*>(data_), size_);
    }
}

} // namespace talcmp
