#include "open_array.h"

#include "npy_file.h"

namespace talcmp {

std::unique_ptr<ArraySource> open_array(const std::string& path) {
    return std::make_unique<NpyFile>(path);
}

} // namespace talcmp
