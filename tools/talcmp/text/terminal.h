// What a terminal needs that a file or a pipe does not.

#pragma once

#include <string>

namespace talcmp {

enum class Colour { red, green, blue };

// What standard output is.
class Terminal {
  public:
    // Colours are shown on a terminal that takes escape sequences, unless the environment variable
    // NO_COLOR is set.
    static Terminal of_standard_output();

    Terminal(const bool colours, const int columns) : colours_(colours), columns_(columns) {}

    std::string coloured(const std::string& text, Colour colour) const;

    // Characters in a line.
    int columns() const { return columns_; }

  private:
    bool colours_;
    int columns_;
};

// Whether a terminal takes escape sequences: the environment variable TERM names it, and not as
// "dumb".
bool takes_escapes();

// Characters in a line of the terminal `descriptor`; 80 where it is none.
int columns_of(int descriptor);

} // namespace talcmp
