// The real and imaginary parts of elements of any type, as doubles or singles.

#pragma once

#include "element_type.h"

#include <cstddef>
#include <vector>

namespace talcmp {

// The parts of `count` elements: the real ones if `part` is 0, the imaginary ones if it is 1, which
// are zeros for elements that are not complex. Rounded to `Real`, which is float or double. Valid
// as long as `elements` and `room`, which may be used for them.
template <typename Real>
const Real* parts_of(const ElementType& type, const void* elements, std::size_t count, int part,
                     std::vector<double>& room);

// What `parts_of` has rounded off the doubles of 64-bit integers: their exact value is the sum of
// both. Null if nothing was rounded, as the type has no such integers.
const double* rests_of(const ElementType& type, const void* elements, std::size_t count,
                       std::vector<double>& room);

} // namespace talcmp
