// Reads a box of elements that are not stored in the order wanted, or have gaps between them.

#pragma once

#include "array_source.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace talcmp {

// An axis of a box, both in the source and in the buffer that the box is read into.
struct BoxAxis {
    std::size_t extent;
    std::uint64_t stride;    // in positions of the source
    std::size_t slot_stride; // in elements of the buffer
};

// Reads the box whose first element is at the position `first` of the source. Throws Trouble.
void read_box(ArraySource& source, std::uint64_t first, std::vector<BoxAxis> axes, void* buffer);

} // namespace talcmp
