#include "verdict.h"

#include <cmath>
#include <limits>

namespace talcmp {
namespace {

// Why two parts are the same under no tolerance below all digits.
Reason reason_of_parts(const double part1, const double part2) {
    if (std::isnan(part1) || std::isnan(part2)) {
        return std::isnan(part1) && std::isnan(part2) ? Reason::two_nans : Reason::one_nan;
    }
    if ((part1 == 0) != (part2 == 0)) {
        return Reason::one_zero;
    }
    return (part1 < 0) != (part2 < 0) ? Reason::opposite_signs : Reason::no_digit;
}

template <typename Real>
bool same_below_all_digits(const double part1, const double part2) {
    const auto real1 = static_cast<Real>(part1);
    const auto real2 = static_cast<Real>(part2);
    const ElementType& type = element_type(element_type_id<Real>);
    return Pairs(type, &real1, type, &real2, 1).same(std::numeric_limits<Real>::digits - 1, 0);
}

Verdict verdict_under_all(const Pairs& pairs, const std::size_t i, const Sameness sameness) {
    if (is_integer(pairs.type1()) && is_integer(pairs.type2())) {
        return {sameness, Reason::different_integers};
    }
    const auto parts1 = pairs.type1().parts(pairs.element1(i));
    const auto parts2 = pairs.type2().parts(pairs.element2(i));
    if (!is_complex(pairs.type1()) && !is_complex(pairs.type2())) {
        return {sameness, reason_of_parts(parts1[0], parts2[0])};
    }
    const bool as_singles = all_digits(pairs.type1(), pairs.type2()) < most_digits;
    const bool imaginary = as_singles ? same_below_all_digits<float>(parts1[0], parts2[0])
                                      : same_below_all_digits<double>(parts1[0], parts2[0]);
    return imaginary ? Verdict{sameness, reason_of_parts(parts1[1], parts2[1]), Part::imaginary}
                     : Verdict{sameness, reason_of_parts(parts1[0], parts2[0]), Part::real};
}

} // namespace

Verdict verdict_on(const Pairs& pairs, const std::size_t i, const Sameness sameness) {
    if (sameness.at_zero() && sameness.from_one() > 1) {
        return {sameness, Reason::nans_of_the_same_bits};
    }
    if (sameness.from_one() < all_digits(pairs.type1(), pairs.type2())) {
        return {sameness, Reason::digits};
    }
    return verdict_under_all(pairs, i, sameness);
}

} // namespace talcmp
