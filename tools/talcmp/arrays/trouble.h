// What keeps talcmp from an answer.

#pragma once

#include "shown.h"

#include <stdexcept>
#include <string>

namespace talcmp {

// A file that cannot be compared. The text names the file, what is wrong and, where there is
// something to do, what to do.
class Trouble : public std::runtime_error {
  public:
    Trouble(const std::string& file, const std::string& what_is_wrong)
        : std::runtime_error(shown(file) + ": " + shown(what_is_wrong)) {}

    // With the text of another trouble.
    explicit Trouble(const std::string& text) : std::runtime_error(text) {}
};

// An array that can be read but holds no numbers that talcmp compares, such as text.
class NotNumbers : public Trouble {
  public:
    using Trouble::Trouble;
};

class OutOfMemory : public Trouble {
  public:
    using Trouble::Trouble;
};

} // namespace talcmp
