// Python's objects as arrays of numbers.

#pragma once

#include "comparison.h"
#include "stored_type.h"

#include <pybind11/numpy.h>

#include <string>

namespace talcmp {

// The object as an array, without a copy if it is one or shares its memory with one. Raises a
// TypeError, which calls the object `name`, if it is of a kind that cannot be compared.
pybind11::array array_of(pybind11::handle object, const std::string& name);

// NumPy's name of the type: "float64", ">f4".
std::string type_text(const pybind11::dtype& type);

// How elements of a type are stored; raises a TypeError, which says what to do, if they are not of
// a type that can be compared. `name` is that of the array.
StoredType stored_type_of(const pybind11::dtype& type, const std::string& name);

// Whether `numpy.save` would store the array in Fortran order.
bool is_in_fortran_order(const pybind11::array& array);

// The array as a source of elements, which does not keep it alive. `by_fortran_positions` is for
// arrays of which all that are compared, and the mask, are in Fortran order.
NamedArray source_of(const pybind11::array& array, const std::string& name,
                     bool by_fortran_positions = false);

// What is reported about an array of a type and shape.
ArrayFacts facts_of(const pybind11::dtype& type, Shape shape, Shape selected_shape,
                    const std::string& name);

// The id of the element type of arrays that are compared as they are: aligned and in this machine's
// byte order; 0 of all others.
type_t id_of_elements(const pybind11::array& array);

} // namespace talcmp
