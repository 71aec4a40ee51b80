// The whole command, from its words to its exit status.

#pragma once

#include "compare_operands.h"
#include "terminal.h"

namespace talcmp {

// What a process of the command has around it.
struct Surroundings {
    Terminal output;      // where standard output goes to
    int status_terminal;  // the descriptor of the terminal that shows standard error
    bool speaks;          // whether this process prints anything
    MakeGroup make_group; // the processes that compare together
    // Told of what keeps this process from going on.
    void (*complain)(const std::string& text);
};

// Prints a message.
void complain(const std::string& text);

// Returns the exit status: that of the summary, 2 if there was trouble with the command itself.
int run(int argc, const char* const* argv, const Surroundings& surroundings);

} // namespace talcmp
