// An array of an HDF5 file as a source of elements.

#pragma once

#include "array_source.h"
#include "hdf5_chunks.h"
#include "hdf5_handles.h"
#include "hdf5_type.h"

#include <memory>
#include <string>

namespace talcmp {

// Elements that are stored one after another, as numbers of whole bytes, are read by their
// positions, by several threads at once. All others are read chunk by chunk.
class Hdf5Array : public ArraySource {
  public:
    // `name` is what messages call the array, and `location` where it is in the file, which this
    // keeps open. Throws Trouble; NotNumbers if it is not an array of numbers.
    Hdf5Array(std::shared_ptr<const hdf5::Handle> file, std::string name,
              const std::string& location);

    const ElementType& type() const override { return *type_.stored.type; }
    std::string type_name() const override { return type_.stored.name; }
    const Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return false; }
    bool random_access() const override { return true; }
    void read(std::uint64_t first, std::uint64_t count, void* elements) override;
    const Shape& block() const override { return block_; }
    void read_slab(const Slab& slab, void* elements) override;

  private:
    void find_file();
    void find_elements();
    void find_blocks(hid_t creation);
    void read_by_library(const Slab& slab, void* stored) const;
    void check_size() const;

    std::shared_ptr<const hdf5::Handle> file_;
    std::string name_;
    hdf5::Handle dataset_;
    hdf5::Handle own_file_; // another one than `file_` if an external link leads to it
    hdf5::DatasetType type_;
    Shape shape_;
    int descriptor_ = -1;    // of its own file, if the library reads that by one
    std::uint64_t size_ = 0; // of that file when it was opened, in bytes
    bool is_contiguous_ = false;
    std::uint64_t offset_ = 0; // of the elements in that file, if they are contiguous
    Shape block_;              // empty if they are
    hdf5::Chunks chunks_;
};

} // namespace talcmp
