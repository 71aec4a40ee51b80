#include "comparison_fields.h"

#include "report_text.h"
#include "wording.h"

#include <pybind11/complex.h>
#include <pybind11/stl.h>

#include <complex>
#include <cstring>
#include <string>

namespace py = pybind11;

namespace talcmp {
namespace {

template <typename Value>
py::object value_of(const Element& element) {
    Value value = {};
    std::memcpy(&value, element.data(), sizeof value);
    return py::cast(value);
}

// As Python's int, float or complex, which have each value of the element types.
template <typename... Types>
py::object value_of(const ElementType& type, const Element& element,
                    type_list<Types...> /*types*/) {
    py::object value;
    ((element_type_id<Types> == type.id ? void(value = value_of<Types>(element)) : void()), ...);
    return value;
}

// None where there are more than all digits.
py::object digits_of(const int digits) {
    return digits > most_digits ? py::none() : py::object(py::int_(digits));
}

py::tuple place_fields(const Comparison& comparison, const Place& place) {
    return py::make_tuple(py::tuple(py::cast(place.index)),
                          value_of(*comparison.array1.type, place.element1, element_type_list{}),
                          value_of(*comparison.array2.type, place.element2, element_type_list{}),
                          first_value_text(comparison, place), second_value_text(comparison, place),
                          digits_of(place.verdict.sameness.digits()),
                          reason_text(place.verdict, Spelling::python));
}

py::tuple array_fields(const ArrayFacts& array) {
    return py::make_tuple(array.name, array.type->name, array.stored_type,
                          py::tuple(py::cast(array.shape)),
                          py::tuple(py::cast(array.selected_shape)), array.fortran_order);
}

py::tuple count_fields(const ValueCounts& counts) {
    return py::make_tuple(counts.nans, counts.infinities, counts.negative_zeros);
}

py::tuple histogram_fields(const DigitCounts& counts) {
    py::list bars;
    for (std::size_t i = 0; i < counts.size(); ++i) {
        if (counts[i] != 0) {
            bars.append(py::make_tuple(digits_of(static_cast<int>(i)), counts[i]));
        }
    }
    return bars;
}

py::object difference_kind(const Difference difference) {
    switch (difference) {
    case Difference::shape:
        return py::str("shape");
    case Difference::type:
        return py::str("type");
    case Difference::elements:
        return py::str("elements");
    default:
        return py::none();
    }
}

// What talcmp prints of two arrays that are called so.
std::string text_of(const Comparison& comparison, const Question& question) {
    const std::string names = comparison.array1.name + " and " + comparison.array2.name;
    std::string text;
    if (comparison.difference == Difference::none) {
        text = names + " are the same" + remark_on_sameness(comparison) + "\n";
    } else if (comparison.difference != Difference::elements) {
        text = names + " differ: " + difference_text(comparison, Spelling::python) + "\n";
    } else {
        for (const Place& place : comparison.places) {
            text += names + " differ: " + place_text(comparison, place, Spelling::python) + "\n";
        }
    }
    const Terminal terminal(false, false, 80);
    text += report_text(comparison, question, terminal, Spelling::python);
    text.pop_back(); // print ends the last line
    return text;
}

} // namespace

py::dict fields_of(const Comparison& comparison, const Question& question) {
    const Report report = comparison.report.value_or(Report{});
    const Totals& totals = report.totals;
    const bool has_tolerance = comparison.report && report.smallest_tolerance;
    py::list places;
    for (const Place& place : comparison.places) {
        places.append(place_fields(comparison, place));
    }
    py::dict fields;
    fields["difference"] = difference_kind(comparison.difference);
    fields["first"] = array_fields(comparison.array1);
    fields["second"] = array_fields(comparison.array2);
    fields["tolerance"] = comparison.tolerance;
    fields["places"] = py::tuple(places);
    fields["pairs"] = totals.pairs;
    fields["ignored"] = totals.ignored;
    fields["differing"] = totals.differing;
    fields["worst"] =
        report.worst_place ? py::object(place_fields(comparison, *report.worst_place)) : py::none();
    fields["largest_absolute_difference"] = totals.largest.absolute;
    fields["largest_relative_difference"] = totals.largest.relative;
    fields["smallest_tolerance"] =
        has_tolerance ? py::object(py::int_(*report.smallest_tolerance)) : py::none();
    fields["why_no_tolerance"] =
        has_tolerance ? py::object(py::none())
        : comparison.report
            ? py::object(py::str(reason_of_no_tolerance(comparison, Spelling::python)))
            : py::object(py::str(difference_text(comparison, Spelling::python)));
    fields["first_values"] = count_fields(totals.values1);
    fields["second_values"] = count_fields(totals.values2);
    fields["histogram"] = histogram_fields(totals.digits);
    fields["text"] = text_of(comparison, question);
    return fields;
}

} // namespace talcmp
