#include "hdf5_other_files.h"

#include "hdf5_handles.h"
#include "hdf5_members.h"
#include "shown.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <set>
#include <utility>
#include <vector>

#include <sys/stat.h>

namespace talcmp::hdf5 {
namespace {

// ---- Raw files, in which the elements are one after another

struct RawFile {
    std::string path;
    std::uint64_t offset = 0; // of the first element in it
    std::uint64_t size = 0;   // of all elements in it
};

RawFile raw_file(const hid_t creation, const unsigned index, const std::string& name) {
    std::vector<char> path(4096);
    off_t offset = 0;
    hsize_t size = 0;
    checked(::H5Pget_external(creation, index, path.size() - 1, path.data(), &offset, &size), name,
            "has an unreadable list of files");
    return {path.data(), static_cast<std::uint64_t>(offset), size};
}

void check_raw_files(const hid_t creation, std::uint64_t bytes, const std::string& name) {
    const int files = ::H5Pget_external_count(creation);
    for (int i = 0; i < files && bytes > 0; ++i) {
        const RawFile file = raw_file(creation, static_cast<unsigned>(i), name);
        const std::uint64_t wanted = std::min(bytes, file.size);
        struct stat status = {};
        // The library complains of files that it does not find.
        if (::stat(file.path.c_str(), &status) == 0
            && static_cast<std::uint64_t>(status.st_size) < file.offset + wanted) {
            throw Trouble(name, "has less data in " + shown(file.path)
                                    + " than its shape says; is that file complete?");
        }
        bytes -= wanted;
    }
}

// ---- Arrays in other files, of which a virtual array is made

using NameOf = ssize_t (*)(hid_t, std::size_t, char*, std::size_t);

std::string name_of(const NameOf get, const hid_t creation, const std::size_t index) {
    const ssize_t length = get(creation, index, nullptr, 0);
    std::string text(static_cast<std::size_t>(std::max<ssize_t>(length, 0)), '\0');
    get(creation, index, text.data(), text.size() + 1);
    return text;
}

// A source: the path of a file, or a dot for the array's own one, and that of an array in it.
using Source = std::pair<std::string, std::string>;

bool is_there(const Source& source, const hid_t own_file, const std::string& folder,
              const std::string& name) {
    const std::string& path = source.first;
    const std::string& array = source.second;
    if (path == ".") {
        return has_array(own_file, array, name);
    }
    // The library tries the path from the current folder too.
    const bool is_absolute = path.find('/') == 0;
    const std::string beside = folder + (is_absolute ? path.substr(path.rfind('/') + 1) : path);
    const auto is_in = [&](const std::string& other_file) {
        const Handle file(::H5Fopen(other_file.c_str(), H5F_ACC_RDONLY, H5P_DEFAULT));
        return file.id() >= 0 && has_array(file.id(), array, name);
    };
    return is_in(path) || is_in(beside);
}

// The folder of the file with its last slash; nothing if that is the current one.
std::string folder_of(const hid_t dataset) {
    const Handle file(::H5Iget_file_id(dataset));
    std::string path(
        static_cast<std::size_t>(std::max<ssize_t>(::H5Fget_name(file.id(), nullptr, 0), 0)), '\0');
    ::H5Fget_name(file.id(), path.data(), path.size() + 1);
    return path.substr(0, path.rfind('/') + 1);
}

std::set<Source> sources_of(const hid_t creation) {
    std::size_t count = 0;
    ::H5Pget_virtual_count(creation, &count);
    std::set<Source> sources;
    for (std::size_t i = 0; i < count; ++i) {
        sources.emplace(name_of(::H5Pget_virtual_filename, creation, i),
                        name_of(::H5Pget_virtual_dsetname, creation, i));
    }
    return sources;
}

void check_sources(const hid_t dataset, const hid_t creation, const std::string& name) {
    // NOLINTNEXTLINE(concurrency-mt-unsafe): nothing here changes the environment.
    if (std::getenv("HDF5_VDS_PREFIX") != nullptr) {
        return; // which may name any number of folders
    }
    const Handle own_file(::H5Iget_file_id(dataset));
    const std::string folder = folder_of(dataset);
    for (const Source& source : sources_of(creation)) {
        const std::string text = source.first + "[" + source.second + "]";
        if (text.find('%') != std::string::npos) {
            continue; // a pattern stands for as many files as there are
        }
        if (!is_there(source, own_file.id(), folder, name)) {
            throw Trouble(name, "is a virtual array that needs " + shown(text)
                                    + ", which is missing or unreadable; put it back");
        }
    }
}

} // namespace

void check_other_files(const hid_t dataset, const hid_t creation, const std::uint64_t bytes,
                       const std::string& name) {
    const LibraryUse use(name);
    if (::H5Pget_layout(creation) == H5D_VIRTUAL) {
        check_sources(dataset, creation, name);
    } else {
        check_raw_files(creation, bytes, name);
    }
}

} // namespace talcmp::hdf5
