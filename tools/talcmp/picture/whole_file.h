// Files that are written as a whole or not at all.

#pragma once

#include <string>
#include <string_view>

namespace talcmp {

// Replaces the file, or what a link with this name leads to. The bytes go to a new file beside it
// first, which then takes its name. What is there and is no file on disk, such as a terminal or a
// pipe, is written to. Throws Trouble if that fails, and then leaves no new file behind.
void write_whole_file(const std::string& path, std::string_view bytes);

} // namespace talcmp
