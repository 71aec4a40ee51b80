#include "json_answers.h"

#include "json_writer.h"
#include "number_text.h"
#include "wording.h"

#include <nlohmann/json.hpp>

#include <cmath>
#include <cstdio>
#include <optional>
#include <string>

namespace talcmp {
namespace {

using Json = nlohmann::ordered_json;

const char* kind_text(const Outcome::Kind kind) {
    switch (kind) {
    case Outcome::Kind::same:
        return "same";
    case Outcome::Kind::different:
        return "different";
    case Outcome::Kind::only_in_first:
        return "only in first";
    case Outcome::Kind::only_in_second:
        return "only in second";
    case Outcome::Kind::skipped:
        return "skipped";
    default:
        return "trouble";
    }
}

Json difference_kind(const Difference difference) {
    switch (difference) {
    case Difference::shape:
        return "shape";
    case Difference::type:
        return "type";
    case Difference::elements:
        return "elements";
    default:
        return nullptr;
    }
}

// JSON has no infinity.
Json number(const talreal value) {
    return std::isfinite(value) ? Json(value) : Json(number_text(value));
}

Json number_or_null(const std::optional<double>& value) {
    return value ? Json(*value) : Json();
}

Json text_or_null(const std::string& text) {
    return text.empty() ? Json() : Json(text);
}

Json digits(const int count) {
    return count > most_digits ? Json() : Json(count);
}

Json array_json(const ArrayFacts& array) {
    return {{"name", array.name},
            {"type", array.type->name},
            {"stored_type", array.stored_type},
            {"shape", array.shape},
            {"selected_shape", array.selected_shape},
            {"order", array.fortran_order ? "Fortran" : "C"}};
}

Json place_json(const Comparison& comparison, const Place& place) {
    return {{"index", place.index},
            {"first", first_value_text(comparison, place)},
            {"second", second_value_text(comparison, place)},
            {"digits", digits(place.verdict.sameness.digits())},
            {"reason", reason_text(place.verdict)}};
}

Json values_json(const ValueCounts& counts) {
    return {{"nans", counts.nans},
            {"infinities", counts.infinities},
            {"negative_zeros", counts.negative_zeros}};
}

Json histogram_json(const DigitCounts& counts) {
    Json bars = Json::array();
    for (std::size_t i = 0; i < counts.size(); ++i) {
        if (counts[i] != 0) {
            bars.push_back({{"digits", digits(static_cast<int>(i))}, {"pairs", counts[i]}});
        }
    }
    return bars;
}

Json report_json(const Comparison& comparison) {
    if (!comparison.report) {
        return nullptr;
    }
    const Report& report = *comparison.report;
    const Totals& totals = report.totals;
    const auto smallest = report.smallest_tolerance;
    return {{"pairs", totals.pairs},
            {"ignored", totals.ignored},
            {"differing", totals.differing},
            {"worst", report.worst_place ? place_json(comparison, *report.worst_place) : Json()},
            {"largest_absolute_difference", number(totals.largest.absolute)},
            {"largest_relative_difference", number(totals.largest.relative)},
            {"smallest_tolerance", smallest ? Json(*smallest) : Json()},
            {"why_no_tolerance", smallest ? Json() : Json(reason_of_no_tolerance(comparison))},
            {"first_values", values_json(totals.values1)},
            {"second_values", values_json(totals.values2)},
            {"histogram", histogram_json(totals.digits)}};
}

void write_comparison(JsonWriter& writer, const Comparison& comparison) {
    writer.add("first", array_json(comparison.array1));
    writer.add("second", array_json(comparison.array2));
    writer.add("tolerance", number(comparison.tolerance));
    writer.add("difference", difference_kind(comparison.difference));
    writer.begin_array("differences");
    for (const Place& place : comparison.places) {
        writer.add(place_json(comparison, place));
    }
    writer.end();
    writer.add("report", report_json(comparison));
}

} // namespace

JsonAnswers::JsonAnswers(const CommandLine& command_line)
    : command_line_(command_line), writer_(std::make_unique<JsonWriter>(stdout)) {}

JsonAnswers::~JsonAnswers() = default;

void JsonAnswers::begin() {
    const Question& question = command_line_.question;
    writer_->begin_object();
    writer_->add("talcmp", TALCMP_VERSION);
    writer_->add("format", 1);
    writer_->add("tolerance", question.relative ? Json() : number(question.tolerance));
    writer_->add("relative", number_or_null(question.relative));
    writer_->add("absolute", number_or_null(question.absolute));
    writer_->add("equal_nan", question.equal_nan);
    writer_->add("strict_type", question.strict_type);
    writer_->add("squeeze", question.squeeze);
    writer_->add("slice", text_or_null(command_line_.slice));
    writer_->add("ignore", text_or_null(command_line_.ignore));
    writer_->begin_array("comparisons");
}

void JsonAnswers::print(const Outcome& outcome) {
    writer_->begin_object();
    writer_->add("result", kind_text(outcome.kind));
    switch (outcome.kind) {
    case Outcome::Kind::same:
    case Outcome::Kind::different:
        write_comparison(*writer_, outcome.comparison);
        break;
    case Outcome::Kind::only_in_first:
        writer_->add("in", outcome.first);
        writer_->add("name", outcome.name);
        break;
    case Outcome::Kind::only_in_second:
        writer_->add("in", outcome.second);
        writer_->add("name", outcome.name);
        break;
    case Outcome::Kind::trouble:
    case Outcome::Kind::skipped:
        writer_->add("names", {outcome.first, outcome.second});
        writer_->add("message", outcome.message);
        break;
    }
    writer_->end();
}

void JsonAnswers::finish(const Summary& summary) {
    writer_->end();
    writer_->add("summary", {{"same", summary.same},
                             {"different", summary.different},
                             {"only_in_first", summary.only_in_first},
                             {"only_in_second", summary.only_in_second},
                             {"trouble", summary.trouble},
                             {"skipped", summary.skipped},
                             {"other_files", summary.other_files}});
    writer_->add("stopped", summary.stopped);
    writer_->add("exit_status", talcmp::exit_status(summary));
    writer_->end();
}

} // namespace talcmp
