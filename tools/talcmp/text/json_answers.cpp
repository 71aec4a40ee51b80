#include "json_answers.h"

#include "json_writer.h"
#include "number_text.h"
#include "wording.h"

#include <nlohmann/json.hpp>

#include <cmath>
#include <cstdio>

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

Json digits(const int count) {
    return count > most_digits ? Json() : Json(count);
}

Json array_json(const ArrayFacts& array) {
    return {{"name", array.name},
            {"type", array.type->name},
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
            {"differing", totals.differing},
            {"worst", report.worst_place ? place_json(comparison, *report.worst_place) : Json()},
            {"smallest_tolerance", smallest ? Json(*smallest) : Json()},
            {"why_no_tolerance", smallest ? Json() : Json(reason_of_no_tolerance(comparison))},
            {"first_values", values_json(totals.values1)},
            {"second_values", values_json(totals.values2)},
            {"histogram", histogram_json(totals.digits)}};
}

void write_comparison(JsonWriter& writer, const Comparison& comparison) {
    writer.add("first", array_json(comparison.array1));
    writer.add("second", array_json(comparison.array2));
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

void JsonAnswers::begin(const bool /*many*/) {
    writer_->begin_object();
    writer_->add("talcmp", TALCMP_VERSION);
    writer_->add("format", 1);
    writer_->add("tolerance", number(command_line_.question.tolerance));
    writer_->add("strict_type", command_line_.question.strict_type);
    writer_->add("slice", command_line_.slice.empty() ? Json() : Json(command_line_.slice));
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
                             {"trouble", summary.trouble}});
    writer_->add("exit_status", talcmp::exit_status(summary));
    writer_->end();
}

} // namespace talcmp
