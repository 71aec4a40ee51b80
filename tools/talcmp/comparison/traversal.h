// Two arrays of one shape, divided into boxes.

#pragma once

#include "array_source.h"
#include "layout.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace talcmp {

// The two arrays, and the mask that says where they are not compared.
enum class Side { first, second, mask };

// A box of index space, along the axes of a traversal.
struct Box {
    std::vector<std::uint64_t> begin;
    std::vector<std::uint64_t> extent;
    std::size_t count = 0; // of the pairs in it
};

// The pairs of the smallest box, not at an edge, that cuts no block of either view in two.
std::uint64_t smallest_box(const View& first, const View& second);

// All pairs of elements of two views, in boxes. Where both arrays are stored in one order and
// without gaps, a box is a stretch of both; otherwise its extents are chosen so that both are read
// in runs of some length. Boxes take a few MiB at most, unless an array is stored in larger blocks.
class Traversal {
  public:
    // `first` and `second` have one shape, which has elements; so has the mask, if there is one.
    // The mask's blocks may be cut by boxes. Boxes and the pairs in them are in column-major
    // order if both arrays are stored that way, else in row-major order.
    Traversal(const View& first, const View& second, bool column_major, std::size_t element_size,
              const View* mask = nullptr);

    // Whether each array can be read once from its lower positions to its higher ones.
    bool is_linear() const;

    std::uint64_t pair_count() const { return pair_count_; }
    std::uint64_t box_count() const { return box_count_; }

    // The box with the number `index`, from 0.
    Box box(std::uint64_t index) const;

    // The number of the pair `local` of the box in the order of boxes and pairs, row-major or
    // column-major, as if all were in one box.
    std::uint64_t number(const Box& box, std::size_t local) const;

    // The position in the first array of the pair `local` of the box.
    std::uint64_t first_position(const Box& box, std::size_t local) const;

    // Reads the elements of one side, in the order of the box, into `elements`, which has room for
    // `largest_box()` of them.
    void read(Side side, ArraySource& source, const Box& box, void* elements) const;

    // Where these elements are in memory; null if they have to be read.
    const void* in_memory(Side side, const ArraySource& source, const Box& box) const;

    std::size_t largest_box() const { return largest_box_; }

  private:
    struct Axis {
        std::uint64_t extent;
        std::array<std::uint64_t, 3> stride; // of each side, in positions
        std::uint64_t tile;                  // extent of a box that is not at an edge
        std::uint64_t first_tile;            // of the box that begins at 0
    };
    using Views = std::array<const View*, 3>;

    static std::uint64_t boxes_along(const Axis& axis);
    void choose_axes(const Views& views, bool column_major);
    void choose_boxes(std::size_t element_size);
    void lengthen_runs(Side side, std::uint64_t length, std::uint64_t room);
    void add_whole_blocks(std::uint64_t room);
    std::vector<std::size_t> axes_by_stride(Side side) const;
    std::uint64_t position(Side side, const Box& box) const;
    Slab slab(Side side, const Shape& shape, const Box& box) const;

    std::vector<Axis> axes_; // outermost first
    std::array<std::uint64_t, 3> offset_ = {};
    bool in_blocks_; // whether one of them is
    std::uint64_t pair_count_ = 1;
    std::uint64_t box_count_ = 1;
    std::size_t largest_box_ = 1;
};

} // namespace talcmp
