// What levels look like in a picture, and what they are called.

#pragma once

#include "difference_map.h"

#include <array>
#include <cstdint>
#include <string>

namespace talcmp {

struct Rgb {
    std::uint8_t red, green, blue;
};

// Levels that a reader tells apart without looking closely.
enum class LevelClass { nothing, equal, some_digits, all_digits, more_than_all, nan };

inline constexpr std::array<LevelClass, 6> level_classes = {
    LevelClass::nothing,    LevelClass::equal,         LevelClass::some_digits,
    LevelClass::all_digits, LevelClass::more_than_all, LevelClass::nan};

// `all_digits` is 53, or 24 where singles are compared.
LevelClass class_of_level(Level level, int all_digits);

// The number of digits of a level of the class some_digits.
constexpr int digits_of_level(const Level level) {
    return level - equal_level;
}

// The worse the darker, so that levels are told apart without colour too. NaNs are a pattern of
// squares in their colour and in that of paper.
Rgb colour_of(Level level, int all_digits);

inline constexpr Rgb paper = {255, 255, 255};
inline constexpr Rgb ink = {0, 0, 0};

// "1 to 52 binary digits differ", "a NaN", ...
std::string class_text(LevelClass level_class, int all_digits);

// How many cells are of each class.
using ClassCounts = std::array<std::uint64_t, level_classes.size()>;
ClassCounts class_counts(const DifferenceMap& map, int all_digits);

// "1 cell", "12 cells"; an element where each cell stands for one.
std::string count_text(std::uint64_t count, const std::string& cell);

} // namespace talcmp
