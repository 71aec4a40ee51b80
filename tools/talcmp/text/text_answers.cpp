#include "text_answers.h"

#include "report_text.h"
#include "shown.h"
#include "text_map.h"
#include "wording.h"

#include <cstdio>

namespace talcmp {
namespace {

void print_line(const std::string& line) {
    std::printf("%s\n", line.c_str());
}

std::string summary_text(const Summary& summary) {
    std::string text = std::to_string(summary.same) + " the same, "
                       + std::to_string(summary.different) + " different, "
                       + std::to_string(summary.only_in_first) + " only in the first, "
                       + std::to_string(summary.only_in_second) + " only in the second, "
                       + std::to_string(summary.trouble) + " in trouble";
    if (summary.skipped != 0) {
        text += ", " + std::to_string(summary.skipped) + " skipped";
    }
    if (summary.other_files != 0) {
        text += "; " + std::to_string(summary.other_files) + " other "
                + (summary.other_files == 1 ? "file" : "files");
    }
    return text + (summary.stopped ? "; stopped at the first difference" : "");
}

} // namespace

void TextAnswers::print(const Outcome& outcome) {
    if (command_line_.quiet || outcome.kind == Outcome::Kind::trouble) {
        return;
    }
    if (outcome.kind == Outcome::Kind::skipped) {
        print_line(shown(outcome.first) + " " + shown(outcome.second)
                   + " are skipped: " + outcome.message);
    } else if (outcome.kind != Outcome::Kind::same) {
        print_difference(outcome);
    } else if (command_line_.verbose || command_line_.report) {
        print_line(shown(outcome.first) + " " + shown(outcome.second) + " "
                   + terminal_.coloured("are the same", Colour::green)
                   + remark_on_sameness(outcome.comparison));
    }
    const bool compared =
        outcome.kind == Outcome::Kind::same || outcome.kind == Outcome::Kind::different;
    if (compared && command_line_.report) {
        const auto text = report_text(outcome.comparison, command_line_.question, terminal_);
        std::fputs(text.c_str(), stdout);
        print_map(outcome.comparison);
    }
}

// The first map is the one that was asked for here.
void TextAnswers::print_map(const Comparison& comparison) const {
    if (terminal_.is_terminal() && !comparison.maps.empty()) {
        const int digits = all_digits(*comparison.array1.type, *comparison.array2.type);
        const std::string text =
            text_map(*comparison.maps.front(), digits, character_set_of_environment(), terminal_);
        std::fputs(text.c_str(), stdout);
    }
}

void TextAnswers::print_difference(const Outcome& outcome) const {
    const std::string begin = shown(outcome.first) + " " + shown(outcome.second) + " "
                              + terminal_.coloured("differ", Colour::red) + ": ";
    const Comparison& comparison = outcome.comparison;
    if (outcome.kind != Outcome::Kind::different) {
        const bool first = outcome.kind == Outcome::Kind::only_in_first;
        print_line(begin + "only in " + shown(first ? outcome.first : outcome.second) + ": "
                   + shown(outcome.name));
    } else if (comparison.difference != Difference::elements) {
        print_line(begin + difference_text(comparison));
    } else {
        for (const Place& place : comparison.places) {
            print_line(begin + place_text(comparison, place));
        }
    }
}

void TextAnswers::finish(const Summary& summary) {
    if (summary.many && !command_line_.quiet) {
        print_line(summary_text(summary));
    }
}

} // namespace talcmp
