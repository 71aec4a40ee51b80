#include "digit_groups.h"

#include "element_parts.h"
#include "widest_vectors.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>
#include <limits>
#include <type_traits>

namespace talcmp {
namespace {

using Group = DigitGroups::Group;

// ---- The group of one pair of reals

template <typename Real>
using BitsOf = std::conditional_t<sizeof(Real) == 4, std::uint32_t, std::uint64_t>;

template <typename Real>
[[gnu::always_inline]] inline BitsOf<Real> bits_of(const Real value) {
    BitsOf<Real> bits = 0;
    std::memcpy(&bits, &value, sizeof bits);
    return bits;
}

// Without branches, so that compilers make vector instructions of it. The bits of two positive
// normal numbers are ordered as the numbers are. Their difference has, above those of the
// significand, the exponent of the power of two that is not above the quotient: one is borrowed if
// the first significand is the smaller one. It has zeros below if the significands are equal, so
// that the quotient is a power of two. A difference below the normal numbers has another form.
template <typename Real>
[[gnu::always_inline]] inline BitsOf<Real> group_of(const Real x, const Real y) {
    using Bits = BitsOf<Real>;
    using Limits = std::numeric_limits<Real>;
    constexpr int significand_bits = Limits::digits - 1;
    constexpr Bits significand = (Bits{1} << significand_bits) - 1;
    // A quotient of a half or more, which is below 1, is in the largest group.
    constexpr Bits largest = Bits{DigitGroups::largest_quotient + 1} << significand_bits;
    const Real magnitude1 = std::fabs(x);
    const Real magnitude2 = std::fabs(y);
    const Real larger = magnitude1 < magnitude2 ? magnitude2 : magnitude1;
    const Real difference = std::fabs(x - y);
    const Bits quotient = bits_of(difference) - bits_of(larger) + largest;
    const Bits two_signs = (bits_of(x) ^ bits_of(y)) >> (8 * sizeof(Real) - 1);
    const bool is_clear =
        (difference >= Limits::min()) & (difference < larger) & ((quotient & significand) != 0);
    const Bits group = is_clear ? quotient >> significand_bits : Bits{DigitGroups::doubtful};
    return x == y ? two_signs : group;
}

// Takes those for unlike that are so. They are among the doubtful ones: their difference is not
// smaller than the larger number.
template <typename Real>
void sort_doubtful(const Real* const x, const Real* const y, const std::size_t count,
                   Group* const groups) {
    const auto is_unlike = [](const Real one, const Real other) {
        return (one < 0) != (other < 0) || one == 0 || other == 0;
    };
    const auto next = [&](const std::size_t begin) {
        const void* const found = std::memchr(groups + begin, DigitGroups::doubtful, count - begin);
        return found == nullptr
                   ? count
                   : static_cast<std::size_t>(static_cast<const Group*>(found) - groups);
    };
    for (std::size_t i = next(0); i < count; i = next(i + 1)) {
        if (is_unlike(x[i], y[i])) {
            groups[i] = DigitGroups::unlike;
        }
    }
}

static_assert(DigitGroups::equal == 0 && DigitGroups::equal_except_signs_of_zeros == 1);

// Several times as fast as with the instructions that every x86-64 processor has.
struct SortParts {
    template <typename Real>
    [[gnu::always_inline]] void operator()(const Real* const x, const Real* const y,
                                           const std::size_t count, Group* const groups) const {
        // Some at a time as numbers as wide as the reals, and only then as bytes: in one loop,
        // compilers run out of registers.
        constexpr std::size_t at_once = 128;
        std::array<BitsOf<Real>, at_once> wide = {};
        std::size_t begin = 0;
        for (; begin + at_once <= count; begin += at_once) {
            for (std::size_t i = 0; i < at_once; ++i) {
                wide[i] = group_of(x[begin + i], y[begin + i]);
            }
            for (std::size_t i = 0; i < at_once; ++i) {
                groups[begin + i] = static_cast<Group>(wide[i]);
            }
        }
        for (; begin < count; ++begin) {
            groups[begin] = static_cast<Group>(group_of(x[begin], y[begin]));
        }
    }
};

bool is_double(const ElementType& type) {
    return !is_integer(type) && type.part_size == sizeof(double);
}

} // namespace

template <typename Real>
void DigitGroups::sort_as(const Pairs& pairs, Group* const groups) {
    const bool complex = is_complex(pairs.type1()) || is_complex(pairs.type2());
    const auto sort_part = [&](const int part, Group* const groups_of_part) {
        const Real* const x =
            parts_of<Real>(pairs.type1(), pairs.element1(0), pairs.count(), part, parts1_);
        const Real* const y =
            parts_of<Real>(pairs.type2(), pairs.element2(0), pairs.count(), part, parts2_);
        in_widest_vectors(SortParts(), x, y, pairs.count(), groups_of_part);
        sort_doubtful(x, y, pairs.count(), groups_of_part);
    };
    sort_part(0, groups);
    if (complex) {
        groups_of_part_.resize(pairs.count());
        sort_part(1, groups_of_part_.data());
        for (std::size_t i = 0; i < pairs.count(); ++i) {
            groups[i] = std::max(groups[i], groups_of_part_[i]);
        }
    }
}

bool DigitGroups::sort(const Pairs& pairs, Group* const groups) {
    if (is_integer(pairs.type1()) && is_integer(pairs.type2())) {
        return false;
    }
    if (is_double(pairs.type1()) || is_double(pairs.type2())) {
        sort_as<double>(pairs, groups);
    } else {
        sort_as<float>(pairs, groups);
    }
    return true;
}

} // namespace talcmp
