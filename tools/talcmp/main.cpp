// talcmp: are the arrays in two files the same?
//
// Prints nothing when they are; else one line that says how they first differ.

#include "command_line.h"
#include "difference.h"
#include "difference_text.h"
#include "open_array.h"
#include "trouble.h"

#include <cstdio>
#include <exception>
#include <memory>
#include <string>

namespace {

// The exit statuses of cmp and diff.
enum ExitStatus { same = 0, different = 1, trouble = 2 };

ExitStatus compare(const talcmp::CommandLine& command_line) {
    const auto first = talcmp::open_array(command_line.first);
    const auto second = talcmp::open_array(command_line.second);
    const auto difference = talcmp::first_difference(*first, *second, command_line.question);
    if (!difference) {
        return same;
    }
    const std::string text = talcmp::difference_text(*difference, *first, *second);
    std::printf("%s %s differ: %s\n", command_line.first.c_str(), command_line.second.c_str(),
                text.c_str());
    return different;
}

ExitStatus run(const int argc, const char* const* argv) {
    try {
        const auto command_line = talcmp::read_command_line(argc, argv);
        const ExitStatus status = command_line ? compare(*command_line) : same;
        // A line too long for the buffer may have failed before the flush.
        if (std::fflush(stdout) != 0 || std::ferror(stdout) != 0) {
            throw talcmp::Trouble("standard output", "cannot be written");
        }
        return status;
    } catch (const talcmp::UsageError& error) {
        std::fprintf(stderr, "talcmp: %s; see 'talcmp --help'\n", error.what());
    } catch (const std::exception& error) {
        std::fprintf(stderr, "talcmp: %s\n", error.what());
    }
    return trouble;
}

} // namespace

int main(int argc, char** argv) {
    return run(argc, argv);
}
