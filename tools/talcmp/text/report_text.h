// A report for people.

#ifndef TALCMP_REPORT_TEXT_H
#define TALCMP_REPORT_TEXT_H

#include "comparison.h"
#include "terminal.h"

#include <optional>
#include <string>

namespace talcmp {

// Lines of names and figures, and a bar for each number of digits that pairs differ in.
std::string report_text(const Comparison& comparison, const Question& question,
                        const Terminal& terminal);

// The smallest whole tolerance, from 0 on, under which the arrays are the same; nothing where that
// is none or one of all digits, which says nothing of them. Of a comparison with a report.
std::optional<int> smallest_tolerance(const Comparison& comparison);

// Why there is none.
std::string reason_of_no_tolerance(const Comparison& comparison);

} // namespace talcmp

#endif
