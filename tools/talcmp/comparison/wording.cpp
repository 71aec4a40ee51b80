#include "wording.h"

#include "shape_text.h"

namespace talcmp {
namespace {

bool as_doubles(const Comparison& comparison) {
    return comparison.array1.type != comparison.array2.type;
}

std::string text_of(const Reason reason, const Sameness sameness, const Spelling spelling) {
    switch (reason) {
    case Reason::digits:
        return "the same from " + option_text(sameness.from_one(), spelling) + " on";
    case Reason::nans_of_the_same_bits:
        return "NaNs of the same bits are the same under " + option_text(0, spelling);
    case Reason::different_integers:
        return "different integers";
    case Reason::one_nan:
        return "a NaN";
    case Reason::two_nans:
        return "two NaNs";
    case Reason::one_zero:
        return "zero is the same only as zero";
    case Reason::opposite_signs:
        return "opposite signs";
    default:
        return "no digit in common";
    }
}

} // namespace

std::string first_value_text(const Comparison& comparison, const Place& place) {
    return comparison.array1.type->text(place.element1.data(), as_doubles(comparison));
}

std::string second_value_text(const Comparison& comparison, const Place& place) {
    return comparison.array2.type->text(place.element2.data(), as_doubles(comparison));
}

std::string option_text(const int tolerance, const Spelling spelling) {
    return (spelling == Spelling::python ? "tol=" : "--tol ") + std::to_string(tolerance);
}

std::string reason_text(const Verdict& verdict, const Spelling spelling) {
    const char* const part = verdict.part == Part::real        ? "real parts: "
                             : verdict.part == Part::imaginary ? "imaginary parts: "
                                                               : "";
    return part + text_of(verdict.reason, verdict.sameness, spelling);
}

std::string place_text(const Comparison& comparison, const Place& place, const Spelling spelling) {
    return "[" + joined(place.index) + "]: " + first_value_text(comparison, place) + " and "
           + second_value_text(comparison, place) + " (" + reason_text(place.verdict, spelling)
           + ")";
}

std::string difference_text(const Comparison& comparison, const Spelling spelling) {
    switch (comparison.difference) {
    case Difference::shape:
        return "shape " + shape_text(comparison.array1.selected_shape) + " and "
               + shape_text(comparison.array2.selected_shape);
    case Difference::type:
        return "type " + comparison.array1.stored_type + " and " + comparison.array2.stored_type;
    default:
        return place_text(comparison, comparison.places.front(), spelling);
    }
}

std::string remark_on_sameness(const Comparison& comparison) {
    return !comparison.has_elements ? " (no elements)"
           : comparison.all_ignored ? " (all pairs ignored)"
                                    : "";
}

std::string reason_of_no_tolerance(const Comparison& comparison, const Spelling spelling) {
    const Report& report = *comparison.report;
    return report.totals.worst_digits >= report.all_digits
               ? place_text(comparison, *report.worst_place, spelling)
               : "pairs of NaNs are the same under the tolerance 0 only";
}

} // namespace talcmp
