// A report for people.

#pragma once

#include "comparison.h"
#include "terminal.h"
#include "wording.h"

#include <string>

namespace talcmp {

// Lines of names and figures, and a bar for each number of digits in which pairs differ.
std::string report_text(const Comparison& comparison, const Question& question,
                        const Terminal& terminal, Spelling spelling = Spelling::command);

} // namespace talcmp
