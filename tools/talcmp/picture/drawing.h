// A picture of where two arrays differ: what is to be drawn, and where, for any kind of file.

#pragma once

#include "difference_map.h"
#include "looks.h"

#include <cstdint>
#include <string>
#include <vector>

namespace talcmp {

// What a picture says about one of the arrays.
struct ArrayCaption {
    std::string name;  // of its file
    std::string type;  // "float64"
    std::string shape; // "(3, 4)", and perhaps which part of it was compared
};

struct PictureCaptions {
    ArrayCaption first;
    ArrayCaption second;
    int all_digits = 53; // 24 where singles are compared
};

// For the map of a picture: it fits with two pixels a cell, so that even the smallest cell of a NaN
// has two colours.
inline constexpr MapRoom room_of_picture = {832, 832, 14, 16, true};

// In pixels, from the top left.
struct Drawing {
    enum class Anchor { start, middle, end };

    static constexpr int largest_side = 2048;
    static constexpr int letter_advance = 12; // at most, in any kind of file
    static constexpr int letter_height = 14;  // of a capital letter

    struct Text {
        int x, y; // of the top of capital letters, and of the end that the anchor names
        Anchor anchor;
        std::string text; // UTF-8
    };
    struct Box {
        int x, y, width, height;
    };
    // Filled with the look of a level.
    struct Sample {
        Box box;
        Level level;
    };

    int width = 0;
    int height = 0;
    std::vector<Text> texts;
    std::vector<Box> lines;      // of ink
    std::vector<Sample> samples; // of the legend
    std::vector<Sample> cells;   // runs of one level along a row of an image
    int nan_square = 1;          // the side of a square of the pattern of NaNs
    int all_digits = 53;
};

// The map has been made for `room_of_picture`.
Drawing draw(const DifferenceMap& map, const PictureCaptions& captions);

} // namespace talcmp
