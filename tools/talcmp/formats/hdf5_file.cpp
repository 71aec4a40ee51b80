#include "hdf5_file.h"

#include "hdf5_array.h"

#include <sys/stat.h>

namespace talcmp {
namespace {

using hdf5::checked;
using hdf5::Handle;
using hdf5::LibraryUse;
using hdf5::Member;

// Whether the path still leads to the file; it never has if the file is a temporary copy.
bool leads_to(const std::string& path, const int descriptor) {
    struct stat named = {};
    struct stat opened = {};
    return ::stat(path.c_str(), &named) == 0 && ::fstat(descriptor, &opened) == 0
           && named.st_dev == opened.st_dev && named.st_ino == opened.st_ino;
}

Handle open_file(const RegularFile& file) {
    const std::string& path = file.path();
    const LibraryUse use(path);
    constexpr const char* what_failed = "cannot be opened as an HDF5 file";
    const Handle access(checked(::H5Pcreate(H5P_FILE_ACCESS), path, what_failed));
    // Some file systems have no locks; and what nobody may write needs none.
    checked(::H5Pset_file_locking(access.id(), true, true), path, what_failed);
    std::string found = path; // links to other files start from where the file is
    if (!leads_to(path, file.descriptor())) {
        found = "/proc/self/fd/" + std::to_string(file.descriptor());
        // The usual driver asks for a path without symbolic links.
        checked(::H5Pset_fapl_stdio(access.id()), path, what_failed);
    }
    return Handle(
        checked(::H5Fopen(found.c_str(), H5F_ACC_RDONLY, access.id()), path, what_failed));
}

// Throws Trouble or NotNumbers if the member, called `name`, is no array.
void check_array(const Member& member, const std::string& name) {
    switch (member.kind) {
    case Member::Kind::array:
        return;
    case Member::Kind::element_type:
        throw NotNumbers(name, "is a type of elements, not an array");
    case Member::Kind::lost_link:
        throw NotNumbers(name, "is a link that leads nowhere: " + member.reason);
    case Member::Kind::broken:
        throw Trouble(name, "is broken: " + member.reason + "; is the file damaged?");
    }
}

} // namespace

Hdf5File::Hdf5File(std::unique_ptr<RegularFile> file)
    : path_(file->path()), bytes_(std::move(file)),
      file_(std::make_shared<const Handle>(open_file(*bytes_))),
      members_(hdf5::members_of(file_->id(), path_)) {}

std::vector<std::string> Hdf5File::members() const {
    std::vector<std::string> names;
    names.reserve(members_.size());
    for (const auto& [name, member] : members_) {
        names.push_back(name);
    }
    return names;
}

bool Hdf5File::has(const std::string& member) {
    return members_.count(member) != 0 || hdf5::has_array(file_->id(), root() + member, path_);
}

std::uint64_t Hdf5File::divisible_bytes(const std::string& member) {
    const std::string location = root() + member;
    return hdf5::bytes_of_array(file_->id(), location, path_ + "[" + location + "]");
}

std::unique_ptr<ArraySource> Hdf5File::open(const std::string& member) {
    std::string location = root() + member;
    std::string name = path_ + "[" + location + "]";
    if (const auto listed = members_.find(member); listed != members_.end()) {
        check_array(listed->second, name);
    }
    return std::make_unique<Hdf5Array>(file_, std::move(name), location);
}

} // namespace talcmp
