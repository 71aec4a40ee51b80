// From the operands to their outcomes.

#pragma once

#include "command_line.h"
#include "outcome.h"
#include "progress_bar.h"

namespace talcmp {

// Compares what the operands stand for, array by array, and reports each outcome when it is known.
// Trouble with the operands, or with two of their files, is an outcome too.
Summary compare_operands(const CommandLine& command_line, Answers& answers, ProgressBar& progress);

} // namespace talcmp
