// What is said of a pair of elements: from which tolerance on they are the same, or why they are
// not.

#pragma once

#include "digits.h"

namespace talcmp {

enum class Reason {
    digits,                // the same from some tolerance on that is below all digits
    nans_of_the_same_bits, // the same under the tolerance 0 only
    different_integers,
    one_nan,
    two_nans,
    one_zero, // zero is the same only as zero
    opposite_signs,
    no_digit // in common
};

// Of complex numbers.
enum class Part { whole, real, imaginary };

struct Verdict {
    Sameness sameness;
    Reason reason = Reason::digits;
    Part part = Part::whole; // to which the reason applies
};

// Of the pair `i`, of which `sameness` is already known.
Verdict verdict_on(const Pairs& pairs, std::size_t i, Sameness sameness);

} // namespace talcmp
