// Parts of HDF5 arrays, read by the library.

#pragma once

#include "array_source.h"

#include <optional>
#include <string>

#include <hdf5.h>

namespace talcmp::hdf5 {

// Reads the elements of the slab, in C order, as elements of the library's type `type`. Returns
// nothing, or why the library cannot. `name` is what messages call the array. Throws Trouble.
std::optional<std::string> read_slab(hid_t dataset, hid_t type, const Slab& slab, void* elements,
                                     const std::string& name);

} // namespace talcmp::hdf5
