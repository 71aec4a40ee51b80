// Letters for pictures that are made of pixels.

#pragma once

namespace talcmp {

inline constexpr int glyph_width = 5;
inline constexpr int glyph_height = 9;

// Where the letters of a text begin, one after the other.
inline constexpr int glyph_advance = 6;

// Whether the letter is black in this column, from the left, and row, from the top. Printable
// characters of ASCII have a glyph; all others look like a question mark.
bool glyph_is_black(char character, int column, int row);

} // namespace talcmp
