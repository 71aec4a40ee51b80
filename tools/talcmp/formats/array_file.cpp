#include "array_file.h"

#include "hdf5_signature.h"
#include "netcdf_file.h"
#include "npy_file.h"
#include "npz_file.h"
#include "pipe.h"
#include "regular_file.h"
#include "temporary_file.h"

#include <string_view>

#include <fcntl.h>
#include <sys/stat.h>

#ifdef TALCMP_HAS_HDF5
#    include "hdf5_file.h"
#endif

namespace talcmp {
namespace {

struct Format {
    std::string_view beginning; // of its files
    std::unique_ptr<ArrayFile> (*open)(std::unique_ptr<RegularFile> file);
};

std::unique_ptr<ArrayFile> open_npz(std::unique_ptr<RegularFile> file) {
    return std::make_unique<NpzFile>(std::move(file));
}

std::unique_ptr<ArrayFile> open_netcdf(std::unique_ptr<RegularFile> file) {
    std::string path = file->path();
    return std::make_unique<NetcdfFile>(std::move(path), std::move(file));
}

std::unique_ptr<ArrayFile> open_npy(std::unique_ptr<RegularFile> file) {
    std::string path = file->path();
    return std::make_unique<NpyFile>(std::move(path), std::move(file));
}

std::unique_ptr<ArrayFile> open_hdf5(std::unique_ptr<RegularFile> file) {
#ifdef TALCMP_HAS_HDF5
    return std::make_unique<Hdf5File>(std::move(file));
#else
    throw Trouble(file->path(), "is an HDF5 file, and this talcmp was built without the HDF5 "
                                "library; install one that was built with it");
#endif
}

constexpr Format formats[] = {
    {"PK\x03\x04", open_npz}, // with members
    {"PK\x05\x06", open_npz}, // without members
    {"CDF\x01", open_netcdf}, // with 32-bit offsets
    {"CDF\x02", open_netcdf}, // with 64-bit offsets
    {"CDF\x05", open_netcdf}, // with 64-bit sizes too
    {hdf5_signature, open_hdf5}, {"\x93NUMPY", open_npy}, {"", open_npy},
};

const Format& format_of(const std::string_view beginning) {
    const Format* format = formats;
    while (beginning.substr(0, format->beginning.size()) != format->beginning) {
        ++format;
    }
    return *format;
}

// What no format is, and which program makes one of it.
struct Compression {
    std::string_view beginning;
    const char* name;
    const char* command;
};

constexpr Compression compressions[] = {
    {"\x1F\x8B", "gzip", "gzip -dc"},
    {"BZh", "bzip2", "bzip2 -dc"},
    {std::string_view("\xFD\x37zXZ\0", 6), "xz", "xz -dc"},
    {"\x28\xB5\x2F\xFD", "zstd", "zstd -dc"},
};

// `input` is what the program reads, in the words of a shell.
void refuse_compressed(const std::string& name, const std::string_view beginning,
                       const std::string& input) {
    for (const Compression& each : compressions) {
        if (beginning.substr(0, each.beginning.size()) == each.beginning) {
            throw Trouble(name, std::string("is compressed by ") + each.name
                                    + "; compare what this prints: " + each.command + input
                                    + " | talcmp - OTHER");
        }
    }
}

std::unique_ptr<ArrayFile> open_regular_file(std::unique_ptr<RegularFile> file) {
    refuse_compressed(file->path(), file->beginning(), " '" + file->path() + "'");
    const Format& format = format_of(file->beginning());
    const bool is_unknown = format.beginning.empty();
    if (is_unknown && has_hdf5_after_user_block(*file)) {
        return open_hdf5(std::move(file));
    }
    return format.open(std::move(file));
}

// Formats that are not read from their beginnings to their ends are copied first.
std::unique_ptr<ArrayFile> open_pipe(const std::string& name, Descriptor descriptor) {
    auto pipe = std::make_unique<Pipe>(name, std::move(descriptor));
    refuse_compressed(name, pipe->beginning(), "");
    if (format_of(pipe->beginning()).open == open_npy) {
        return std::make_unique<NpyFile>(name, std::move(pipe));
    }
    TemporaryFile copy;
    std::vector<char> buffer(std::size_t{64} * 1024);
    std::uint64_t size = 0;
    for (std::size_t got = 1; got != 0; size += got) {
        got = pipe->read(size, buffer.data(), buffer.size());
        copy.write(size, buffer.data(), got);
    }
    return open_regular_file(
        std::make_unique<RegularFile>(name, std::move(copy.descriptor()), size));
}

} // namespace

std::vector<std::string_view> format_names() {
    std::vector<std::string_view> names = {".npy", ".npz", "netCDF"};
#ifdef TALCMP_HAS_HDF5
    names.emplace_back("HDF5");
#endif
    return names;
}

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
