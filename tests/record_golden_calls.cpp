// Prints what tests/golden_calls.txt holds:
//
//   build/release/tests/record_golden_calls >tests/golden_calls.txt
//
// To be run only where a changed answer is meant, or more kinds of calls are to be recorded.

#include "support/golden_calls.h"

#include <iostream>

int main() {
    constexpr std::uint64_t seed = 20;
    constexpr std::uint64_t blocks = 391; // 100,096 calls
    golden::record(std::cout, seed, blocks);
    return std::cout.flush() ? 0 : 1;
}
