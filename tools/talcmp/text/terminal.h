// What output to a terminal needs that output to a file or a pipe does not.

#pragma once

#include <string>

namespace talcmp {

enum class Colour { red, green, blue };

// What output goes to.
class Terminal {
  public:
    // Colours are shown on a terminal that takes escape sequences, unless the environment variable
    // NO_COLOR is set.
    static Terminal of(int descriptor);

    Terminal(const bool is_terminal, const bool colours, const int columns)
        : is_terminal_(is_terminal), colours_(colours), columns_(columns) {}

    bool is_terminal() const { return is_terminal_; }

    std::string coloured(const std::string& text, Colour colour) const;

    // Characters in a line.
    int columns() const { return columns_; }

  private:
    bool is_terminal_;
    bool colours_;
    int columns_;
};

// Whether a terminal takes escape sequences: the environment variable TERM names one other than
// "dumb".
bool takes_escapes();

// Characters in a line of the terminal `descriptor`; 80 if it is not a terminal.
int columns_of(int descriptor);

} // namespace talcmp
