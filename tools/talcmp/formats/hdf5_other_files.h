// Elements of an HDF5 array that are in other files than the array.

#pragma once

#include <cstdint>
#include <string>

#include <hdf5.h>

namespace talcmp::hdf5 {

// Checks that they are there: the library would take missing ones for zeros, or for a value that
// stands for what nobody wrote. Two arrays of nothing else would be the same. `creation` are the
// properties with which the dataset was made, `bytes` those of all elements, and `name` is what
// messages call it. Throws Trouble.
void check_other_files(hid_t dataset, hid_t creation, std::uint64_t bytes, const std::string& name);

} // namespace talcmp::hdf5
