// Random calls of the module, each checked against the oracle.

#pragma once

#include <cstdint>
#include <vector>

namespace oracle {

// The environment variables TALNUMERICARRAY_RANDOM_CALLS and TALNUMERICARRAY_SEED; where they are
// unset, the number that the build was configured with, and a new seed. They throw where a variable
// is not a number.
std::uint64_t requested_calls();
std::uint64_t requested_seed();

// Prints the requested seed, and returns it.
std::uint64_t printed_seed();

struct Tally {
    std::uint64_t calls = 0;
    std::uint64_t same = 0;
    std::uint64_t mismatches = 0;
    bool answered[2][12][12] = {};
};

// Must run in a thread that has not compared reals yet, as the oracle starts with a new State.
// Tolerances are random unless a list is given. Stops after ten mismatches.
Tally run_checked_calls(std::uint64_t seed, std::uint64_t calls,
                        const std::vector<double>& tolerances = {});

} // namespace oracle
