// Random calls with the answers of one platform, which every other has to repeat.
//
// After a title and the seed, from which every platform draws the same calls, there is a line for
// each block of calls:
//
//   DIGEST ANSWERS
//
// The digest of the calls differs if a platform draws others. Each hexadecimal digit of the answers
// stands for four calls, its highest bit for the first; a bit is set if the arrays are the same.

#pragma once

#include <cstdint>
#include <istream>
#include <ostream>

namespace golden {

constexpr std::uint64_t calls_per_block = 256;

// Records random calls as this build answers them; throws if the oracle answers otherwise. Must
// run in a thread that has not compared reals.
void record(std::ostream& records, std::uint64_t seed, std::uint64_t blocks);

struct Tally {
    std::uint64_t factors = 0;
    std::uint64_t calls = 0;
    std::uint64_t same = 0;
    std::uint64_t pairs_of_types = 0;

    // Factors one unit in the last place off the rounded ones, as those of fractional tolerances
    // may be: they are made with the C library's pow.
    std::uint64_t factors_rounded_otherwise = 0;
};

// Makes the calls, and fails the test if others are drawn than were recorded, an answer is not the
// recorded one, or a factor is further than that from the rounded one. Must run in a thread that
// has not compared reals.
Tally check(std::istream& records);

} // namespace golden
