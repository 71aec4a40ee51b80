// Outcomes as lines of text: on standard output, and trouble on standard error.

#ifndef TALCMP_TEXT_ANSWERS_H
#define TALCMP_TEXT_ANSWERS_H

#include "command_line.h"
#include "outcome.h"
#include "terminal.h"

namespace talcmp {

class TextAnswers : public Answers {
  public:
    TextAnswers(const CommandLine& command_line, const Terminal& terminal)
        : command_line_(command_line), terminal_(terminal) {}

    void begin(const bool many) override { many_ = many; }
    void tell(const Outcome& outcome) override;
    void finish(const Summary& summary) override;

  private:
    void tell_difference(const Outcome& outcome) const;

    const CommandLine& command_line_;
    Terminal terminal_;
    bool many_ = false;
};

// Tells trouble on standard error.
void complain(const std::string& message);

} // namespace talcmp

#endif
