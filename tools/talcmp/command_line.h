// The command line of talcmp.

#pragma once

#include "operands.h"
#include "options.h"
#include "question.h"

#include <optional>
#include <string>

namespace talcmp {

struct CommandLine {
    std::string text; // of --help or --version, which is all that was asked
    std::string note; // for the user, if there is something to say
    Question question;
    NameFilter filter;   // for members of archives; exclusions also for files in folders
    bool report = false; // whether it is printed
    bool json = false;
    bool quiet = false;
    bool verbose = false;
    bool skip_others = false; // whether members that are no arrays of numbers are no trouble
    bool only_first = false;  // whether the run stops at the first difference
    std::string slice;        // as it was given
    std::string ignore;       // the mask as it was given
    std::string picture;      // the file to draw to, if there is one
    std::string first;        // the operands
    std::string second;
};

// Throws UsageError.
CommandLine read_command_line(int argc, const char* const* argv);

} // namespace talcmp
