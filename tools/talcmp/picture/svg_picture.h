// Pictures as SVG.

#pragma once

#include "drawing.h"

#include <string>

namespace talcmp {

std::string svg_text(const Drawing& drawing);

// Throws Trouble, which names the path, and then leaves the file as it was.
void write_svg(const Drawing& drawing, const std::string& path);

} // namespace talcmp
