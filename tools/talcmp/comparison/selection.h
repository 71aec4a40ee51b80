// The part of an array that is compared, as the command line gives it.

#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace talcmp {

// What is taken of one axis, as in Python: start:stop:step, each of them optional, or one index.
// Negative numbers count from the end.
struct AxisRange {
    std::optional<std::int64_t> start;
    std::optional<std::int64_t> stop;
    std::int64_t step = 1;  // not 0
    bool one_index = false; // `start`; the axis goes away
};

// Ranges for the first axes and for the last ones; those between are taken whole.
struct Selection {
    std::vector<AxisRange> first;
    std::vector<AxisRange> last; // what follows "..."
};

// Reads "0:10,:,3" or "0,...,::-1". Throws std::invalid_argument, whose text says what is wrong.
Selection read_selection(const std::string& text);

} // namespace talcmp
