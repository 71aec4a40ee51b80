#include "comparison.h"

#include "compare_boxes.h"
#include "conclusion.h"
#include "layout.h"
#include "shape_text.h"
#include "temporary_copy.h"
#include "traversal.h"
#include "trouble.h"

#include <algorithm>
#include <array>
#include <new>
#include <stdexcept>

namespace talcmp {
namespace {

View selected(const NamedArray& array, const Question& question) {
    try {
        const View view = select(*array.source, question.selection);
        return question.squeeze ? squeezed(view) : view;
    } catch (const std::invalid_argument& error) {
        throw Trouble(array.name, error.what());
    }
}

ArrayFacts facts_of(const NamedArray& array, const View& view) {
    return {
        array.name, &array.source->type(),        array.source->type_name(), array.source->shape(),
        view.shape, array.source->fortran_order()};
}

// ---- The elements

// What is compared, and where it is in each array; `mask` has no source where there is no mask.
struct SelectedArrays {
    NamedArray& first;
    NamedArray& second;
    NamedArray& mask;
    View view1, view2, mask_view;
};

Traversal traversal_of(const SelectedArrays& arrays) {
    const std::size_t size =
        std::max(arrays.first.source->type().size, arrays.second.source->type().size);
    return {arrays.view1, arrays.view2, column_major(*arrays.first.source, *arrays.second.source),
            size, arrays.mask.source == nullptr ? nullptr : &arrays.mask_view};
}

void copy_to_file(NamedArray& array, ProgressListener& progress) {
    array.source = std::make_unique<TemporaryCopy>(
        std::move(array.source), [&](const std::uint64_t bytes) { progress.advance(bytes); });
}

// Whether whole blocks of both arrays take so much memory that one of them is better copied.
bool blocks_clash(const SelectedArrays& arrays) {
    constexpr std::uint64_t most_bytes = std::uint64_t{32} << 20U;
    if (arrays.view1.blocks.empty() || arrays.view2.blocks.empty()) {
        return false;
    }
    const std::uint64_t both = smallest_box(arrays.view1, arrays.view2);
    const std::uint64_t larger = std::max(smallest_box(arrays.view1, arrays.view1),
                                          smallest_box(arrays.view2, arrays.view2));
    const std::size_t bytes = arrays.first.source->type().size + arrays.second.source->type().size;
    return both > larger && both > most_bytes / bytes;
}

std::array<NamedArray*, 3> each_of(SelectedArrays& arrays) {
    return {&arrays.first, &arrays.second, &arrays.mask};
}

// Which arrays are copied, as they cannot be read in the order in which they are compared;
// otherwise a block might have to be read twice, or something again that can be read only once.
std::array<bool, 3> copies_needed(const SelectedArrays& arrays) {
    const bool linear = traversal_of(arrays).is_linear();
    const auto needs_copy = [linear](const NamedArray& array) {
        return !linear && !array.source->random_access();
    };
    const bool mask_in_blocks =
        arrays.mask.source != nullptr && arrays.mask.source->has_whole_blocks();
    return {needs_copy(arrays.first), blocks_clash(arrays) || needs_copy(arrays.second),
            arrays.mask.source != nullptr && (mask_in_blocks || needs_copy(arrays.mask))};
}

// Whether several processes can compare the arrays without reading anything twice.
bool is_divisible(SelectedArrays& arrays) {
    const std::array<bool, 3> copies = copies_needed(arrays);
    const std::array<NamedArray*, 3> each = each_of(arrays);
    return std::none_of(copies.begin(), copies.end(), [](const bool copied) { return copied; })
           && std::all_of(each.begin(), each.end(), [](const NamedArray* const array) {
                  return array->source == nullptr || array->source->random_access();
              });
}

void make_readable(SelectedArrays& arrays, const Question& question, ProgressListener& progress) {
    const std::array<bool, 3> copies = copies_needed(arrays);
    const std::array<NamedArray*, 3> each = each_of(arrays);
    const auto bytes_of = [](const NamedArray& array) {
        return element_count(*array.source) * array.source->type().size;
    };
    std::uint64_t total = traversal_of(arrays).pair_count()
                          * (arrays.first.source->type().size + arrays.second.source->type().size);
    for (std::size_t i = 0; i < each.size(); ++i) {
        total += copies[i] ? bytes_of(*each[i]) : 0;
    }
    progress.begin(total);
    for (std::size_t i = 0; i < each.size(); ++i) {
        if (copies[i]) {
            copy_to_file(*each[i], progress);
        }
    }
    arrays.view2 = selected(arrays.second, question); // a copy is not in blocks
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

void compare_elements(SelectedArrays arrays, const Question& question, BoxSupply& supply,
                      ProgressListener& progress, Comparison& result) {
    make_readable(arrays, question, progress);
    const Traversal traversal = traversal_of(arrays);
    for (const auto& room_for : question.maps) {
        const Shape& shape = arrays.view1.shape;
        result.maps.push_back(std::make_shared<DifferenceMap>(shape, room_for(shape)));
    }
    const BoxPlan plan(traversal, *arrays.first.source, *arrays.second.source,
                       arrays.mask.source.get(), question, result.maps);
    const unsigned threads = thread_count(plan);
    try {
        const Findings findings = compare_boxes(plan, threads, supply, progress);
        if (!supply.leads()) {
            return;
        }
        conclude(
            findings, traversal.pair_count(),
            [&](const std::uint64_t number) { return plan.index_of(number); }, question, result);
    } catch (const std::bad_alloc&) {
        throw OutOfMemory(arrays.first.name, memory_text(plan, arrays.second.name, threads));
    }
}

// Alone, or as one of several processes.
void compare_divided(SelectedArrays arrays, const Question& question, BoxSupply& supply,
                     ProgressListener& progress, Comparison& result) {
    AllBoxes undivided;
    const bool divided = !supply.is_shared() || is_divisible(arrays);
    if (!divided && !supply.leads()) {
        return;
    }
    BoxSupply& boxes = divided ? supply : undivided;
    try {
        compare_elements(std::move(arrays), question, boxes, progress, result);
    } catch (...) {
        boxes.abandon();
        throw;
    }
}

void check_mask(const NamedArray& mask, const NamedArray& first) {
    if (mask.source->type_name() != "bool") {
        throw NotNumbers(mask.name, "has elements of type " + mask.source->type_name()
                                        + "; --ignore takes an array of booleans");
    }
    if (mask.source->shape() != first.source->shape()) {
        throw Trouble(mask.name, "has the shape " + shape_text(mask.source->shape())
                                     + ", not that of " + first.name + ", which is "
                                     + shape_text(first.source->shape()));
    }
}

} // namespace

Comparison compare(NamedArray first, NamedArray second, NamedArray mask, const Question& question,
                   BoxSupply& supply, ProgressListener& progress) {
    const View view1 = selected(first, question);
    const View view2 = selected(second, question);
    Comparison result = begin_comparison(facts_of(first, view1), facts_of(second, view2), question);
    View mask_view;
    if (mask.source != nullptr) {
        check_mask(mask, first);
        mask_view = selected(mask, question);
    }
    if (depends_on_elements(result, question)) {
        compare_divided({first, second, mask, view1, view2, mask_view}, question, supply, progress,
                        result);
    }
    for (const NamedArray* const array : {&first, &second, &mask}) {
        if (array->source != nullptr && supply.leads()) {
            array->source->check_to_end();
        }
    }
    return result;
}

} // namespace talcmp
