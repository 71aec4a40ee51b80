// A difference in words.

#ifndef TALCMP_DIFFERENCE_TEXT_H
#define TALCMP_DIFFERENCE_TEXT_H

#include "array_source.h"
#include "difference.h"

#include <string>

namespace talcmp {

// Says what differs: "shape (2, 3) and (3, 2)", "type int32 and float64", or "[1, 2]: 0.5 and 0.25"
// with the index of the elements and their values in digits that read back as the same values, a
// NaN as its bits.
std::string difference_text(const Difference& difference, ArraySource& first, ArraySource& second);

} // namespace talcmp

#endif
