// Outcomes as lines of text on standard output.

#pragma once

#include "command_line.h"
#include "outcome.h"
#include "terminal.h"

namespace talcmp {

class TextAnswers : public Answers {
  public:
    TextAnswers(const CommandLine& command_line, const Terminal& terminal)
        : command_line_(command_line), terminal_(terminal) {}

    void begin() override {}
    void print(const Outcome& outcome) override;
    void finish(const Summary& summary) override;

  private:
    void print_difference(const Outcome& outcome) const;
    void print_map(const Comparison& comparison) const;

    const CommandLine& command_line_;
    Terminal terminal_;
};

} // namespace talcmp
