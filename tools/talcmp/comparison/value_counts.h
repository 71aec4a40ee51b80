// How many values of an array are special.

#pragma once

#include "type_properties.h"

#include <cstddef>
#include <cstdint>

namespace talcmp {

// Numbers of elements; a complex one counts if either part does.
struct ValueCounts {
    std::uint64_t nans = 0;
    std::uint64_t infinities = 0;
    std::uint64_t negative_zeros = 0;
};

inline void add(ValueCounts& sum, const ValueCounts& counts) {
    sum.nans += counts.nans;
    sum.infinities += counts.infinities;
    sum.negative_zeros += counts.negative_zeros;
}

// Counts in `count` elements of the type with the id `type`.
ValueCounts count_values(type_t type, const void* elements, std::size_t count);

} // namespace talcmp
