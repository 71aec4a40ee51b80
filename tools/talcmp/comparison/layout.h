// Where the elements of an array are, by their indices.

#pragma once

#include "array_source.h"
#include "selection.h"

#include <cstdint>
#include <vector>

namespace talcmp {

// Where blocks begin along an axis of a view: at `first`, and every `length` indices from there on.
struct BlockGrid {
    std::uint64_t length; // at least 1
    std::uint64_t first;  // below `length`; 0 is not counted as the beginning of another block
};

// Where the selected elements of an array are stored.
struct View {
    std::uint64_t offset = 0;           // position of the first one
    Shape shape;                        // of what is selected
    std::vector<std::uint64_t> strides; // positions from index to index, for each axis of `shape`
    std::vector<BlockGrid> blocks;      // for each axis of `shape`; none if not stored in blocks
};

// What `selection` leaves of an array. A negative step selects what it does in Python, but the
// order stays ascending: the elements of two arrays are paired alike, and places are found in
// row-major order. Throws std::invalid_argument, whose text says why the array has no such part.
View select(const ArraySource& source, const Selection& selection);

// Without the axes of length 1.
View squeezed(const View& view);

// The index of the element that is stored at `position`.
Shape index_of(const Shape& shape, bool fortran_order, std::uint64_t position);

// Numbers the elements of an array from 0 in row-major order, whatever order they are stored in.
class RowMajorNumbers {
  public:
    // For an array that is stored in C order.
    RowMajorNumbers() = default;
    RowMajorNumbers(const Shape& shape, bool fortran_order);

    // The number of the element that is stored at `position`.
    std::uint64_t of(std::uint64_t position) const;

  private:
    struct Axis {
        std::uint64_t extent;
        std::uint64_t stride; // in C order
    };

    std::vector<Axis> axes_; // as they vary in the file, the fastest first; none for C order
};

} // namespace talcmp
