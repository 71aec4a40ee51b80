// Runs talcmp as a child process, without a shell.

#pragma once

#include <string>
#include <vector>

struct ProcessResult {
    int status = -1;    // the exit status
    std::string output; // on standard output
    std::string errors; // on standard error
    long memory = 0; // the greatest resident memory in KiB, that of the test at the start included
};

// Where the child's standard output goes; `with_errors` is to the same file as standard error.
enum class Output { captured, closed, full, with_errors };

// Fails the test if a signal ends the child, as one does when the child takes too long.
ProcessResult run_talcmp(const std::vector<std::string>& arguments,
                         Output output = Output::captured);

// Expects exit status 2, nothing on standard output, and on standard error one line of printable
// characters that begins with "talcmp: " and `beginning` and contains `fragment`.
void expect_trouble(const ProcessResult& outcome, const std::string& beginning,
                    const std::string& fragment);
