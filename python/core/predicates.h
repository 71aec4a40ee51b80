// `same` and `equivalent`.

#pragma once

#include <pybind11/pybind11.h>

namespace talcmp {

// Adds both functions to the module. They are called through Python's own protocol of calls, as
// pybind11's conversion of the arguments takes longer than the comparison of a few elements.
void add_predicates(pybind11::module_& module);

} // namespace talcmp
