// A comparison as a picture in a file.

#pragma once

#include "comparison.h"

#include <string>

namespace talcmp {

// Whether the name of a file says that it is a picture: it ends in .png or .svg.
bool is_picture(const std::string& path);

// Draws a map that was made for `room_of_picture`. Throws Trouble, which names the path, and then
// leaves the file as it was.
void write_picture(const Comparison& comparison, const DifferenceMap& map, const std::string& path);

} // namespace talcmp
