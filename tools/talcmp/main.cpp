// talcmp: are the arrays in two files the same, where are they not, and by how much?

#include "command_line.h"
#include "compare_operands.h"
#include "drawing.h"
#include "json_answers.h"
#include "process_setup.h"
#include "text_answers.h"
#include "text_map.h"
#include "trouble.h"

#include <cstdio>
#include <exception>
#include <memory>
#include <new>

namespace {

using talcmp::Summary;

using talcmp::Shape;

// Maps for what prints or draws them: first that of a report on a terminal, last that of a picture.
void ask_for_maps(talcmp::CommandLine& command_line, const talcmp::Terminal& terminal) {
    auto& maps = command_line.question.maps;
    if (command_line.report && !command_line.json && terminal.is_terminal()) {
        const int columns = terminal.columns();
        maps.emplace_back(
            [columns](const Shape& shape) { return talcmp::room_of_text(shape, columns); });
    }
    if (!command_line.picture.empty()) {
        maps.emplace_back([](const Shape& /*shape*/) { return talcmp::room_of_picture; });
    }
}

std::unique_ptr<talcmp::Answers> answers_for(const talcmp::CommandLine& command_line,
                                             const talcmp::Terminal& terminal) {
    if (command_line.json) {
        return std::make_unique<talcmp::JsonAnswers>(command_line);
    }
    return std::make_unique<talcmp::TextAnswers>(command_line, terminal);
}

int run(const int argc, const char* const* argv) {
    constexpr int trouble = 2;
    try {
        talcmp::set_up_process();
        Summary summary;
        if (auto command_line = talcmp::read_command_line(argc, argv)) {
            const auto terminal = talcmp::Terminal::of_standard_output();
            ask_for_maps(*command_line, terminal);
            talcmp::ProgressBar progress(!command_line->quiet);
            summary =
                compare_operands(*command_line, *answers_for(*command_line, terminal), progress);
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
