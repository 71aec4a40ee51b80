// What is asked about two arrays.

#pragma once

#include "selection.h"
#include "type_properties.h"

#include <cstddef>

namespace talcmp {

struct Question {
    talreal tolerance = 0;       // binary digits
    bool strict_type = false;    // whether arrays of different element types differ
    Selection selection;         // what is compared of each array
    std::size_t differences = 1; // the most places that are listed
    bool report = false;         // whether all pairs are counted
    bool only_whether = false;   // whether any place will do, in whatever order they are found
    unsigned threads = 0;        // at most; 0 for as many as are worthwhile
};

} // namespace talcmp
