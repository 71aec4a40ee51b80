// The outcome for each pair of arrays that belong together, and the totals.

#pragma once

#include "comparison.h"

#include <cstdint>
#include <string>

namespace talcmp {

struct Outcome {
    enum class Kind { same, different, only_in_first, only_in_second, trouble, skipped };
    Kind kind = Kind::same;
    // What the two arrays are called. For a missing counterpart: where it would be.
    std::string first;
    std::string second;
    std::string name;      // of an array that has no counterpart, in a folder or an archive
    Comparison comparison; // if the kind is same or different
    std::string message;   // if there was trouble, or why they are skipped
    std::string process;   // that found it, if it was not this one
};

// How many outcomes there were of each kind.
struct Summary {
    std::uint64_t same = 0;
    std::uint64_t different = 0;
    std::uint64_t only_in_first = 0;
    std::uint64_t only_in_second = 0;
    std::uint64_t trouble = 0;
    std::uint64_t skipped = 0;     // members that are no arrays of numbers
    std::uint64_t other_files = 0; // in folders, with names that files of arrays do not have
    bool many = false;             // whether folders, patterns or members were matched by name
    bool stopped = false;          // whether the rest was left out, after the first difference
};

void count(Summary& summary, Outcome::Kind kind);

std::uint64_t total(const Summary& summary);

// The exit statuses of cmp and diff: 0 the same, 1 different, 2 trouble; the worst there was.
int exit_status(const Summary& summary);

// A way to report outcomes.
class Answers {
  public:
    Answers() = default;
    Answers(const Answers&) = delete;
    Answers& operator=(const Answers&) = delete;
    virtual ~Answers() = default;

    // Before the first outcome.
    virtual void begin() = 0;

    // Trouble is on standard error already.
    virtual void print(const Outcome& outcome) = 0;

    // After the last outcome.
    virtual void finish(const Summary& summary) = 0;
};

} // namespace talcmp
