// What tensors and numeric arrays share: the comparison of shapes.

#ifndef TALTENSOR_H
#define TALTENSOR_H

#include "type_properties.h"

#include <cstddef>
#include <cstring>

// Bytes per element of a tensor; the runtime defines it.
extern const std::size_t TalTensor_typeSizeTable[];

#pragma GCC visibility push(hidden)

// Returns 1 when the first `rank` entries of `dims1` and `dims2` are equal, else 0. A rank of 0
// yields 1 whatever the two pointers are, null included. A negative rank is undefined behaviour.
inline int EquivalentDimensions(const talint rank, const talint* dims1,
                                const talint* dims2) noexcept {
    const std::size_t bytes = static_cast<std::size_t>(rank) * sizeof(talint);
    // memcmp must not be given a null pointer, even for no bytes.
    return bytes == 0 || std::memcmp(dims1, dims2, bytes) == 0 ? 1 : 0;
}

#pragma GCC visibility pop

#endif
