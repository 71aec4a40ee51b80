// What the fuzzers draw from the bytes of an input: tolerances and pairs of elements that are hard
// to tell apart. Bytes of zero draw what is plainest, as does an input that is used up.

#ifndef TALNUMERICARRAY_FUZZ_DRAWS_H
#define TALNUMERICARRAY_FUZZ_DRAWS_H

#include <cstddef>

#include <fuzzer/FuzzedDataProvider.h>

namespace fuzz {

using Draws = FuzzedDataProvider;

inline std::size_t drawn_index(Draws& draws, const std::size_t size) {
    return draws.ConsumeIntegralInRange<std::size_t>(0, size - 1);
}

inline bool one_in(Draws& draws, const std::size_t size) {
    return drawn_index(draws, size) == size - 1;
}

constexpr std::size_t largest_element = 16;

double drawn_tolerance(Draws& draws);

// Writes an element of each type, 1 to 12. Most pairs are the same number, or lie about the limit
// of the tolerance. The elements may have any alignment.
void draw_elements(Draws& draws, double tolerance, int first_id, int second_id, void* first,
                   void* second);

} // namespace fuzz

#endif
