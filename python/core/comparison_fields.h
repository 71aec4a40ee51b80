// What a comparison found, as Python's own objects.

#pragma once

#include "comparison.h"

#include <pybind11/pybind11.h>

namespace talcmp {

// The fields of `talnumericarray.Comparison` by their names: numbers, texts, and tuples of these.
pybind11::dict fields_of(const Comparison& comparison, const Question& question);

} // namespace talcmp
