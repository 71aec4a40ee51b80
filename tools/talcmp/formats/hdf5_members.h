// What is in the groups of an HDF5 file.

#pragma once

#include "hdf5_handles.h"

#include <map>
#include <string>

namespace talcmp::hdf5 {

struct Member {
    enum class Kind { array, element_type, lost_link, broken };
    Kind kind = Kind::array;
    std::string reason; // why the link is lost or the member broken, in the words of the library
};

// All members by their names: the paths from the root, without the first slash. See Hdf5File for
// which names there are. Dimensions of netCDF without values are left out. Throws Trouble, which
// calls the file `path`.
std::map<std::string, Member> members_of(hid_t file, const std::string& path);

// Whether the path leads from the group to an array, whatever it goes through. Messages call the
// file `name`.
bool has_array(hid_t group, const std::string& path, const std::string& name);

// The bytes of the elements of the array at the path; 0 if there is no such array. Messages call
// the array `name`.
std::uint64_t bytes_of_array(hid_t group, const std::string& path, const std::string& name);

} // namespace talcmp::hdf5
