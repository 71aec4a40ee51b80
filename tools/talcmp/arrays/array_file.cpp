#include "array_file.h"

#include "npy_file.h"
#include "npz_file.h"
#include "pipe.h"
#include "regular_file.h"

#include <string_view>

#include <fcntl.h>
#include <sys/stat.h>

namespace talcmp {
namespace {

struct Format {
    std::string_view beginning; // of its files
    std::unique_ptr<ArrayFile> (*open)(std::unique_ptr<RegularFile> file);
};

std::unique_ptr<ArrayFile> open_npz(std::unique_ptr<RegularFile> file) {
    return std::make_unique<NpzFile>(*file);
}

std::unique_ptr<ArrayFile> open_npy(std::unique_ptr<RegularFile> file) {
    std::string path = file->path();
    return std::make_unique<NpyFile>(std::move(path), std::move(file));
}

// A file that begins like none of them is read as an .npy file; that reader says what is wrong.
constexpr Format formats[] = {
    {"PK\x03\x04", open_npz},
    {"PK\x05\x06", open_npz}, // without members
    {"", open_npy},
};

std::unique_ptr<ArrayFile> open_regular_file(std::unique_ptr<RegularFile> file) {
    const Format* format = formats;
    while (file->beginning().substr(0, format->beginning.size()) != format->beginning) {
        ++format;
    }
    return format->open(std::move(file));
}

std::unique_ptr<ArrayFile> open_pipe(const std::string& name, Descriptor pipe) {
    return std::make_unique<NpyFile>(name, std::make_unique<Pipe>(name, std::move(pipe)));
}

} // namespace

std::unique_ptr<ArrayFile> open_array_file(const std::string& path) {
    if (path == standard_input_path) {
        return open_pipe("standard input", Descriptor(STDIN_FILENO));
    }
    Descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
    struct stat status = {};
    if (file.number() < 0 || ::fstat(file.number(), &status) != 0) {
        throw_system_trouble(path, "cannot be opened");
    }
    if (S_ISFIFO(status.st_mode)) {
        return open_pipe(path, std::move(file));
    }
    if (S_ISDIR(status.st_mode)) {
        throw Trouble(path, "is a folder; name a file in it, or two folders");
    }
    if (!S_ISREG(status.st_mode)) {
        throw Trouble(path, "is neither a file nor a pipe; save the array to a file first");
    }
    const auto size = static_cast<std::uint64_t>(status.st_size);
    return open_regular_file(std::make_unique<RegularFile>(path, std::move(file), size));
}

} // namespace talcmp
