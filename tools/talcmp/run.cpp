#include "run.h"

#include "command_line.h"
#include "drawing.h"
#include "json_answers.h"
#include "process_setup.h"
#include "progress_bar.h"
#include "text_answers.h"
#include "text_map.h"
#include "trouble.h"

#include <cstdio>
#include <exception>
#include <memory>
#include <new>

namespace talcmp {
namespace {

// Maps for what prints or draws them: first that of a report on a terminal, last that of a picture.
void ask_for_maps(CommandLine& command_line, const Terminal& terminal) {
    auto& maps = command_line.question.maps;
    if (command_line.report && !command_line.json && terminal.is_terminal()) {
        const int columns = terminal.columns();
        maps.emplace_back([columns](const Shape& shape) { return room_of_text(shape, columns); });
    }
    if (!command_line.picture.empty()) {
        maps.emplace_back([](const Shape& /*shape*/) { return room_of_picture; });
    }
}

std::unique_ptr<Answers> answers_for(const CommandLine& command_line, const Terminal& terminal) {
    if (command_line.json) {
        return std::make_unique<JsonAnswers>(command_line);
    }
    return std::make_unique<TextAnswers>(command_line, terminal);
}

Summary answer(const int argc, const char* const* argv, const Surroundings& surroundings) {
    set_up_process();
    CommandLine command_line = read_command_line(argc, argv);
    if (!command_line.text.empty()) {
        if (surroundings.speaks) {
            std::fputs(command_line.text.c_str(), stdout);
        }
        return {};
    }
    if (surroundings.speaks && !command_line.note.empty()) {
        std::fprintf(stderr, "talcmp: note: %s\n", command_line.note.c_str());
    }
    ask_for_maps(command_line, surroundings.output);
    ProgressBar progress(surroundings.speaks && !command_line.quiet, surroundings.status_terminal);
    return compare_operands(command_line, *answers_for(command_line, surroundings.output), progress,
                            surroundings.make_group);
}

} // namespace

void complain(const std::string& text) {
    std::fprintf(stderr, "talcmp: %s\n", text.c_str());
}

int run(const int argc, const char* const* argv, const Surroundings& surroundings) {
    constexpr int trouble = 2;
    try {
        const Summary summary = answer(argc, argv, surroundings);
        // Output of a line too long for the buffer may have failed before the flush.
        if (std::fflush(stdout) != 0 || std::ferror(stdout) != 0) {
            throw Trouble("standard output", "cannot be written");
        }
        return exit_status(summary);
    } catch (const UsageError& error) {
        if (surroundings.speaks) {
            complain(std::string(error.what()) + "; see 'talcmp --help'");
        }
    } catch (const std::bad_alloc&) {
        surroundings.complain("there is not enough memory");
    } catch (const std::exception& error) {
        surroundings.complain(shown(error.what()));
    }
    return trouble;
}

} // namespace talcmp
