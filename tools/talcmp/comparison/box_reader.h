// Reads a box of elements that are not stored in the order wanted, or have gaps between them.

#pragma once

#include "array_source.h"
#include "box_axis.h"

#include <cstdint>
#include <vector>

namespace talcmp {

// Reads the box whose first element is at the position `first` of the source. Throws Trouble.
void read_box(ArraySource& source, std::uint64_t first, std::vector<BoxAxis> axes, void* buffer);

} // namespace talcmp
