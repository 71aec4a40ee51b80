// talcmp: are the arrays in two files the same, where are they not, and by how much?

#include "command_line.h"
#include "compare_operands.h"
#include "json_answers.h"
#include "process_setup.h"
#include "text_answers.h"
#include "trouble.h"

#include <cstdio>
#include <exception>
#include <memory>
#include <new>

namespace {

using talcmp::Summary;

std::unique_ptr<talcmp::Answers> answers_for(const talcmp::CommandLine& command_line) {
    if (command_line.json) {
        return std::make_unique<talcmp::JsonAnswers>(command_line);
    }
    return std::make_unique<talcmp::TextAnswers>(command_line,
                                                 talcmp::Terminal::of_standard_output());
}

int run(const int argc, const char* const* argv) {
    constexpr int trouble = 2;
    try {
        talcmp::set_up_process();
        Summary summary;
        if (const auto command_line = talcmp::read_command_line(argc, argv)) {
            talcmp::ProgressBar progress(!command_line->quiet);
            summary = compare_operands(*command_line, *answers_for(*command_line), progress);
        }
        // Output of a line too long for the buffer may have failed before the flush.
        if (std::fflush(stdout) != 0 || std::ferror(stdout) != 0) {
            throw talcmp::Trouble("standard output", "cannot be written");
        }
        return exit_status(summary);
    } catch (const talcmp::UsageError& error) {
        std::fprintf(stderr, "talcmp: %s; see 'talcmp --help'\n", error.what());
    } catch (const std::bad_alloc&) {
        std::fputs("talcmp: there is not enough memory\n", stderr);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "talcmp: %s\n", talcmp::shown(error.what()).c_str());
    }
    return trouble;
}

} // namespace

int main(int argc, char** argv) {
    return run(argc, argv);
}
