// What a comparison found, in words.

#pragma once

#include "comparison.h"

#include <string>

namespace talcmp {

// A value in digits that read back as the same value, a NaN as its bits. If the types differ, a
// single is written as a double; otherwise 0.1 in singles and 0.1 in doubles would look alike.
std::string first_value_text(const Comparison& comparison, const Place& place);
std::string second_value_text(const Comparison& comparison, const Place& place);

// Why the two are not the same: "the same from --tol 15 on", "no digit in common", "a NaN", ...
std::string reason_text(const Verdict& verdict);

// "[1, 2]: 0.5 and 0.75 (the same from --tol 52 on)"
std::string place_text(const Comparison& comparison, const Place& place);

// How two different arrays differ: "shape (2, 3) and (3, 2)", "type int32 and float64", or the
// first place that differs.
std::string difference_text(const Comparison& comparison);

// Why a report has no smallest tolerance.
std::string reason_of_no_tolerance(const Comparison& comparison);

} // namespace talcmp
