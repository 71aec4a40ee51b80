// From the operands to their outcomes.

#pragma once

#include "command_line.h"
#include "outcome.h"
#include "process_group.h"
#include "progress_listener.h"

#include <functional>
#include <memory>

namespace talcmp {

// Makes the group of processes, which reports outcomes of the question by the function that it is
// given.
using MakeGroup = std::function<std::unique_ptr<ProcessGroup>(Reporter, const Question&)>;

// Compares what the operands stand for, array by array, and reports each outcome when it is known.
// Trouble with the operands, or with two of their files, is an outcome too. The summary is whole in
// the process that leads.
Summary compare_operands(const CommandLine& command_line, Answers& answers,
                         ProgressListener& progress, const MakeGroup& make_group);

} // namespace talcmp
