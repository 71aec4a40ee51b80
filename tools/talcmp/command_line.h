// The command line of talcmp.

#pragma once

#include "operands.h"
#include "options.h"
#include "question.h"

#include <optional>
#include <string>

namespace talcmp {

struct CommandLine {
    Question question;
    NameFilter filter; // for members of archives; exclusions also for files in folders
    bool json = false;
    bool quiet = false;
    bool verbose = false;
    std::string slice; // as it was given
    std::string first; // the operands
    std::string second;
};

// Returns what is asked; nothing if that was the help or the version, which has then been printed.
// Throws UsageError.
std::optional<CommandLine> read_command_line(int argc, const char* const* argv);

} // namespace talcmp
