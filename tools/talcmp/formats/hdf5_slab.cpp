#include "hdf5_slab.h"

#include "hdf5_handles.h"

#include <vector>

namespace talcmp::hdf5 {
namespace {

std::vector<hsize_t> each(const Slab& slab, std::uint64_t Slab::Axis::*const member) {
    std::vector<hsize_t> values;
    for (const Slab::Axis& axis : slab.axes) {
        values.push_back(axis.*member);
    }
    return values;
}

// The elements of the slab among all those of the array.
Handle selection_of(const hid_t dataset, const Slab& slab, const std::string& name) {
    constexpr const char* what_failed = "cannot be read in parts";
    Handle space(checked(::H5Dget_space(dataset), name, what_failed));
    if (!slab.axes.empty()) {
        checked(::H5Sselect_hyperslab(space.id(), H5S_SELECT_SET,
                                      each(slab, &Slab::Axis::begin).data(),
                                      each(slab, &Slab::Axis::step).data(),
                                      each(slab, &Slab::Axis::extent).data(), nullptr),
                name, what_failed);
    }
    return space;
}

Handle space_in_memory(const Slab& slab) {
    const auto extents = each(slab, &Slab::Axis::extent);
    return Handle(::H5Screate_simple(static_cast<int>(extents.size()), extents.data(), nullptr));
}

} // namespace

std::optional<std::string> read_slab(const hid_t dataset, const hid_t type, const Slab& slab,
                                     void* const elements, const std::string& name) {
    const LibraryUse use(name, time_to_read);
    const Handle in_file = selection_of(dataset, slab, name);
    const Handle in_memory = space_in_memory(slab);
    if (::H5Dread(dataset, type, in_memory.id(), in_file.id(), H5P_DEFAULT, elements) < 0) {
        return library_reason(); // which closing the handles would clear
    }
    return std::nullopt;
}

} // namespace talcmp::hdf5
