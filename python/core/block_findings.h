// What was found in blocks of two large arrays, which are compared one by one, wherever that is.

#pragma once

#include <pybind11/pybind11.h>

namespace talcmp {

// Adds the type `Findings` and its functions `find`, `merge` and `conclude` to the module.
void add_block_findings(pybind11::module_& module);

} // namespace talcmp
