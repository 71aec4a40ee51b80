#include "array_comparison.h"

#include "box_comparer.h"
#include "compare_boxes.h"
#include "interruptible_progress.h"
#include "layout.h"
#include "numpy_array.h"
#include "shape_text.h"
#include "talnumericarray_compare.h"
#include "traversal.h"
#include "trouble.h"

#include <algorithm>
#include <array>
#include <limits>
#include <new>
#include <utility>

namespace py = pybind11;

namespace talcmp {
namespace {

// ---- Without the lock

// Runs `action(progress)`, and raises what it throws as Python's exceptions.
template <typename Action>
auto without_lock(const py::object& callback, const Action& action) {
    InterruptibleProgress progress(callback);
    try {
        auto result = [&] {
            const py::gil_scoped_release release;
            return action(progress);
        }();
        progress.finish();
        return result;
    } catch (const InterruptibleProgress::Interrupted&) {
        progress.finish();
        throw;
    } catch (const OutOfMemory&) {
        throw std::bad_alloc();
    } catch (const Trouble& trouble) {
        throw py::value_error(trouble.what());
    }
}

// ---- The mask

std::optional<py::array> mask_of(const CallOptions& options) {
    if (options.ignore.is_none()) {
        return std::nullopt;
    }
    const py::array mask = array_of(options.ignore, "ignore");
    if (mask.dtype().kind() != 'b') {
        throw py::type_error("ignore has elements of type " + type_text(mask.dtype())
                             + "; it takes an array of booleans, True where nothing is compared");
    }
    return mask;
}

NamedArray source_of_mask(const std::optional<py::array>& mask, const bool by_fortran_positions) {
    return mask ? source_of(*mask, "ignore", by_fortran_positions) : NamedArray{};
}

// ---- One call of the module

constexpr py::ssize_t most_dimensions = 32; // of arrays of NumPy 1
using Dimensions = std::array<talint, most_dimensions>;

// Whether `TalNumericArray_sameQ` may be asked about all elements in the order of memory.
bool in_one_order(const py::array& first, const py::array& second) {
    const int both = first.flags() & second.flags();
    return (both & (py::array::c_style | py::array::f_style)) != 0;
}

bool have_one_shape(const py::array& first, const py::array& second) {
    return first.ndim() == second.ndim()
           && std::equal(first.shape(), first.shape() + first.ndim(), second.shape());
}

// Of an array whose elements are fewer than 2^31.
st_TalDataArray record_of(const py::array& array, const type_t id, Dimensions& dimensions) {
    std::transform(array.shape(), array.shape() + array.ndim(), dimensions.begin(),
                   [](const py::ssize_t extent) { return static_cast<talint>(extent); });
    st_TalDataArray record = {};
    record.dims = dimensions.data();
    record.rank = static_cast<talint>(array.ndim());
    record.data_type = id;
    record.nelems = static_cast<talint>(array.size());
    // The module only reads it.
    record.data = const_cast<void*>(array.data());
    return record;
}

bool asks_for_more(const Question& question) {
    return question.equal_nan || question.absolute || question.squeeze
           || !question.selection.first.empty() || !question.selection.last.empty();
}

// Whether the answer for some pairs depends on what was compared before.
bool depends_on_factor(const talreal tolerance) {
    constexpr int single_digits = std::numeric_limits<float>::digits;
    constexpr int double_digits = std::numeric_limits<double>::digits;
    return (single_digits - 1 < tolerance && tolerance < single_digits)
           || (double_digits - 1 < tolerance && tolerance < double_digits);
}

} // namespace

Comparison compare_arrays(const py::array& first, const py::array& second,
                          const CallOptions& options) {
    const Question& question = options.question;
    const auto named = question.selection.first.size() + question.selection.last.size();
    for (const py::array* const array : {&first, &second}) {
        if (named > static_cast<std::size_t>(array->ndim())) {
            throw py::value_error("slices are for " + std::to_string(named) + " dimensions, but "
                                  + (array == &first ? options.name1 : options.name2) + " has "
                                  + std::to_string(array->ndim()));
        }
    }
    const bool fortran1 = is_in_fortran_order(first);
    const bool fortran2 = is_in_fortran_order(second);
    const auto mask = mask_of(options);
    const bool all_fortran = fortran1 && fortran2 && (!mask || is_in_fortran_order(*mask));
    NamedArray source1 = source_of(first, options.name1, all_fortran);
    NamedArray source2 = source_of(second, options.name2, all_fortran);
    NamedArray ignored = source_of_mask(mask, all_fortran);
    Comparison comparison = without_lock(options.progress, [&](ProgressListener& progress) {
        AllBoxes all;
        return compare(std::move(source1), std::move(source2), std::move(ignored), question, all,
                       progress);
    });
    comparison.array1.fortran_order = fortran1;
    comparison.array2.fortran_order = fortran2;
    return comparison;
}

Findings compare_blocks(const py::array& first, const py::array& second,
                        const CallOptions& options) {
    const NamedArray source1 = source_of(first, options.name1);
    const NamedArray source2 = source_of(second, options.name2);
    const auto mask = mask_of(options);
    const NamedArray source3 = source_of_mask(mask, false);
    ArraySource& array1 = *source1.source;
    ArraySource& array2 = *source2.source;
    ArraySource* const ignored = source3.source.get();
    return without_lock(options.progress, [&](ProgressListener& progress) {
        const View view1 = select(array1, {});
        const View view2 = select(array2, {});
        const View ignored_view = ignored == nullptr ? View{} : select(*ignored, {});
        const Traversal traversal(view1, view2, column_major(array1, array2),
                                  std::max(array1.type().size, array2.type().size),
                                  ignored == nullptr ? nullptr : &ignored_view);
        const DifferenceMaps no_maps;
        const BoxPlan plan(traversal, array1, array2, ignored, options.question, no_maps);
        AllBoxes all;
        return compare_boxes(plan, thread_count(plan), all, progress);
    });
}

std::optional<bool> same_at_once(const py::array& first, const py::array& second,
                                 const Question& question) {
    constexpr py::ssize_t most_elements = 1 << 20; // a few milliseconds at most
    constexpr py::ssize_t worth_unlocking = 1 << 13;
    const type_t id1 = id_of_elements(first);
    const type_t id2 = id_of_elements(second);
    const py::ssize_t count = first.size();
    const bool suitable = id1 != 0 && id2 != 0 && !asks_for_more(question)
                          && first.ndim() <= most_dimensions && 0 < count && count <= most_elements
                          && have_one_shape(first, second) && in_one_order(first, second);
    if (!suitable) {
        return std::nullopt;
    }
    Dimensions dimensions1;
    Dimensions dimensions2;
    st_TalDataArray record1 = record_of(first, id1, dimensions1);
    st_TalDataArray record2 = record_of(second, id2, dimensions2);
    const talreal tolerance = tolerance_for(question, element_type(id1), element_type(id2));
    const auto ask = [&] {
        if (depends_on_factor(tolerance)) {
            remember_factor_of(tolerance);
        }
        return TalNumericArray_sameQ(tolerance, question.strict_type ? 0 : 1, &record1, &record2)
               != 0;
    };
    if (count < worth_unlocking) {
        return ask();
    }
    const py::gil_scoped_release release;
    return ask();
}

} // namespace talcmp
