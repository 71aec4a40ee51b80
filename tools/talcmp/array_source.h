// Where talcmp gets the elements of an array from.

#ifndef TALCMP_ARRAY_SOURCE_H
#define TALCMP_ARRAY_SOURCE_H

#include "type_properties.h"

#include <cstdint>
#include <string>
#include <vector>

namespace talcmp {

// The dimensions of an array, outermost first; a file may have larger ones than a record holds.
using Shape = std::vector<std::uint64_t>;

// An array that is read slice by slice. A format of files is one class that implements this, and
// one line in `open_array`.
class ArraySource {
  public:
    ArraySource() = default;
    ArraySource(const ArraySource&) = delete;
    ArraySource& operator=(const ArraySource&) = delete;
    virtual ~ArraySource() = default;

    // The element type, an id of `TalNumericArrayTypeId` from 1 to 12.
    virtual type_t element_type() const = 0;

    virtual const Shape& shape() const = 0;

    // The number of elements: the product of the shape.
    virtual std::uint64_t element_count() const = 0;

    // The elements `first` to `first + count - 1` in row-major order, aligned for their type. Valid
    // until the next call and for the lifetime of the source.
    virtual const void* elements(std::uint64_t first, std::uint64_t count) = 0;
};

} // namespace talcmp

#endif
