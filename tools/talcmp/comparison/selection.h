// The part of an array that is compared.

#ifndef TALCMP_SELECTION_H
#define TALCMP_SELECTION_H

#include "array_source.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace talcmp {

// What is taken of one axis, as in Python: start:stop:step, of which each may be missing, or one
// index. Negative numbers count from the end.
struct AxisRange {
    std::optional<std::int64_t> start;
    std::optional<std::int64_t> stop;
    std::int64_t step = 1;
    bool one_index = false; // `start`; the axis goes away
};

// For the first axes of an array; the others are taken whole.
using Selection = std::vector<AxisRange>;

// Reads "0:10,:,3". Throws std::invalid_argument, which says what is wrong.
Selection read_selection(const std::string& text);

// Where the selected elements of an array lie.
struct View {
    std::uint64_t offset = 0;           // position of the first one
    Shape shape;                        // of what is selected
    std::vector<std::uint64_t> strides; // positions from index to index, for each axis of `shape`
};

// Throws std::invalid_argument, which says why the array has no such part.
View select(const ArraySource& source, const Selection& selection);

// The index of the element that is stored at `position`.
Shape index_of(const Shape& shape, bool fortran_order, std::uint64_t position);

// Places in an array are ordered by the positions that their elements would have in C order.
class RowMajorOrder {
  public:
    // Of an array that is stored in C order.
    RowMajorOrder() = default;
    explicit RowMajorOrder(const ArraySource& source);

    // Of the element that is stored at `position`.
    std::uint64_t of(std::uint64_t position) const;

  private:
    struct Axis {
        std::uint64_t extent;
        std::uint64_t stride; // in C order
    };

    std::vector<Axis> axes_; // as they vary in the file, the fastest first; none for C order
};

} // namespace talcmp

#endif
