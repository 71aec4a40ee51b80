// An HDF5 file, which has arrays in groups. Files of netCDF-4 are such files too.

#pragma once

#include "array_file.h"
#include "hdf5_members.h"
#include "regular_file.h"

#include <map>

namespace talcmp {

// Each array has the name of the path from the root to it, without the first slash. What is in
// several groups by hard links has the name under which it is found first: groups are searched in
// the order of their names, and before all other links are followed. These, symbolic and external,
// give what they lead to further names; but a group is not entered from within itself. Any other
// path to an array is a name that is not listed.
class Hdf5File : public ArrayFile {
  public:
    // Throws Trouble when the file is broken.
    explicit Hdf5File(std::unique_ptr<RegularFile> file);

    bool is_archive() const override { return true; }
    const char* root() const override { return "/"; }
    std::vector<std::string> members() const override;
    bool has(const std::string& member) override;
    std::uint64_t divisible_bytes(const std::string& member) override;
    std::unique_ptr<ArraySource> open(const std::string& member) override;

  private:
    std::string path_;
    std::unique_ptr<RegularFile> bytes_; // kept open, as the library may have no other name of it
    std::shared_ptr<const hdf5::Handle> file_; // each opened array keeps it open
    std::map<std::string, hdf5::Member> members_;
};

} // namespace talcmp
