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
    NameFilter filter; // of members of archives; what is excluded also of files of folders
    bool json = false;
    bool quiet = false;
    bool verbose = false;
    std::string slice; // as it was given
    std::string first; // the operands
    std::string second;
};

// Returns what is asked; nothing where that was help or the version, which are printed already.
// Throws UsageError.
std::optional<CommandLine> read_command_line(int argc, const char* const* argv);

} // namespace talcmp
