// What follows about two arrays from their shapes and types, and from what was found in their
// elements.

#pragma once

#include "comparison.h"

#include <cstdint>
#include <functional>

namespace talcmp {

// What is known before any elements are.
Comparison begin_comparison(ArrayFacts first, ArrayFacts second, const Question& question);

// Whether there is something to find in the elements.
bool depends_on_elements(const Comparison& comparison, const Question& question);

// The index of the first array's element with a number of `FoundPair`.
using IndexOfNumber = std::function<Shape(std::uint64_t)>;

// Adds to `comparison` what was found in all of the `pair_count` pairs of elements.
void conclude(const Findings& findings, std::uint64_t pair_count, const IndexOfNumber& index_of,
              const Question& question, Comparison& comparison);

} // namespace talcmp
