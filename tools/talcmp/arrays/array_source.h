// Where talcmp gets the elements of an array from.

#pragma once

#include "byte_source.h"
#include "element_type.h"

#include <algorithm>
#include <cassert>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <numeric>
#include <string>
#include <vector>

namespace talcmp {

// The dimensions of an array, outermost first; a file may have larger ones than a record holds.
using Shape = std::vector<std::uint64_t>;

inline bool has_elements(const Shape& shape) {
    return std::find(shape.begin(), shape.end(), 0U) == shape.end();
}

// A part of an array in C order: on each axis `extent` indices from `begin`, `step` apart.
struct Slab {
    struct Axis {
        std::uint64_t begin = 0;
        std::uint64_t extent = 1;
        std::uint64_t step = 1;
    };
    std::vector<Axis> axes; // one for each dimension, the outermost first
};

// An array that is read piece by piece. Its elements have positions, 0 to the product of its shape
// - 1, in the order in which they are stored.
class ArraySource {
  public:
    ArraySource() = default;
    ArraySource(const ArraySource&) = delete;
    ArraySource& operator=(const ArraySource&) = delete;
    virtual ~ArraySource() = default;

    virtual const ElementType& type() const = 0;

    // The name of the type as which the elements are stored; they may be compared as another one.
    virtual std::string type_name() const { return type().name; }

    virtual const Shape& shape() const = 0;

    // Whether the first index varies fastest from position to position, as in Fortran; otherwise
    // the last index does, as in C.
    virtual bool fortran_order() const = 0;

    // Whether elements may be read in any order, by several threads at once. Otherwise `first` may
    // never be below what has been read, and only one thread reads.
    virtual bool random_access() const = 0;

    // Reads the elements at the positions `first` to `first + count - 1`, which the array has, to
    // `elements`. Throws Trouble.
    virtual void read(std::uint64_t first, std::uint64_t count, void* elements) = 0;

    // All elements by their positions, aligned, if they are in memory and need not be read.
    virtual const void* in_memory() const { return nullptr; }

    // The extents of the blocks, one after another from index 0, that are best read whole, such as
    // compressed chunks; empty if elements can be read by their positions. An array in blocks is
    // in C order, may be read in any order, and is read by `read_slab` alone.
    virtual const Shape& block() const {
        static const Shape none;
        return none;
    }

    // Whether a part of a block takes as long to read as all of it.
    virtual bool has_whole_blocks() const { return !block().empty(); }

    // Reads the elements of a slab, in C order, to `elements`. Throws Trouble.
    virtual void read_slab(const Slab& /*slab*/, void* /*elements*/) { assert(!"not in blocks"); }

    // Reads the rest if only the end shows whether what was read is right. No answer can be trusted
    // until this has returned. Throws Trouble.
    virtual void check_to_end() {}

    // The sums of bytes that were read, for `check_to_end` of a source of the same array in another
    // process; see ByteSource.
    virtual std::vector<SummedPart> summed_parts() const { return {}; }
    virtual void add_summed_parts(const std::vector<SummedPart>& /*parts*/) {}
};

// The number of elements: the product of the shape, which was checked to be below 2^64.
inline std::uint64_t element_count(const ArraySource& source) {
    const Shape& shape = source.shape();
    if (!has_elements(shape)) {
        return 0; // the product of the others may be larger
    }
    return std::accumulate(shape.begin(), shape.end(), std::uint64_t{1}, std::multiplies<>());
}

} // namespace talcmp
