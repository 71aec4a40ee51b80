// How many binary digits the elements of pairs differ in.

#pragma once

#include "digit_groups.h"
#include "pairs.h"
#include "question.h"

#include <array>
#include <cstdint>
#include <vector>

namespace talcmp {

// The largest whole tolerance that matters: all above it answer alike.
inline constexpr int most_digits = 53;

// Stands for the digits of a pair that is the same under no tolerance.
inline constexpr int more_than_all_digits = most_digits + 1;

// How many pairs differ in 0, 1, ... 53 digits, and in more than all.
using DigitCounts = std::array<std::uint64_t, more_than_all_digits + 1>;

// The binary digits of the type of real in which two elements are compared. A tolerance of all
// digits takes any two numbers of one sign for the same, and NaNs too: it says nothing about the
// pair.
int all_digits(const ElementType& type1, const ElementType& type2);

// The tolerance, in binary digits, under which two elements are compared.
talreal tolerance_for(const Question& question, const ElementType& type1, const ElementType& type2);

// Under which whole tolerances a pair is the same: perhaps under 0, and from some tolerance
// upwards. NaNs of the same bits are the same under 0, and yet not under 1.
class Sameness {
  public:
    Sameness() = default;
    constexpr Sameness(const bool at_zero, const int from_one)
        : at_zero_(at_zero), from_one_(static_cast<std::uint8_t>(from_one)) {}

    constexpr bool at_zero() const { return at_zero_; }

    // The smallest whole tolerance from 1 upwards; `more_than_all_digits` if there is none.
    constexpr int from_one() const { return from_one_; }

    constexpr int digits() const { return at_zero_ ? 0 : from_one_; }

    constexpr bool operator==(const Sameness other) const {
        return at_zero_ == other.at_zero_ && from_one_ == other.from_one_;
    }

  private:
    bool at_zero_ = false;
    std::uint8_t from_one_ = 0;
};

// The sameness of a pair that is the same under every tolerance.
inline constexpr Sameness same_under_all(true, 1);

// Asks the module about one pair.
Sameness sameness_of(const Pairs& pairs, std::size_t i);

// Asks the module about many pairs in few questions.
class DigitSearch {
  public:
    // Stands for pairs of one sameness.
    using Class = std::uint8_t;
    static constexpr std::size_t class_count = 256;

    struct Result {
        std::vector<Class> class_of;                       // each pair
        std::array<Sameness, class_count> sameness_of;     // the pairs of each class
        std::array<std::uint64_t, class_count> count = {}; // of the pairs of each class
    };

    DigitSearch();

    // Valid until the next call.
    const Result& search(const Pairs& pairs);

  private:
    void count_groups();
    void ask_about_groups(const Pairs& pairs);
    void ask_about_stretch(const Pairs& pairs, std::size_t begin, std::size_t count);
    void ask_about(const Pairs& pairs, std::size_t i);

    Result result_;
    DigitGroups groups_;
};

// The sameness of the pair `i` of those searched.
inline Sameness sameness_of(const DigitSearch::Result& found, const std::size_t i) {
    return found.sameness_of[found.class_of[i]];
}

} // namespace talcmp
