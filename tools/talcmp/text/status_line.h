// A last line on the terminal that disappears when something else is written there.

#pragma once

#include <string>

namespace talcmp {

// Shows `text`, shorter than a line, on standard error in place of what was shown before.
void show_status(const std::string& text);

// Takes the line off the terminal, if it is there.
void clear_status();

// From now on SIGHUP, SIGINT and SIGTERM, unless they were ignored, take the line off before they
// end the process as they do without it.
void clear_status_at_signals();

} // namespace talcmp
