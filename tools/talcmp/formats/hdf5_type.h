// The element types of HDF5 that talcmp reads.

#pragma once

#include "hdf5_handles.h"
#include "stored_type.h"

#include <string>

namespace talcmp::hdf5 {

struct DatasetType {
    StoredType stored;      // how elements are in memory before they are decoded
    Handle memory;          // the library's name for that
    bool as_in_file = true; // whether they are so in the file too
};

// The type of the elements of `dataset`. Throws Trouble, which calls it `name`; NotNumbers if
// talcmp does not compare such elements.
DatasetType type_of(hid_t dataset, const std::string& name);

} // namespace talcmp::hdf5
