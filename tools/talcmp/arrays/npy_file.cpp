#include "npy_file.h"

#include "npy_array.h"
#include "regular_file.h"

namespace talcmp {

NpyFile::NpyFile(const std::string& path) : NpyFile(path, std::make_unique<RegularFile>(path)) {}

NpyFile::NpyFile(std::string name, std::unique_ptr<ByteSource> bytes)
    : name_(std::move(name)), bytes_(std::move(bytes)) {}

std::unique_ptr<ArraySource> NpyFile::open(const std::string& /*member*/) {
    return std::make_unique<NpyArray>(name_, std::move(bytes_));
}

} // namespace talcmp
