// A number in the fewest digits that read back as the same number.

#pragma once

#include <array>
#include <charconv>
#include <string>

namespace talcmp {

template <typename Number, typename... Base>
std::string number_text(const Number number, const Base... base) {
    std::array<char, 32> buffer = {}; // a double takes 24 characters, a 64-bit integer 20
    const auto end = std::to_chars(buffer.begin(), buffer.end(), number, base...).ptr;
    return {buffer.begin(), end};
}

} // namespace talcmp
