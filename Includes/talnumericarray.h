// The size of an element, by element type id.

#ifndef TALNUMERICARRAY_H
#define TALNUMERICARRAY_H

#include <cstddef>

// Bytes per element, indexed by `TalNumericArrayTypeId`; entry 0 (`UNINITIALIZED_TYPE`) names no
// element type and is not to be relied on. The runtime defines the table; the library brings a
// definition of its own for a program that has none.
extern const std::size_t TalNumericArray_typeSizeTable[13];

#endif
