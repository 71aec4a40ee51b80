#include "packed.h"

#include "trouble.h"

#include <algorithm>
#include <array>
#include <memory>
#include <new>
#include <utility>

namespace talcmp {
namespace {

// ---- Containers of what is passed below

template <typename Stream, typename Value, typename Pass>
void pass_optional(Stream& stream, std::optional<Value>& value, const Pass& pass) {
    bool is_there = value.has_value();
    stream.pass(is_there);
    if (is_there) {
        if (!value) {
            value.emplace();
        }
        pass(*value);
    }
}

template <typename Stream, typename Value, typename Pass>
void pass_list(Stream& stream, std::vector<Value>& list, const Pass& pass) {
    std::size_t size = list.size();
    stream.pass(size);
    list.resize(size);
    std::for_each(list.begin(), list.end(), pass);
}

// Of numbers, and of structures of numbers.
template <typename Stream, typename Value>
void pass_list(Stream& stream, std::vector<Value>& list) {
    pass_list(stream, list, [&](Value& value) { stream.pass(value); });
}

template <typename Stream>
void pass_name(Stream& stream, std::optional<std::string>& name) {
    pass_optional(stream, name, [&](std::string& text) { stream.pass(text); });
}

// ---- Files

template <typename Stream>
void pass(Stream& stream, FilePairs& files) {
    stream.pass(files.many);
    pass_list(stream, files.pairs, [&](NamedPair& pair) {
        stream.pass(pair.name);
        pass_name(stream, pair.first);
        pass_name(stream, pair.second);
        pass_name(stream, pair.trouble);
        stream.pass(pair.bytes);
    });
    stream.pass(files.others);
    pass_name(stream, files.member1);
    pass_name(stream, files.member2);
}

// ---- Outcomes

template <typename Stream>
void pass(Stream& stream, Place& place) {
    pass_list(stream, place.index);
    stream.pass(place.element1);
    stream.pass(place.element2);
    stream.pass(place.verdict);
}

template <typename Stream>
void pass(Stream& stream, ArrayFacts& facts) {
    stream.pass(facts.name);
    type_t id = facts.type == nullptr ? 0 : facts.type->id;
    stream.pass(id);
    facts.type = id == 0 ? nullptr : &element_type(id);
    stream.pass(facts.stored_type);
    pass_list(stream, facts.shape);
    pass_list(stream, facts.selected_shape);
    stream.pass(facts.fortran_order);
}

template <typename Stream>
void pass(Stream& stream, Report& report) {
    stream.pass(report.totals);
    pass_optional(stream, report.worst_place, [&](Place& place) { pass(stream, place); });
    stream.pass(report.all_digits);
    stream.pass(report.smallest_tolerance);
}

template <typename Stream>
void pass(Stream& stream, DifferenceMap& map) {
    std::vector<Level> levels;
    if constexpr (!Stream::is_reading) {
        levels = map.levels();
    }
    pass_list(stream, levels);
    if constexpr (Stream::is_reading) {
        map.add_levels(levels);
    }
}

template <typename Stream>
void pass(Stream& stream, Comparison& comparison, const Question& question) {
    pass(stream, comparison.array1);
    pass(stream, comparison.array2);
    stream.pass(comparison.tolerance);
    stream.pass(comparison.has_elements);
    stream.pass(comparison.all_ignored);
    stream.pass(comparison.difference);
    pass_list(stream, comparison.places, [&](Place& place) { pass(stream, place); });
    pass_optional(stream, comparison.report, [&](Report& report) { pass(stream, report); });
    bool has_maps = !comparison.maps.empty();
    stream.pass(has_maps);
    if (has_maps) {
        const Shape& shape = comparison.array1.selected_shape;
        comparison.maps.resize(question.maps.size());
        for (std::size_t i = 0; i < question.maps.size(); ++i) {
            if (comparison.maps[i] == nullptr) {
                comparison.maps[i] =
                    std::make_shared<DifferenceMap>(shape, question.maps[i](shape));
            }
            pass(stream, *comparison.maps[i]);
        }
    }
}

template <typename Stream>
void pass(Stream& stream, std::vector<Outcome>& outcomes, const Question& question) {
    pass_list(stream, outcomes, [&](Outcome& outcome) {
        stream.pass(outcome.kind);
        stream.pass(outcome.first);
        stream.pass(outcome.second);
        stream.pass(outcome.name);
        pass(stream, outcome.comparison, question);
        stream.pass(outcome.message);
        stream.pass(outcome.process);
    });
}

// ---- Findings

// A failure of a box as text. Text is lost of what is no trouble with a file: that there was not
// enough memory.
struct PackedFailure {
    std::uint64_t box = 0;
    bool is_memory = false;
    std::string text;
};

PackedFailure failure_here(const BoxFailure& failure, const std::string& process) {
    try {
        std::rethrow_exception(failure.reason);
    } catch (const std::bad_alloc&) {
        return {failure.box, true, ""};
    } catch (const std::exception& error) {
        const std::string where = failure.elsewhere ? "" : " (" + process + ")";
        return {failure.box, false, error.what() + where};
    }
}

BoxFailure failure_elsewhere(const PackedFailure& failure) {
    return {failure.box,
            failure.is_memory ? std::make_exception_ptr(std::bad_alloc())
                              : std::make_exception_ptr(Trouble(failure.text)),
            true};
}

struct PackedResults {
    std::vector<FoundPair> first;
    Totals totals;
    std::optional<PackedFailure> failure;
};

template <typename Stream>
void pass(Stream& stream, PackedResults& results, const BoxPlan& plan) {
    pass_list(stream, results.first);
    if (plan.question().report) {
        stream.pass(results.totals);
    } else {
        stream.pass(results.totals.ignored); // all that is counted
    }
    pass_optional(stream, results.failure, [&](PackedFailure& failure) {
        stream.pass(failure.box);
        stream.pass(failure.is_memory);
        stream.pass(failure.text);
    });
    for (const auto& map : plan.maps()) {
        pass(stream, *map);
    }
    for (ArraySource* const source : {&plan.first(), &plan.second(), plan.mask()}) {
        if (source != nullptr) {
            std::vector<SummedPart> parts = source->summed_parts();
            pass_list(stream, parts);
            if constexpr (Stream::is_reading) {
                source->add_summed_parts(parts);
            }
        }
    }
}

template <typename Value, typename... Others>
std::string bytes_of(Value& value, const Others&... others) {
    Packer packer;
    pass(packer, value, others...);
    return packer.take();
}

template <typename Value, typename... Others>
Value value_of(const std::string& bytes, const Others&... others) {
    Unpacker unpacker(bytes);
    Value value;
    pass(unpacker, value, others...);
    return value;
}

} // namespace

std::string packed(FilePairs& files) {
    return bytes_of(files);
}

FilePairs unpacked_files(const std::string& bytes) {
    return value_of<FilePairs>(bytes);
}

std::string packed(std::vector<Outcome>& outcomes, const Question& question) {
    return bytes_of(outcomes, question);
}

std::vector<Outcome> unpacked_outcomes(const std::string& bytes, const Question& question) {
    return value_of<std::vector<Outcome>>(bytes, question);
}

std::string packed(const BoxPlan& plan, const BoxResults& results, const std::string& process) {
    PackedResults packed = {results.findings.first.in_order(), results.findings.totals, {}};
    if (results.failure) {
        packed.failure = failure_here(*results.failure, process);
    }
    return bytes_of(packed, plan);
}

void add_packed(const std::string& bytes, const BoxPlan& plan, BoxResults& results) {
    const auto others = value_of<PackedResults>(bytes, plan);
    for (const FoundPair& pair : others.first) {
        results.findings.first.add(pair);
    }
    add(results.findings.totals, others.totals);
    if (others.failure && (!results.failure || others.failure->box < results.failure->box)) {
        results.failure = failure_elsewhere(*others.failure);
    }
}

} // namespace talcmp
