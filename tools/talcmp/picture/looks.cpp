#include "looks.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <iterator>

namespace talcmp {
namespace {

// From one digit to one less than all: of evenly falling lightness, and told apart by people who
// see fewer colours.
constexpr Rgb ramp[] = {
    {235, 200, 70}, {140, 180, 80}, {60, 145, 120}, {45, 100, 150}, {60, 50, 125}};
constexpr Rgb equal_colour = {235, 235, 235};
constexpr Rgb all_digits_colour = {30, 25, 70};
constexpr Rgb nan_colour = {180, 0, 90};

// Between the two, a `part` of 1 on the way.
Rgb mixed(const Rgb first, const Rgb second, const double part) {
    const auto channel = [part](const int from, const int to) {
        return static_cast<std::uint8_t>(std::lround(from + part * (to - from)));
    };
    return {channel(first.red, second.red), channel(first.green, second.green),
            channel(first.blue, second.blue)};
}

Rgb ramp_colour(const double part) {
    const double place = part * static_cast<double>(std::size(ramp) - 1);
    const auto before = std::min(static_cast<std::size_t>(place), std::size(ramp) - 2);
    return mixed(ramp[before], ramp[before + 1], place - static_cast<double>(before));
}

} // namespace

LevelClass class_of_level(const Level level, const int all_digits) {
    switch (level) {
    case nothing_compared:
        return LevelClass::nothing;
    case equal_level:
        return LevelClass::equal;
    case more_than_all_level:
        return LevelClass::more_than_all;
    case nan_level:
        return LevelClass::nan;
    default:
        return digits_of_level(level) < all_digits ? LevelClass::some_digits
                                                   : LevelClass::all_digits;
    }
}

Rgb colour_of(const Level level, const int all_digits) {
    switch (class_of_level(level, all_digits)) {
    case LevelClass::nothing:
        return paper;
    case LevelClass::equal:
        return equal_colour;
    case LevelClass::all_digits:
        return all_digits_colour;
    case LevelClass::more_than_all:
        return ink;
    case LevelClass::nan:
        return nan_colour;
    default:
        return ramp_colour((digits_of_level(level) - 1.0) / (all_digits - 2.0));
    }
}

std::string class_text(const LevelClass level_class, const int all_digits) {
    switch (level_class) {
    case LevelClass::nothing:
        return "not compared";
    case LevelClass::equal:
        return "equal";
    case LevelClass::some_digits:
        return "1 to " + std::to_string(all_digits - 1) + " binary digits differ";
    case LevelClass::all_digits:
        return "no digit in common";
    case LevelClass::more_than_all:
        return "the same under no tolerance";
    default:
        return "a NaN";
    }
}

ClassCounts class_counts(const DifferenceMap& map, const int all_digits) {
    ClassCounts counts = {};
    const auto of_levels = map.counts();
    for (std::size_t level = 0; level < of_levels.size(); ++level) {
        const LevelClass level_class = class_of_level(static_cast<Level>(level), all_digits);
        counts.at(static_cast<std::size_t>(level_class)) += of_levels[level];
    }
    return counts;
}

std::string count_text(const std::uint64_t count, const std::string& cell) {
    return std::to_string(count) + " " + cell + (count == 1 ? "" : "s");
}

} // namespace talcmp
