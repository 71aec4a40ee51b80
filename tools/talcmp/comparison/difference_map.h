// Where two arrays differ and by how much, in no more cells than there is room for.

#pragma once

#include "map_layout.h"

#include <array>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace talcmp {

// How much two elements differ, from nothing compared to a NaN; of several the worst is the
// largest.
using Level = std::uint8_t;

inline constexpr Level nothing_compared = 0; // such as elements that are ignored
inline constexpr Level equal_level = 1;
inline constexpr Level most_digits_level = 54;   // 53 binary digits
inline constexpr Level more_than_all_level = 55; // the same under no tolerance
inline constexpr Level nan_level = 56;           // one or both
inline constexpr std::size_t level_count = 57;

// Of numbers that differ in so many binary digits: 0 are equal, and above 53 are more than all.
constexpr Level level_of_digits(const int digits) {
    return digits > most_digits_level - equal_level
               ? more_than_all_level
               : static_cast<Level>(equal_level + (digits < 0 ? 0 : digits));
}

// Divides numbers up to the one it is made for, most of them without a division.
class Divider {
  public:
    Divider() = default;
    Divider(std::uint64_t divisor, std::uint64_t largest_dividend);

    std::uint64_t quotient(const std::uint64_t dividend) const {
        if (divisor_ == 1) {
            return dividend;
        }
        if (!by_reciprocal_) {
            return dividend / divisor_;
        }
        // Both operands have up to 53 digits, and two roundings move their product, below 2^52, by
        // less than 1: it is off by one at most.
        const auto n = static_cast<std::int64_t>(dividend);
        const auto d = static_cast<std::int64_t>(divisor_);
        const auto about = static_cast<std::int64_t>(static_cast<double>(n) * reciprocal_);
        const std::int64_t rest = n - about * d;
        return static_cast<std::uint64_t>(about - (rest < 0 ? 1 : 0) + (rest >= d ? 1 : 0));
    }

  private:
    std::uint64_t divisor_ = 1;
    double reciprocal_ = 1;
    bool by_reciprocal_ = false;
};

// Each cell has the worst level of the elements that it stands for. Several threads may add levels
// at once; what they added is to be read after they have ended.
class DifferenceMap {
  public:
    DifferenceMap(Shape shape, const MapRoom& room);

    const Shape& shape() const { return shape_; }
    const MapLayout& layout() const { return layout_; }

    // Elements have numbers in row-major order; the shape has the number.
    void add(const std::uint64_t number, const Level level) {
        raise(cells_[static_cast<std::size_t>(place_of(number).cell)], level);
    }

    // `count` consecutive elements of one level, which takes a few steps for each cell they are in.
    void add_run(std::uint64_t first, std::uint64_t count, Level level);

    Level level(const std::uint64_t image, const std::uint64_t row,
                const std::uint64_t column) const {
        const std::uint64_t cell = image * cells_of_image_ + row * cell_columns_ + column;
        return cells_[static_cast<std::size_t>(cell)].load(std::memory_order_relaxed);
    }

    // Of all cells, for another map of the same shape and room.
    std::vector<Level> levels() const;
    void add_levels(const std::vector<Level>& levels);

    // How many cells have each level.
    std::array<std::uint64_t, level_count> counts() const;

  private:
    using Cell = std::atomic<Level>;
    static_assert(Cell::is_always_lock_free, "many threads add levels");

    struct Place {
        std::uint64_t outer, row, column; // of the element
        std::uint64_t cell;
    };

    Place place_of(const std::uint64_t number) const {
        const std::uint64_t line = by_columns_.quotient(number);
        const std::uint64_t outer = by_rows_.quotient(line);
        const std::uint64_t row = line - outer * layout_.rows;
        const std::uint64_t column = number - line * layout_.columns;
        return {outer, row, column,
                by_image_bin_.quotient(outer) * cells_of_image_
                    + by_row_bin_.quotient(row) * cell_columns_ + by_column_bin_.quotient(column)};
    }

    static void raise(Cell& cell, const Level level) {
        Level old = cell.load(std::memory_order_relaxed);
        while (old < level && !cell.compare_exchange_weak(old, level, std::memory_order_relaxed)) {
        }
    }

    // How many of the next `count` elements from `place` on fill a row of cells, rows of an image,
    // or images, and the cells that they are in.
    struct Stretch {
        std::uint64_t elements, cells;
    };
    Stretch stretch(const Place& place, std::uint64_t count) const;

    Shape shape_;
    MapLayout layout_;
    std::uint64_t cell_columns_;
    std::uint64_t cells_of_image_;
    Divider by_columns_, by_rows_, by_image_bin_, by_row_bin_, by_column_bin_;
    std::vector<Cell> cells_;
};

} // namespace talcmp
