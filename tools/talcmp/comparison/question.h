// What is asked about two arrays.

#pragma once

#include "map_layout.h"
#include "selection.h"
#include "type_properties.h"

#include <cstddef>
#include <functional>
#include <optional>
#include <vector>

namespace talcmp {

// The most that a question may ask for.
inline constexpr std::size_t most_differences = 1000000; // each thread holds so many in memory
inline constexpr unsigned most_threads = 64;

constexpr bool is_relative_error(const double error) {
    return 0 < error && error < 1;
}

// At most 1e300, so that no sum of it and a difference overflows.
constexpr bool is_absolute_error(const double error) {
    return 0 <= error && error <= 1e300;
}

struct Question {
    talreal tolerance = 0;          // binary digits
    std::optional<double> relative; // the tolerance as an error instead
    std::optional<double> absolute; // the error up to which elements are the same
    bool equal_nan = false;         // whether a NaN is the same as a NaN
    bool strict_type = false;       // whether arrays of different element types differ
    Selection selection;            // what is compared of each array
    bool squeeze = false;           // whether axes of length 1 are left out of shapes
    std::size_t differences = 1;    // the most places that are listed
    bool report = false;            // whether all pairs are counted
    // The rooms of maps of where arrays of a shape differ, which are made with a report.
    std::vector<std::function<MapRoom(const Shape&)>> maps;
    bool only_whether = false; // whether any place will do, in whatever order they are found
    unsigned threads = 0;      // at most; 0 for as many as are worthwhile
};

} // namespace talcmp
