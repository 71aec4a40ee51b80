// Which elements of an array share a cell of a map, and where the cell is.

#pragma once

#include "array_source.h"

#include <cstdint>
#include <string>

namespace talcmp {

// The room that a map is made for, in cells.
struct MapRoom {
    std::uint64_t rows = 0;
    std::uint64_t columns = 0;
    std::uint64_t gap = 0;    // between two images
    std::uint64_t fewest = 1; // a side of an image that has to be reduced
    // Whether rows and columns are reduced alike, unless one side is eight times as long as the
    // other.
    bool keep_proportions = false;
};

// The last two axes are an image, of rows and columns; a vector is an image of one row. The indices
// of the axes before them, the outer ones, are numbered in row-major order; each number has an
// image. The images are a grid, filled row by row. Where there are several outer axes longer than
// 1, the last of them goes to the right and the others go down; where there is only one, or where
// that would leave less than half of the best detail, the grid is the one that leaves the best
// detail, and of several such grids the widest of those whose longer side is the shortest.
//
// What does not fit is reduced: a cell stands for `row_bin` x `column_bin` elements of each of
// `image_bin` outer numbers, fewer at the ends. Images are reduced first; only where they would get
// fewer than `fewest` cells a side do consecutive outer numbers share an image.
struct MapLayout {
    // Of an array: 0 where it has no elements.
    std::uint64_t outer = 0;
    std::uint64_t rows = 0;
    std::uint64_t columns = 0;

    std::uint64_t image_bin = 1;
    std::uint64_t row_bin = 1;
    std::uint64_t column_bin = 1;

    std::uint64_t images = 0;
    std::uint64_t grid_rows = 0;
    std::uint64_t grid_columns = 1;
    // Of an image, in cells.
    std::uint64_t cell_rows = 0;
    std::uint64_t cell_columns = 0;
};

MapLayout choose_layout(const Shape& shape, const MapRoom& room);

// Whether cells stand for several elements.
bool is_reduced(const MapLayout& layout);

// "each cell: the worst of 4 x 4 elements", where `cell` is what a cell is called.
std::string reduction_text(const MapLayout& layout, const std::string& cell);

// Which axis goes where: "down: axis 0, right: axis 1".
std::string axes_text(const Shape& shape);

// The outer indices of an image: "[2, 0]", or "[2, 0] to [2, 3]" if it stands for several.
std::string image_text(const Shape& shape, const MapLayout& layout, std::uint64_t image);

} // namespace talcmp
