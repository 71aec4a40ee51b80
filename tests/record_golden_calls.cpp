// Prints what tests/golden_calls.txt holds:
//
//   build/release/tests/record_golden_calls >tests/golden_calls.txt
//
// To be run only if an answer is meant to change, or if what random_arrays.h draws has changed.

#include "support/golden_calls.h"

#include <iostream>

int main() {
    constexpr std::uint64_t seed = 20;
    constexpr std::uint64_t blocks = 391; // 100,096 calls
    golden::record(std::cout, seed, blocks);
    return std::cout.flush() ? 0 : 1;
}
