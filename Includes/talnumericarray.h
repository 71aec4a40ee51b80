// The size of an element, by element type id.

#ifndef TALNUMERICARRAY_H
#define TALNUMERICARRAY_H

#include <cstddef>

// Bytes per element, indexed by `TalNumericArrayTypeId`. Entry 0 (`UNINITIALIZED_TYPE`)
// belongs to no element type and must not be relied on. The runtime defines the table; the library
// has a definition for programs without one.
extern const std::size_t TalNumericArray_typeSizeTable[13];

#endif
