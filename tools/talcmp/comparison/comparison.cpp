#include "comparison.h"

#include "compare_boxes.h"
#include "layout.h"
#include "temporary_copy.h"
#include "traversal.h"
#include "trouble.h"

#include <algorithm>
#include <new>
#include <stdexcept>

namespace talcmp {
namespace {

View selected(const NamedArray& array, const Selection& selection) {
    try {
        return select(*array.source, selection);
    } catch (const std::invalid_argument& error) {
        throw Trouble(array.name, error.what());
    }
}

ArrayFacts facts_of(const NamedArray& array, const View& view) {
    return {array.name, &array.source->type(), array.source->shape(), view.shape,
            array.source->fortran_order()};
}

// ---- From what was found to what is reported

// Asks about many pairs at once, if no report has done so before.
void find_samenesses(const BoxPlan& plan, std::vector<FoundPair>& pairs) {
    const ElementType& type1 = plan.first().type();
    const ElementType& type2 = plan.second().type();
    constexpr std::size_t at_once = 4096;
    std::vector<unsigned char> elements1(std::min(pairs.size(), at_once) * type1.size);
    std::vector<unsigned char> elements2(std::min(pairs.size(), at_once) * type2.size);
    DigitSearch search;
    for (std::size_t begin = 0; begin < pairs.size(); begin += at_once) {
        const std::size_t count = std::min(at_once, pairs.size() - begin);
        FoundPair* const first = pairs.data() + begin;
        for (std::size_t i = 0; i < count; ++i) {
            std::copy_n(first[i].element1.data(), type1.size, &elements1[i * type1.size]);
            std::copy_n(first[i].element2.data(), type2.size, &elements2[i * type2.size]);
        }
        const auto& found =
            search.search(Pairs(type1, elements1.data(), type2, elements2.data(), count));
        for (std::size_t i = 0; i < count; ++i) {
            first[i].sameness = sameness_of(found, i);
        }
    }
}

Place place_of(const BoxPlan& plan, const FoundPair& pair) {
    const Pairs pairs(plan.first().type(), pair.element1.data(), plan.second().type(),
                      pair.element2.data(), 1);
    return {plan.index_of(pair.number), pair.element1, pair.element2,
            verdict_on(pairs, 0, *pair.sameness)};
}

std::vector<Place> places_of(const BoxPlan& plan, std::vector<FoundPair> pairs) {
    if (!plan.question().report) {
        find_samenesses(plan, pairs);
    }
    std::vector<Place> places;
    places.reserve(pairs.size());
    for (const FoundPair& pair : pairs) {
        places.push_back(place_of(plan, pair));
    }
    return places;
}

Report report_on(const BoxPlan& plan, const Totals& totals) {
    Report report;
    report.totals = totals;
    report.all_digits = all_digits(plan.first().type(), plan.second().type());
    report.smallest_tolerance = smallest_tolerance(totals, report.all_digits);
    if (totals.worst) {
        report.worst_place = place_of(plan, *totals.worst);
    }
    return report;
}

// ---- The elements

void make_readable_in_any_order(NamedArray& array, ProgressListener& progress) {
    if (!array.source->random_access()) {
        array.source = std::make_unique<TemporaryCopy>(
            std::move(array.source), [&](const std::uint64_t bytes) { progress.advance(bytes); });
    }
}

// The size of the copy of an array that can be read only once, in an order that is not the one
// wanted.
std::uint64_t bytes_to_copy(const Traversal& traversal, const ArraySource& source) {
    return traversal.is_linear() || source.random_access()
               ? 0
               : element_count(source) * source.type().size;
}

// How much memory the comparison may need, for the message when there is not enough.
std::string memory_text(const BoxPlan& plan, const std::string& other_name,
                        const unsigned threads) {
    const Traversal& traversal = plan.traversal();
    const std::uint64_t piece = traversal.largest_box() * plan.bytes_of_pair();
    const std::uint64_t pairs =
        std::min<std::uint64_t>(plan.question().differences, traversal.pair_count());
    return "there is not enough memory to compare it with " + other_name + ": "
           + std::to_string(threads * piece) + " bytes for pieces of both, up to "
           + std::to_string(threads * pairs * sizeof(FoundPair))
           + " for differences; fewer --threads and --max-differences take less";
}

void compare_elements(NamedArray& first, NamedArray& second, const View& view1, const View& view2,
                      const Question& question, ProgressListener& progress, Comparison& result) {
    const std::size_t size1 = first.source->type().size;
    const std::size_t size2 = second.source->type().size;
    const Traversal traversal(view1, view2, column_major(*first.source, *second.source),
                              std::max(size1, size2));
    progress.begin(traversal.pair_count() * (size1 + size2)
                   + bytes_to_copy(traversal, *first.source)
                   + bytes_to_copy(traversal, *second.source));
    if (!traversal.is_linear()) {
        make_readable_in_any_order(first, progress);
        make_readable_in_any_order(second, progress);
    }
    const BoxPlan plan(traversal, *first.source, *second.source, question);
    const unsigned threads = thread_count(plan);
    try {
        const Findings findings = compare_boxes(plan, threads, progress);
        result.places = places_of(plan, findings.first.in_order());
        if (question.report) {
            result.report = report_on(plan, findings.totals);
        }
    } catch (const std::bad_alloc&) {
        throw Trouble(first.name, memory_text(plan, second.name, threads));
    }
}

// For arrays of one shape.
void compare_contents(NamedArray& first, NamedArray& second, const View& view1, const View& view2,
                      const Question& question, ProgressListener& progress, Comparison& result) {
    if (question.report) {
        result.report.emplace();
    }
    result.has_elements = has_elements(view1.shape);
    const bool types_differ = question.strict_type && result.array1.type != result.array2.type;
    if (result.has_elements && (!types_differ || question.report)) {
        compare_elements(first, second, view1, view2, question, progress, result);
    }
    if (types_differ) {
        result.difference = Difference::type;
    } else if (question.report ? result.report->totals.differing != 0 : !result.places.empty()) {
        result.difference = Difference::elements;
    }
}

} // namespace

Comparison compare(NamedArray first, NamedArray second, const Question& question,
                   ProgressListener& progress) {
    const View view1 = selected(first, question.selection);
    const View view2 = selected(second, question.selection);
    Comparison result;
    result.array1 = facts_of(first, view1);
    result.array2 = facts_of(second, view2);
    // Not by the records' dimensions, which are 32-bit: those of a file may be larger.
    if (view1.shape != view2.shape) {
        result.difference = Difference::shape;
    } else {
        compare_contents(first, second, view1, view2, question, progress, result);
    }
    first.source->check_to_end();
    second.source->check_to_end();
    return result;
}

} // namespace talcmp
