// Writes HDF5 files.

#pragma once

#include "hdf5_handles.h"

#include <cstddef>
#include <stdexcept>
#include <string>
#include <vector>

namespace hdf5_test {

using talcmp::hdf5::Handle;

// What a call of the library has made.
inline Handle made(const hid_t id) {
    if (id < 0) {
        throw std::logic_error("HDF5: " + talcmp::hdf5::library_reason());
    }
    return Handle(id);
}

inline void done(const herr_t status) {
    if (status < 0) {
        throw std::logic_error("HDF5: " + talcmp::hdf5::library_reason());
    }
}

using Extents = std::vector<hsize_t>;

inline Handle space_of(const Extents& extents) {
    return made(::H5Screate_simple(static_cast<int>(extents.size()), extents.data(), nullptr));
}

// How an array is laid out in the file.
class Layout {
  public:
    Layout() : creation_(made(::H5Pcreate(H5P_DATASET_CREATE))) {}

    static Layout compact() {
        Layout layout;
        done(::H5Pset_layout(layout.id(), H5D_COMPACT));
        return layout;
    }
    static Layout chunked(const Extents& chunk) {
        Layout layout;
        done(::H5Pset_chunk(layout.id(), static_cast<int>(chunk.size()), chunk.data()));
        return layout;
    }

    hid_t id() const { return creation_.id(); }

  private:
    Handle creation_;
};

class Writer {
  public:
    explicit Writer(const std::string& path, const hsize_t user_block = 0) {
        const Handle creation = made(::H5Pcreate(H5P_FILE_CREATE));
        done(::H5Pset_userblock(creation.id(), user_block));
        file_ = made(::H5Fcreate(path.c_str(), H5F_ACC_TRUNC, creation.id(), H5P_DEFAULT));
    }

    hid_t id() const { return file_.id(); }

    void group(const std::string& name) const {
        made(::H5Gcreate2(id(), name.c_str(), H5P_DEFAULT, H5P_DEFAULT, H5P_DEFAULT));
    }

    // Returns the array, which has no elements yet.
    Handle array(const std::string& name, const hid_t type, const Handle& space,
                 const Layout& layout = {}) const {
        return made(::H5Dcreate2(id(), name.c_str(), type, space.id(), H5P_DEFAULT, layout.id(),
                                 H5P_DEFAULT));
    }

    // Writes elements, which are of the type `in_memory`.
    void write(const std::string& name, const hid_t type, const Extents& extents,
               const hid_t in_memory, const void* const elements, const Layout& layout = {}) const {
        const Handle dataset = array(name, type, space_of(extents), layout);
        done(::H5Dwrite(dataset.id(), in_memory, H5S_ALL, H5S_ALL, H5P_DEFAULT, elements));
    }

    void write(const std::string& name, const Extents& extents, const std::vector<int>& elements,
               const Layout& layout = {}) const {
        write(name, H5T_STD_I32LE, extents, H5T_NATIVE_INT, elements.data(), layout);
    }

    void hard_link(const std::string& from, const std::string& to) const {
        done(::H5Lcreate_hard(id(), to.c_str(), id(), from.c_str(), H5P_DEFAULT, H5P_DEFAULT));
    }
    void soft_link(const std::string& from, const std::string& to) const {
        done(::H5Lcreate_soft(to.c_str(), id(), from.c_str(), H5P_DEFAULT, H5P_DEFAULT));
    }
    void external_link(const std::string& from, const std::string& file,
                       const std::string& to) const {
        done(::H5Lcreate_external(file.c_str(), to.c_str(), id(), from.c_str(), H5P_DEFAULT,
                                  H5P_DEFAULT));
    }

    // Marks an array as what netCDF writes for a dimension without values.
    void mark_as_dimension(const std::string& name, const std::string& text) const {
        const Handle type = made(::H5Tcopy(H5T_C_S1));
        done(::H5Tset_size(type.id(), text.size()));
        const Handle space = made(::H5Screate(H5S_SCALAR));
        const Handle attribute =
            made(::H5Acreate_by_name(id(), name.c_str(), "NAME", type.id(), space.id(), H5P_DEFAULT,
                                     H5P_DEFAULT, H5P_DEFAULT));
        done(::H5Awrite(attribute.id(), type.id(), text.data()));
    }

  private:
    Handle file_;
};

} // namespace hdf5_test
