// Foreign text in messages: in one line, and without characters that a terminal might take for a
// command.

#pragma once

#include <functional>
#include <string>
#include <string_view>

namespace talcmp {

// What a message says instead of a character that is not shown.
using StandIn = std::function<std::string(char32_t)>;

// The text with a stand-in for each control character, each character that begins a line or changes
// the direction of writing, and, as U+FFFD, each byte that belongs to no UTF-8 character. Names of
// files may contain them, and anybody may have written the names of the members of an archive.
std::string without_controls(std::string_view text, const StandIn& stand_in);

// A name or another text in a message, with a question mark for each such character; two quotation
// marks for an empty text. Texts of more than 1000 bytes lose their middle.
std::string shown(std::string_view text);

} // namespace talcmp
