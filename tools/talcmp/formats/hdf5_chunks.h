// Chunks of an HDF5 array that are decompressed without the library, and so by several threads.

#pragma once

#include "array_source.h"
#include "hdf5_handles.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace talcmp::hdf5 {

// Reads chunks that were shuffled, deflated, both or neither, as most are. The library fetches
// their bytes, and has to read whatever is not just as expected here; so it is the library that
// says what is wrong with most damaged chunks.
class Chunks {
  public:
    // None that could be read here.
    Chunks() = default;

    // Those of a chunked dataset whose elements take `element_size` bytes. `name` is what messages
    // call it. Throws Trouble.
    Chunks(hid_t dataset, Shape shape, Shape chunk, std::size_t element_size, std::string name);

    // Reads the elements of the slab as they are in the file, in C order. Returns false, and
    // may leave anything in `elements`, if the library has to read them. Several threads may read
    // at once. Throws Trouble.
    bool read(const Slab& slab, void* elements) const;

  private:
    struct Bytes;

    bool know_filters(hid_t creation);
    bool is_worth_reading(const Slab& slab, std::size_t chunks) const;
    bool are_written(const std::vector<Shape>& chunks) const;
    std::size_t stored_size(const Shape& chunk) const;
    bool fetch(const Shape& chunk, Bytes& bytes) const;
    bool fetch_plain(const Shape& chunk, Bytes& bytes) const;
    bool inflate(Bytes& bytes) const;
    bool has_all_bytes(std::size_t bytes) const;
    void copy(const Shape& chunk, const Slab& slab, const Bytes& bytes,
              unsigned char* elements) const;

    hid_t dataset_ = H5I_INVALID_HID;
    Handle type_; // of its elements
    Shape shape_;
    Shape extents_; // of each chunk; empty if the library has to read all
    std::size_t element_size_ = 0;
    std::size_t size_ = 0; // of each chunk, in bytes
    std::string name_;
    std::uint32_t shuffle_ = 0; // its bit among the filters of a chunk; 0 without it
    std::uint32_t deflate_ = 0;
};

} // namespace talcmp::hdf5
