#include "shown.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>

namespace talcmp {
namespace {

constexpr char32_t replacement = 0xFFFD;

struct Character {
    char32_t code;
    std::size_t length; // bytes
};

constexpr Character broken = {replacement, 1};

// How a UTF-8 character begins.
struct Lead {
    unsigned char first, last; // bytes
    std::size_t length;
    char32_t smallest; // code that takes so many bytes
};

constexpr Lead leads[] = {{0xC2, 0xDF, 2, 0x80}, {0xE0, 0xEF, 3, 0x800}, {0xF0, 0xF4, 4, 0x10000}};

// The first character of `text`, which is not empty.
Character first_character(const std::string_view text) {
    const auto byte = [text](const std::size_t i) { return static_cast<unsigned char>(text[i]); };
    if (byte(0) < 0x80) {
        return {byte(0), 1};
    }
    const auto* const lead =
        std::find_if(std::begin(leads), std::end(leads), [&](const Lead& each) {
            return each.first <= byte(0) && byte(0) <= each.last;
        });
    if (lead == std::end(leads) || text.size() < lead->length) {
        return broken;
    }
    char32_t code = byte(0) & (0x7FU >> lead->length);
    for (std::size_t i = 1; i < lead->length; ++i) {
        if ((byte(i) & 0xC0U) != 0x80) {
            return broken;
        }
        code = code << 6U | (byte(i) & 0x3FU);
    }
    const bool is_surrogate = 0xD800 <= code && code <= 0xDFFF;
    const bool is_character = lead->smallest <= code && code <= 0x10FFFF && !is_surrogate;
    return is_character ? Character{code, lead->length} : broken;
}

struct Range {
    char32_t first, last;
};

constexpr Range not_shown[] = {
    {0x00, 0x1F},     {0x7F, 0x9F},     // control characters
    {0x61C, 0x61C},   {0x200E, 0x200F}, // marks of the direction of writing
    {0x2028, 0x2029},                   // separators of lines and paragraphs
    {0x202A, 0x202E}, {0x2066, 0x2069}, // overrides of the direction of writing
};

bool is_shown(const char32_t code) {
    return std::none_of(std::begin(not_shown), std::end(not_shown), [code](const Range& range) {
        return range.first <= code && code <= range.last;
    });
}

// Where the character begins that the byte at `position` of a UTF-8 text belongs to.
std::size_t beginning_of_character(const std::string_view text, std::size_t position) {
    while ((static_cast<unsigned char>(text[position]) & 0xC0U) == 0x80) {
        --position;
    }
    return position;
}

} // namespace

std::string without_controls(std::string_view text, const StandIn& stand_in) {
    std::string result;
    while (!text.empty()) {
        const auto [code, length] = first_character(text);
        const bool is_byte = code == replacement && length == 1;
        result += is_shown(code) && !is_byte ? std::string(text.substr(0, length)) : stand_in(code);
        text.remove_prefix(length);
    }
    return result;
}

std::string shown(const std::string_view text) {
    constexpr std::size_t most = 1000; // bytes; members of archives may have names of 65535
    constexpr std::size_t head = 700;
    constexpr std::size_t tail = 250;
    std::string result = text.empty() ? "''" : without_controls(text, [](char32_t) { return "?"; });
    if (result.size() > most) {
        const std::size_t begin = beginning_of_character(result, head);
        const std::size_t end = beginning_of_character(result, result.size() - tail);
        result.replace(begin, end - begin, " [...] ");
    }
    return result;
}

} // namespace talcmp
