// Pictures as PNG.

#pragma once

#include "drawing.h"

#include <string>

namespace talcmp {

// Throws Trouble, which names the path, and then leaves the file as it was; also if talcmp has been
// built without libpng, as TALCMP_HAS_PNG says.
void write_png(const Drawing& drawing, const std::string& path);

} // namespace talcmp
