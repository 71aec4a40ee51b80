#include "report_text.h"

#include "number_text.h"
#include "shape_text.h"

#include <algorithm>
#include <array>
#include <cmath>
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
    const std::string compared_as =
        array.stored_type == array.type->name ? "" : " as " + array.type->name;
    return array.stored_type + compared_as + " " + shape_text(array.shape) + part
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

std::string tolerance_text(const Comparison& comparison, const Question& question) {
    std::string text = number_text(comparison.tolerance) + " binary digits";
    if (question.relative) {
        text += " (a relative error of " + number_text(*question.relative) + ")";
    }
    if (question.absolute) {
        text += ", or an absolute error of " + number_text(*question.absolute);
    }
    return text + (question.equal_nan ? "; NaNs are equal" : "");
}

std::string smallest_tolerance_text(const Comparison& comparison, const Spelling spelling) {
    const Report& report = *comparison.report;
    if (report.smallest_tolerance) {
        return option_text(*report.smallest_tolerance, spelling);
    }
    const bool none_at_all = report.totals.needed_from_one > most_digits;
    const std::string below =
        none_at_all ? "" : " below all " + std::to_string(report.all_digits) + " digits";
    return "none" + below + "; " + reason_of_no_tolerance(comparison, spelling);
}

std::string largest_text(const double difference) {
    return std::isinf(difference) ? "infinite" : "at most " + number_text(difference);
}

// One bar for each number of digits up to the worst.
std::string histogram(const DigitCounts& counts, const Terminal& terminal) {
    const auto most = *std::max_element(counts.begin(), counts.end());
    const std::size_t number_width = std::to_string(most).size();
    const int room = terminal.columns() - 18 - static_cast<int>(number_width);
    std::string text;
    for (std::size_t digits = 0; digits < counts.size(); ++digits) {
        const std::uint64_t count = counts[digits];
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

std::string report_text(const Comparison& comparison, const Question& question,
                        const Terminal& terminal, const Spelling spelling) {
    std::string text;
    text += line("first array", array_text(comparison.array1));
    text += line("second array", array_text(comparison.array2));
    text += line("tolerance", tolerance_text(comparison, question));
    if (!comparison.report) {
        return text;
    }
    const Totals& totals = comparison.report->totals;
    text += line("pairs", std::to_string(totals.pairs));
    if (totals.ignored != 0) {
        text += line("ignored", std::to_string(totals.ignored));
    }
    if (totals.pairs == 0) {
        return text;
    }
    text += line("differing", share_text(totals.differing, totals.pairs));
    if (!comparison.places.empty()) {
        text += line("first place", place_text(comparison, comparison.places.front(), spelling));
    }
    if (const auto& worst = comparison.report->worst_place) {
        text += line("worst place", place_text(comparison, *worst, spelling));
    }
    text += line("largest difference", digits_text(totals.worst_digits) + " binary digits");
    text += line("absolute difference", largest_text(totals.largest.absolute));
    text += line("relative difference", largest_text(totals.largest.relative));
    text += line("smallest tolerance", smallest_tolerance_text(comparison, spelling));
    text += line("NaNs", two(totals.values1.nans, totals.values2.nans));
    text += line("infinities", two(totals.values1.infinities, totals.values2.infinities));
    text +=
        line("negative zeros", two(totals.values1.negative_zeros, totals.values2.negative_zeros));
    text += "  digits that differ, number of pairs\n";
    return text + histogram(totals.digits, terminal);
}

} // namespace talcmp
