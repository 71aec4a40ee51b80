// From the operands to their outcomes.

#ifndef TALCMP_COMPARE_OPERANDS_H
#define TALCMP_COMPARE_OPERANDS_H

#include "command_line.h"
#include "outcome.h"
#include "progress_bar.h"

namespace talcmp {

// Compares what the operands stand for, array by array, and tells each outcome when it is known.
// Throws Trouble where the operands stand for nothing; trouble with one file is an outcome.
Summary compare_operands(const CommandLine& command_line, Answers& answers, ProgressBar& progress);

} // namespace talcmp

#endif
