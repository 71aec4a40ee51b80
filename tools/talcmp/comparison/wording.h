// What a comparison found, in words.

#pragma once

#include "comparison.h"

#include <string>

namespace talcmp {

// How options are written where words name them.
enum class Spelling { command, python };

// A tolerance as the option that asks for it: "--tol 15" or "tol=15".
std::string option_text(int tolerance, Spelling spelling);

// A value in digits that read back as the same value, a NaN as its bits. If the types differ, a
// single is written as a double; otherwise 0.1 in singles and 0.1 in doubles would look alike.
std::string first_value_text(const Comparison& comparison, const Place& place);
std::string second_value_text(const Comparison& comparison, const Place& place);

// Why the two are not the same: "the same from --tol 15 on", "no digit in common", "a NaN", ...
std::string reason_text(const Verdict& verdict, Spelling spelling = Spelling::command);

// "[1, 2]: 0.5 and 0.75 (the same from --tol 52 on)"
std::string place_text(const Comparison& comparison, const Place& place,
                       Spelling spelling = Spelling::command);

// How two different arrays differ: "shape (2, 3) and (3, 2)", "type int32 and float64", or the
// first place that differs.
std::string difference_text(const Comparison& comparison, Spelling spelling = Spelling::command);

// Why two arrays are the same though no numbers are: " (no elements)"; empty if numbers are.
std::string remark_on_sameness(const Comparison& comparison);

// Why a report has no smallest tolerance.
std::string reason_of_no_tolerance(const Comparison& comparison,
                                   Spelling spelling = Spelling::command);

} // namespace talcmp
