#include "wording.h"

#include "shape_text.h"

namespace talcmp {
namespace {

bool as_doubles(const Comparison& comparison) {
    return comparison.array1.type != comparison.array2.type;
}

std::string text_of(const Reason reason, const Sameness sameness) {
    switch (reason) {
    case Reason::digits:
        return "the same from --tol " + std::to_string(sameness.from_one()) + " on";
    case Reason::nans_of_the_same_bits:
        return "NaNs of the same bits are the same under --tol 0";
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

std::string reason_text(const Verdict& verdict) {
    const char* const part = verdict.part == Part::real        ? "real parts: "
                             : verdict.part == Part::imaginary ? "imaginary parts: "
                                                               : "";
    return part + text_of(verdict.reason, verdict.sameness);
}

std::string place_text(const Comparison& comparison, const Place& place) {
    return "[" + joined(place.index) + "]: " + first_value_text(comparison, place) + " and "
           + second_value_text(comparison, place) + " (" + reason_text(place.verdict) + ")";
}

std::string difference_text(const Comparison& comparison) {
    switch (comparison.difference) {
    case Difference::shape:
        return "shape " + shape_text(comparison.array1.selected_shape) + " and "
               + shape_text(comparison.array2.selected_shape);
    case Difference::type:
        return "type " + comparison.array1.stored_type + " and " + comparison.array2.stored_type;
    default:
        return place_text(comparison, comparison.places.front());
    }
}

std::string reason_of_no_tolerance(const Comparison& comparison) {
    const Report& report = *comparison.report;
    return report.totals.worst_digits >= report.all_digits
               ? place_text(comparison, *report.worst_place)
               : "pairs of NaNs are the same under the tolerance 0 only";
}

} // namespace talcmp
