// Groups of pairs of elements: the module has to be asked about only one pair of each.

#pragma once

#include "pairs.h"

#include <cstdint>
#include <vector>

namespace talcmp {

// Sorts pairs by the two powers of two that |x - y| / max(|x|, |y|) is between, for |x - y| as it
// is computed.
//
// A whole tolerance compares that quotient with a power of two. So all pairs whose quotients are
// strictly between the same two neighbouring powers are the same under the same whole tolerances
// from 1 on. The module is asked about each pair whose quotient is a power of two, whose difference
// is below the normal numbers, or that has a NaN or an infinity. The groups only say which pairs
// are alike; the answers are the module's.
class DigitGroups {
  public:
    using Group = std::uint8_t;

    // Pairs of equal values, with the same signs.
    static constexpr Group equal = 0;
    // Pairs of equal values, some of them zeros of different signs.
    static constexpr Group equal_except_signs_of_zeros = 1;
    // Between, in ascending order, the pairs whose quotients are between two powers of two.
    static constexpr Group smallest_quotient = 2;
    static constexpr Group largest_quotient = smallest_quotient + 54;
    static constexpr Group doubtful = largest_quotient + 1;
    // Pairs of zero and another number, or of a negative number and another one.
    static constexpr Group unlike = doubtful + 1;
    static constexpr int count = unlike + 1;

    // Writes the group of each pair to `groups`; for a pair of complex numbers, the later of the
    // groups of its parts. Returns false, and writes nothing, if both types are integers.
    bool sort(const Pairs& pairs, Group* groups);

  private:
    template <typename Real>
    void sort_as(const Pairs& pairs, Group* groups);

    std::vector<Group> groups_of_part_;
    std::vector<double> parts1_; // also as singles
    std::vector<double> parts2_;
};

} // namespace talcmp
