#include "difference_text.h"

#include "digits.h"
#include "element_type.h"

#include <cmath>
#include <cstddef>
#include <limits>

namespace talcmp {
namespace {

std::string joined(const Shape& numbers) {
    std::string text;
    for (const std::uint64_t number : numbers) {
        text += (text.empty() ? "" : ", ") + std::to_string(number);
    }
    return text;
}

// Where the types differ a single is written as a double, or 0.1 in singles and 0.1 in doubles
// would look alike.
std::string value_text(const Comparison& comparison, const type_t type, const void* const element) {
    const bool as_doubles = comparison.array1.type != comparison.array2.type;
    return element_type(type).text(element, as_doubles);
}

// ---- Why two values are not the same under any tolerance that says anything of them

std::string reason_of_parts(const double part1, const double part2) {
    if (std::isnan(part1) || std::isnan(part2)) {
        return std::isnan(part1) && std::isnan(part2) ? "two NaNs" : "a NaN";
    }
    if ((part1 == 0) != (part2 == 0)) {
        return "zero is the same only as zero";
    }
    if ((part1 < 0) != (part2 < 0)) {
        return "opposite signs";
    }
    return "no digit in common";
}

template <typename Real>
bool are_apart(const double part1, const double part2) {
    const auto real1 = static_cast<Real>(part1);
    const auto real2 = static_cast<Real>(part2);
    const type_t type = element_type_id<Real>;
    return sameness_of(Pairs(type, &real1, type, &real2, 1), 0).from_one()
           >= std::numeric_limits<Real>::digits;
}

std::string reason_under_all(const ElementType& type1, const ElementType& type2,
                             const Place& place) {
    if (is_integer(type1) && is_integer(type2)) {
        return "different integers";
    }
    const auto parts1 = type1.parts(place.element1.data());
    const auto parts2 = type2.parts(place.element2.data());
    if (!is_complex(type1) && !is_complex(type2)) {
        return reason_of_parts(parts1[0], parts2[0]);
    }
    const bool as_singles = all_digits(type1, type2) < most_digits;
    const bool real = as_singles ? are_apart<float>(parts1[0], parts2[0])
                                 : are_apart<double>(parts1[0], parts2[0]);
    const std::size_t part = real ? 0 : 1;
    return (real ? "real parts: " : "imaginary parts: ")
           + reason_of_parts(parts1[part], parts2[part]);
}

} // namespace

std::string shape_text(const Shape& shape) {
    return "(" + joined(shape) + (shape.size() == 1 ? ",)" : ")");
}

std::string index_text(const Comparison& comparison, const Place& place) {
    return "["
           + joined(
               index_of(comparison.array1.shape, comparison.array1.fortran_order, place.position))
           + "]";
}

std::string first_value_text(const Comparison& comparison, const Place& place) {
    return value_text(comparison, comparison.array1.type, place.element1.data());
}

std::string second_value_text(const Comparison& comparison, const Place& place) {
    return value_text(comparison, comparison.array2.type, place.element2.data());
}

std::string reason_text(const Comparison& comparison, const Place& place) {
    const Pairs pair(comparison.array1.type, place.element1.data(), comparison.array2.type,
                     place.element2.data(), 1);
    const Sameness sameness = sameness_of(pair, 0);
    if (sameness.at_zero() && sameness.from_one() > 1) {
        return "NaNs of the same bits are the same under --tol 0";
    }
    if (sameness.from_one() < all_digits(pair.type1(), pair.type2())) {
        return "the same from --tol " + std::to_string(sameness.from_one()) + " on";
    }
    return reason_under_all(pair.type1(), pair.type2(), place);
}

std::string place_text(const Comparison& comparison, const Place& place) {
    return index_text(comparison, place) + ": " + first_value_text(comparison, place) + " and "
           + second_value_text(comparison, place) + " (" + reason_text(comparison, place) + ")";
}

std::string difference_text(const Comparison& comparison) {
    switch (comparison.difference) {
    case Difference::shape:
        return "shape " + shape_text(comparison.array1.selected_shape) + " and "
               + shape_text(comparison.array2.selected_shape);
    case Difference::type:
        return "type " + element_type(comparison.array1.type).name + " and "
               + element_type(comparison.array2.type).name;
    default:
        return place_text(comparison, comparison.places.front());
    }
}

} // namespace talcmp
