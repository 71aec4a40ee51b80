// The first difference between two arrays.

#ifndef TALCMP_DIFFERENCE_H
#define TALCMP_DIFFERENCE_H

#include "array_source.h"
#include "type_properties.h"

#include <cstdint>
#include <optional>

namespace talcmp {

struct Question {
    talreal tolerance = 0;    // binary digits
    bool strict_type = false; // whether arrays of different element types differ
};

struct Difference {
    enum class Kind { shape, type, element };
    Kind kind = Kind::element;
    std::uint64_t position = 0; // of the first pair that differs, counted in row-major order
};

// Returns how the arrays differ; nothing when they are the same. The answer is that of one call of
// `TalNumericArray_sameQ` over the whole arrays in a thread that has compared nothing yet; but
// under `strict_type` arrays without elements differ too where their types do.
std::optional<Difference> first_difference(ArraySource& first, ArraySource& second,
                                           const Question& question);

} // namespace talcmp

#endif
