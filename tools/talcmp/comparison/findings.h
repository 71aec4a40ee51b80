// What is found in pairs of elements, so that the findings of parts can be added up.

#pragma once

#include "digits.h"
#include "found_pairs.h"
#include "value_counts.h"

#include <cstdint>
#include <optional>

namespace talcmp {

// Over some of the pairs of elements; in whatever order parts are added, the sum is the same.
struct Totals {
    std::uint64_t pairs = 0;
    std::uint64_t differing = 0;    // not the same under the tolerance that is asked about
    DigitCounts digits = {};        // how many pairs differ in so many digits
    int needed_from_one = 1;        // the smallest tolerance from 1 on under which all are the same
    int worst_digits = 0;           // of any pair
    std::optional<FoundPair> worst; // the first that differs in so many digits
    ValueCounts values1, values2;
};

void add(Totals& sum, const Totals& part);

// The smallest whole tolerance, from 0 on, under which the arrays are the same; nothing where they
// are under none below `all_digits`.
std::optional<int> smallest_tolerance(const Totals& totals, int all_digits);

// What was found in some of the pairs.
struct Findings {
    FirstPairs first; // of those that differ
    Totals totals;    // where a report is asked for
};

// Adds what was found in others.
void add(Findings& sum, const Findings& findings);

} // namespace talcmp
