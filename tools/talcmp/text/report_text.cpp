#include "report_text.h"

#include "difference_text.h"
#include "number_text.h"

#include <algorithm>
#include <array>
#include <cstdio>

namespace talcmp {
namespace {

std::string line(const std::string& name, const std::string& value) {
    constexpr std::size_t width = 22;
    return "  " + name + std::string(width - name.size(), ' ') + value + "\n";
}

std::string array_text(const ArrayFacts& array) {
    const std::string part =
        array.selected_shape == array.shape ? "" : ", of it " + shape_text(array.selected_shape);
    return element_type(array.type).name + " " + shape_text(array.shape) + part
           + (array.fortran_order ? ", Fortran order" : "");
}

std::string share_text(const std::uint64_t part, const std::uint64_t whole) {
    std::array<char, 32> text = {};
    std::snprintf(text.data(), text.size(), " (%.3g %%)",
                  100 * static_cast<double>(part) / static_cast<double>(whole));
    return std::to_string(part) + text.data();
}

std::string two(const std::uint64_t first, const std::uint64_t second) {
    return std::to_string(first) + " and " + std::to_string(second);
}

std::string digits_text(const int digits) {
    return digits > most_digits ? "more than all" : std::to_string(digits);
}

int all_digits_of(const Comparison& comparison) {
    return all_digits(element_type(comparison.array1.type), element_type(comparison.array2.type));
}

std::string smallest_tolerance_text(const Comparison& comparison) {
    if (const auto smallest = smallest_tolerance(comparison)) {
        return "--tol " + std::to_string(*smallest);
    }
    const bool none_at_all = comparison.report->needed_from_one > most_digits;
    const std::string below =
        none_at_all ? "" : " below all " + std::to_string(all_digits_of(comparison)) + " digits";
    return "none" + below + "; " + reason_of_no_tolerance(comparison);
}

// One bar for each number of digits up to the worst.
std::string histogram(const Report& report, const Terminal& terminal) {
    const auto most = *std::max_element(report.digits.begin(), report.digits.end());
    const std::size_t number_width = std::to_string(most).size();
    const int room = terminal.columns() - 18 - static_cast<int>(number_width);
    std::string text;
    for (std::size_t digits = 0; digits < report.digits.size(); ++digits) {
        const std::uint64_t count = report.digits[digits];
        if (count == 0) {
            continue;
        }
        const std::string name = digits_text(static_cast<int>(digits));
        const std::string number = std::to_string(count);
        const double share = static_cast<double>(count) / static_cast<double>(most);
        const auto length = static_cast<std::size_t>(std::max(1.0, share * std::max(room, 1)));
        text += "  ";
        text += std::string(13 - name.size(), ' ') + name + " ";
        text += std::string(number_width - number.size(), ' ') + number + " ";
        text += terminal.coloured(std::string(length, '#'), Colour::blue) + "\n";
    }
    return text;
}

} // namespace

std::optional<int> smallest_tolerance(const Comparison& comparison) {
    return smallest_tolerance(*comparison.report, all_digits_of(comparison));
}

std::string reason_of_no_tolerance(const Comparison& comparison) {
    const Report& report = *comparison.report;
    return report.worst_digits >= all_digits_of(comparison)
               ? place_text(comparison, *report.worst_place)
               : "pairs of NaNs are the same under the tolerance 0 only";
}

std::string report_text(const Comparison& comparison, const Question& question,
                        const Terminal& terminal) {
    std::string text;
    text += line("first array", array_text(comparison.array1));
    text += line("second array", array_text(comparison.array2));
    text += line("tolerance", number_text(question.tolerance) + " binary digits");
    if (!comparison.report) {
        return text;
    }
    const Report& report = *comparison.report;
    text += line("pairs", std::to_string(report.pairs));
    if (report.pairs == 0) {
        return text;
    }
    text += line("differing", share_text(report.differing, report.pairs));
    if (!comparison.places.empty()) {
        text += line("first place", place_text(comparison, comparison.places.front()));
    }
    if (report.worst_place) {
        text += line("worst place", place_text(comparison, *report.worst_place));
    }
    text += line("largest difference", digits_text(report.worst_digits) + " binary digits");
    text += line("smallest tolerance", smallest_tolerance_text(comparison));
    text += line("NaNs", two(report.values1.nans, report.values2.nans));
    text += line("infinities", two(report.values1.infinities, report.values2.infinities));
    text +=
        line("negative zeros", two(report.values1.negative_zeros, report.values2.negative_zeros));
    text += "  digits that differ, number of pairs\n";
    return text + histogram(report, terminal);
}

} // namespace talcmp
