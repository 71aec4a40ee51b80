// What is found in pairs of elements, so that the findings of parts can be added up.

#pragma once

#include "digits.h"
#include "found_pairs.h"
#include "largest_differences.h"
#include "value_counts.h"

#include <cstdint>
#include <optional>

namespace talcmp {

// Totals over some of the pairs of elements. The sum is the same in whatever order parts are added.
struct Totals {
    std::uint64_t pairs = 0;
    std::uint64_t differing = 0;    // not the same under the tolerance that is asked about
    DigitCounts digits = {};        // how many pairs differ in each number of digits
    int needed_from_one = 1;        // the least tolerance from 1 under which all are the same
    int worst_digits = 0;           // of any pair
    std::optional<FoundPair> worst; // the first that differs in that many digits
    ValueCounts values1, values2;
    LargestDifferences largest;
    std::uint64_t ignored = 0; // pairs that the mask leaves out; they are counted nowhere else
};

void add(Totals& sum, const Totals& part);

// The smallest whole tolerance, from 0, under which the arrays are the same; nothing if there is
// none below `all_digits`.
std::optional<int> smallest_tolerance(const Totals& totals, int all_digits);

// What was found in some of the pairs.
struct Findings {
    FirstPairs first; // of those that differ
    Totals totals;    // if a report is asked for
};

// Adds what was found in others.
void add(Findings& sum, const Findings& findings);

} // namespace talcmp
