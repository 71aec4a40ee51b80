// Calls that were recorded with their answers on one platform, to be answered alike on every other.
//
// One record a line, in the order in which a thread that had compared nothing before made them:
//
//   double TOLERANCE FACTOR    the factor of a tolerance where doubles are compared
//   single TOLERANCE FACTOR    and where singles are
//   call TOLERANCE ANY_TYPE ID1 ELEMENTS1 ID2 ELEMENTS2 ANSWER
//
// Tolerances and factors are hexadecimal floating-point numbers. The elements of an array are the
// hexadecimal digits of their bits, the most significant first, a real part before its imaginary
// part, without separators. A factor stands before the first call that may need it.

#ifndef TALNUMERICARRAY_TESTS_GOLDEN_CALLS_H
#define TALNUMERICARRAY_TESTS_GOLDEN_CALLS_H

#include <cstdint>
#include <istream>
#include <ostream>

namespace golden {

// Records random calls as this build answers them. Must run in a thread that has not compared
// reals.
void record(std::ostream& records, std::uint64_t seed, std::uint64_t calls);

struct Tally {
    std::uint64_t factors = 0;
    std::uint64_t calls = 0;
    std::uint64_t same = 0;
    std::uint64_t pairs_of_types = 0;

    // Factors that differ in their last place alone, as those of fractional tolerances may: they
    // are made with the C library's pow.
    std::uint64_t factors_of_other_pow = 0;
};

// Makes the recorded calls again, and fails the test where an answer is not the recorded one, or a
// factor differs from it otherwise than by another pow. Must run in a thread that has not compared
// reals.
Tally check(std::istream& records);

} // namespace golden

#endif
