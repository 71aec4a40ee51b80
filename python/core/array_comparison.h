// Comparisons of Python's arrays, without the interpreter's lock where they take long.

#pragma once

#include "call_options.h"
#include "comparison.h"

#include <pybind11/numpy.h>

#include <optional>

namespace talcmp {

// What the options ask about the two. Raises ValueError if they ask for what the arrays do not
// have, MemoryError, and what a signal handler or the options' function raises.
Comparison compare_arrays(const pybind11::array& first, const pybind11::array& second,
                          const CallOptions& options);

// What there is to find in two blocks of one shape. Each `FoundPair` has the block's row-major
// number of its place. Raises what `compare_arrays` does.
Findings compare_blocks(const pybind11::array& first, const pybind11::array& second,
                        const CallOptions& options);

// Whether the arrays are the same by one call of `TalNumericArray_sameQ`; nothing if that cannot
// answer, as they are not stored one element after another, or more is asked about them, or if it
// would take so long that Ctrl-C should interrupt it.
std::optional<bool> same_at_once(const pybind11::array& first, const pybind11::array& second,
                                 const Question& question);

} // namespace talcmp
