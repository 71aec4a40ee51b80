#include "array_file.h"

#include "npy_file.h"
#include "npz_file.h"
#include "pipe.h"
#include "regular_file.h"

#include <array>
#include <filesystem>
#include <string_view>
#include <system_error>

#include <unistd.h>

namespace talcmp {
namespace {

struct Format {
    std::string_view beginning; // of its files
    std::unique_ptr<ArrayFile> (*open)(const std::string& path);
};

template <typename File>
std::unique_ptr<ArrayFile> open_as(const std::string& path) {
    return std::make_unique<File>(path);
}

// What begins like none of them is read as an .npy file, which says what is wrong with it.
constexpr Format formats[] = {
    {"PK\x03\x04", open_as<NpzFile>},
    {"PK\x05\x06", open_as<NpzFile>}, // without members
    {"", open_as<NpyFile>},
};

std::string beginning_of(const std::string& path) {
    constexpr std::size_t longest = 8;
    std::string bytes(longest, '\0');
    RegularFile file(path);
    bytes.resize(file.read(0, bytes.data(), bytes.size()));
    return bytes;
}

} // namespace

std::unique_ptr<ArrayFile> open_array_file(const std::string& path) {
    if (path == standard_input_path) {
        const std::string name = "standard input";
        return std::make_unique<NpyFile>(name, std::make_unique<Pipe>(name, STDIN_FILENO));
    }
    std::error_code ignored; // opening it tells what is wrong
    if (std::filesystem::is_fifo(path, ignored)) {
        return std::make_unique<NpyFile>(path, std::make_unique<Pipe>(path));
    }
    const std::string bytes = beginning_of(path);
    const Format* format = formats;
    while (bytes.compare(0, format->beginning.size(), format->beginning) != 0) {
        ++format;
    }
    return format->open(path);
}

} // namespace talcmp
