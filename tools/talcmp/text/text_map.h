// Where two arrays differ, drawn in the characters of a terminal.

#pragma once

#include "difference_map.h"
#include "terminal.h"

#include <string>

namespace talcmp {

enum class CharacterSet { ascii, utf8 };

// As the environment variables LC_ALL, LC_CTYPE and LANG say.
CharacterSet character_set_of_environment();

// For the map of a text with lines of up to `columns` characters: 16 lines of cells.
MapRoom room_of_text(const Shape& shape, int columns);

// Lines of cells with their indices, and what the characters mean. The map has been made for
// `room_of_text`; `all_digits` is 53, or 24 where singles are compared.
std::string text_map(const DifferenceMap& map, int all_digits, CharacterSet characters,
                     const Terminal& terminal);

} // namespace talcmp
