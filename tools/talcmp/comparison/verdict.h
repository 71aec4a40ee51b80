// What is said about a pair of elements: the tolerance from which they are the same, or why they
// are not.

#pragma once

#include "digits.h"

namespace talcmp {

enum class Reason {
    digits,                // the same from some tolerance below all digits
    nans_of_the_same_bits, // the same under the tolerance 0 only
    different_integers,
    one_nan,
    two_nans,
    one_zero, // zero is the same only as zero
    opposite_signs,
    no_digit // in common
};

// The parts of complex numbers.
enum class Part { whole, real, imaginary };

struct Verdict {
    Sameness sameness;
    Reason reason = Reason::digits;
    Part part = Part::whole; // to which the reason applies
};

// The verdict on the pair `i`, whose `sameness` is already known.
Verdict verdict_on(const Pairs& pairs, std::size_t i, Sameness sameness);

} // namespace talcmp
