#include "conclusion.h"

#include "allowances.h"

#include <algorithm>
#include <utility>

namespace talcmp {
namespace {

// What found pairs belong to.
struct Context {
    const ElementType& type1;
    const ElementType& type2;
    const IndexOfNumber& index_of;
    const Question& question;
};

// Asks about many pairs at once, if no report has done so before.
void find_samenesses(const Context& context, std::vector<FoundPair>& pairs) {
    const ElementType& type1 = context.type1;
    const ElementType& type2 = context.type2;
    constexpr std::size_t at_once = 4096;
    std::vector<unsigned char> elements1(std::min(pairs.size(), at_once) * type1.size);
    std::vector<unsigned char> elements2(std::min(pairs.size(), at_once) * type2.size);
    Allowances allowances(context.question);
    DigitSearch search;
    for (std::size_t begin = 0; begin < pairs.size(); begin += at_once) {
        const std::size_t count = std::min(at_once, pairs.size() - begin);
        FoundPair* const first = pairs.data() + begin;
        for (std::size_t i = 0; i < count; ++i) {
            std::copy_n(first[i].element1.data(), type1.size, &elements1[i * type1.size]);
            std::copy_n(first[i].element2.data(), type2.size, &elements2[i * type2.size]);
        }
        if (allowances.any()) {
            allowances.apply(type1, elements1.data(), type2, elements2.data(), count);
        }
        const auto& found =
            search.search(Pairs(type1, elements1.data(), type2, elements2.data(), count));
        for (std::size_t i = 0; i < count; ++i) {
            first[i].sameness = sameness_of(found, i);
        }
    }
}

Place place_of(const Context& context, const FoundPair& pair) {
    const ElementType& type1 = context.type1;
    const ElementType& type2 = context.type2;
    FoundPair asked = pair;
    Allowances allowances(context.question);
    if (allowances.any()) {
        allowances.apply(type1, asked.element1.data(), type2, asked.element2.data(), 1);
    }
    const Pairs pairs(type1, asked.element1.data(), type2, asked.element2.data(), 1);
    return {context.index_of(pair.number), pair.element1, pair.element2,
            verdict_on(pairs, 0, *pair.sameness)};
}

std::vector<Place> places_of(const Context& context, std::vector<FoundPair> pairs) {
    if (!context.question.report) {
        find_samenesses(context, pairs);
    }
    std::vector<Place> places;
    places.reserve(pairs.size());
    for (const FoundPair& pair : pairs) {
        places.push_back(place_of(context, pair));
    }
    return places;
}

Report report_on(const Context& context, const Totals& totals) {
    Report report;
    report.totals = totals;
    report.all_digits = all_digits(context.type1, context.type2);
    report.smallest_tolerance = smallest_tolerance(totals, report.all_digits);
    if (totals.worst) {
        report.worst_place = place_of(context, *totals.worst);
    }
    return report;
}

} // namespace

Comparison begin_comparison(ArrayFacts first, ArrayFacts second, const Question& question) {
    Comparison comparison;
    comparison.tolerance = tolerance_for(question, *first.type, *second.type);
    // Not by the records' dimensions, which are 32-bit: those of a file may be larger.
    if (first.selected_shape != second.selected_shape) {
        comparison.difference = Difference::shape;
    } else {
        comparison.has_elements = has_elements(first.selected_shape);
        if (question.report) {
            comparison.report.emplace();
        }
        if (question.strict_type && first.stored_type != second.stored_type) {
            comparison.difference = Difference::type;
        }
    }
    comparison.array1 = std::move(first);
    comparison.array2 = std::move(second);
    return comparison;
}

bool depends_on_elements(const Comparison& comparison, const Question& question) {
    return comparison.difference != Difference::shape && comparison.has_elements
           && (comparison.difference == Difference::none || question.report);
}

void conclude(const Findings& findings, const std::uint64_t pair_count,
              const IndexOfNumber& index_of, const Question& question, Comparison& comparison) {
    const Context context = {*comparison.array1.type, *comparison.array2.type, index_of, question};
    comparison.all_ignored = findings.totals.ignored == pair_count;
    comparison.places = places_of(context, findings.first.in_order());
    if (question.report) {
        comparison.report = report_on(context, findings.totals);
    }
    const bool differs =
        question.report ? findings.totals.differing != 0 : !comparison.places.empty();
    if (differs && comparison.difference == Difference::none) {
        comparison.difference = Difference::elements;
    }
}

} // namespace talcmp
