// A report for people.

#ifndef TALCMP_REPORT_TEXT_H
#define TALCMP_REPORT_TEXT_H

#include "comparison.h"
#include "terminal.h"

#include <string>

namespace talcmp {

// Lines of names and figures, and a bar for each number of digits that pairs differ in.
std::string report_text(const Comparison& comparison, const Question& question,
                        const Terminal& terminal);

} // namespace talcmp

#endif
