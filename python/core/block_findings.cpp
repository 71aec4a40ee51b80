#include "block_findings.h"

#include "array_comparison.h"
#include "comparison_fields.h"
#include "conclusion.h"
#include "layout.h"
#include "numpy_array.h"

#include <pybind11/stl.h>

#include <algorithm>
#include <cstring>
#include <optional>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

namespace py = pybind11;

namespace talcmp {
namespace {

// ---- Numbers of places in the whole array

// Where a block is in a whole array: the row-major number of its first element, and of steps along
// its axes.
struct BlockPlace {
    std::uint64_t first = 0;
    std::vector<std::uint64_t> strides;
};

std::uint64_t number_in_whole(const BlockPlace& place, const Shape& block,
                              const std::uint64_t number) {
    const Shape index = index_of(block, false, number);
    std::uint64_t result = place.first;
    for (std::size_t axis = 0; axis < index.size(); ++axis) {
        result += index[axis] * place.strides[axis];
    }
    return result;
}

// The order of numbers stays what it is: both are row-major.
Findings in_whole(const Findings& findings, const BlockPlace& place, const Shape& block,
                  const std::size_t limit) {
    Findings result{FirstPairs(limit), findings.totals};
    for (FoundPair pair : findings.first.in_order()) {
        pair.number = number_in_whole(place, block, pair.number);
        result.first.add(pair);
    }
    if (result.totals.worst) {
        result.totals.worst->number = number_in_whole(place, block, result.totals.worst->number);
    }
    return result;
}

// ---- From one process to another

py::bytes bytes_of(const Element& element) {
    return {reinterpret_cast<const char*>(element.data()), element.size()};
}

Element element_of(const py::handle bytes) {
    const auto text = bytes.cast<std::string>();
    Element element = {};
    std::memcpy(element.data(), text.data(), std::min(element.size(), text.size()));
    return element;
}

py::tuple packed(const FoundPair& pair) {
    return py::make_tuple(pair.number, bytes_of(pair.element1), bytes_of(pair.element2),
                          pair.sameness->at_zero(), pair.sameness->from_one());
}

FoundPair unpacked_pair(const py::tuple& state) {
    return {state[0].cast<std::uint64_t>(), element_of(state[1]), element_of(state[2]),
            Sameness(state[3].cast<bool>(), state[4].cast<int>())};
}

py::tuple packed(const ValueCounts& counts) {
    return py::make_tuple(counts.nans, counts.infinities, counts.negative_zeros);
}

ValueCounts unpacked_counts(const py::tuple& state) {
    return {state[0].cast<std::uint64_t>(), state[1].cast<std::uint64_t>(),
            state[2].cast<std::uint64_t>()};
}

py::tuple packed(const Findings& findings) {
    const Totals& totals = findings.totals;
    py::list first;
    for (const FoundPair& pair : findings.first.in_order()) {
        first.append(packed(pair));
    }
    return py::make_tuple(findings.first.limit(), first, totals.pairs, totals.differing,
                          totals.digits, totals.needed_from_one, totals.worst_digits,
                          totals.worst ? py::object(packed(*totals.worst)) : py::none(),
                          packed(totals.values1), packed(totals.values2), totals.largest.absolute,
                          totals.largest.relative, totals.ignored);
}

Findings unpacked_findings(const py::tuple& state) {
    Findings findings{FirstPairs(state[0].cast<std::size_t>()), {}};
    for (const py::handle pair : state[1]) {
        findings.first.add(unpacked_pair(pair.cast<py::tuple>()));
    }
    Totals& totals = findings.totals;
    totals.pairs = state[2].cast<std::uint64_t>();
    totals.differing = state[3].cast<std::uint64_t>();
    totals.digits = state[4].cast<DigitCounts>();
    totals.needed_from_one = state[5].cast<int>();
    totals.worst_digits = state[6].cast<int>();
    if (!state[7].is_none()) {
        totals.worst = unpacked_pair(state[7]);
    }
    totals.values1 = unpacked_counts(state[8]);
    totals.values2 = unpacked_counts(state[9]);
    totals.largest = {state[10].cast<double>(), state[11].cast<double>()};
    totals.ignored = state[12].cast<std::uint64_t>();
    return findings;
}

// ---- Functions

void check_blocks(const py::array& block1, const py::array& block2, const std::size_t strides) {
    const auto rank = static_cast<std::size_t>(block1.ndim());
    if (block1.ndim() != block2.ndim()
        || !std::equal(block1.shape(), block1.shape() + rank, block2.shape())) {
        throw py::value_error("first and second are blocks of different shapes");
    }
    if (strides != rank) {
        throw py::value_error("there are strides for " + std::to_string(strides)
                              + " axes, but blocks have " + std::to_string(rank));
    }
}

Findings find(const py::object& object1, const py::object& object2, const std::uint64_t first,
              std::vector<std::uint64_t> strides, const py::kwargs& arguments) {
    CallOptions options = call_options("find", arguments);
    options.question.report = true;
    const py::array block1 = array_of(object1, options.name1);
    const py::array block2 = array_of(object2, options.name2);
    check_blocks(block1, block2, strides.size());
    const Findings findings = compare_blocks(block1, block2, options);
    return in_whole(findings, {first, std::move(strides)},
                    {block1.shape(), block1.shape() + block1.ndim()}, options.question.differences);
}

Findings merge(const std::vector<const Findings*>& parts) {
    Findings sum = *parts.at(0);
    for (std::size_t i = 1; i < parts.size(); ++i) {
        add(sum, *parts[i]);
    }
    return sum;
}

// What is known of an array without its elements: its type, shape, and the shape of what is
// selected of it.
using ArrayHeader = std::tuple<py::dtype, Shape, Shape>;

ArrayFacts facts_of_header(const ArrayHeader& header, const std::string& name) {
    const auto& [type, shape, selected_shape] = header;
    return facts_of(type, shape, selected_shape, name);
}

py::dict conclude_findings(const std::optional<Findings>& findings, const ArrayHeader& first,
                           const ArrayHeader& second, const py::kwargs& arguments) {
    CallOptions options = call_options("conclude", arguments);
    options.question.report = true;
    Comparison comparison =
        begin_comparison(facts_of_header(first, options.name1),
                         facts_of_header(second, options.name2), options.question);
    if (findings) {
        const Shape& shape = comparison.array1.shape;
        conclude(
            *findings, findings->totals.pairs + findings->totals.ignored,
            [&](const std::uint64_t number) { return index_of(shape, false, number); },
            options.question, comparison);
    }
    return fields_of(comparison, options.question);
}

} // namespace

void add_block_findings(py::module_& module) {
    py::class_<Findings>(module, "Findings", "What was found in some blocks of two arrays.")
        .def(py::pickle([](const Findings& findings) { return packed(findings); },
                        [](const py::tuple& state) { return unpacked_findings(state); }));
    module.def("find", find, py::arg("first"), py::arg("second"), py::pos_only(), py::arg("number"),
               py::arg("strides"),
               "Compares two blocks of one shape. `number` is the row-major number of their first "
               "element in the whole array, and `strides` are those of steps along their axes.");
    module.def("merge", merge, py::arg("parts"), py::pos_only(),
               "What was found in the blocks of all parts, of which there is at least one.");
    module.def("conclude", conclude_findings, py::arg("findings"), py::arg("first"),
               py::arg("second"), py::pos_only(),
               "The fields of the comparison of two arrays, each given by its type, shape and "
               "selected shape, from what was found in all blocks; None if there are none.");
}

} // namespace talcmp
