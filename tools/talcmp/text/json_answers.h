// Outcomes as one JSON document on standard output, which talcmp.schema.json describes.

#pragma once

#include "command_line.h"
#include "outcome.h"

#include <memory>

namespace talcmp {

class JsonWriter;

// Prints each outcome at once.
class JsonAnswers : public Answers {
  public:
    explicit JsonAnswers(const CommandLine& command_line);
    JsonAnswers(const JsonAnswers&) = delete;
    JsonAnswers& operator=(const JsonAnswers&) = delete;
    ~JsonAnswers() override;

    void begin() override;
    void print(const Outcome& outcome) override;
    void finish(const Summary& summary) override;

  private:
    const CommandLine& command_line_;
    std::unique_ptr<JsonWriter> writer_;
};

} // namespace talcmp
