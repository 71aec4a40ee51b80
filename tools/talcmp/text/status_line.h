// A line at the end of what is on the terminal, which is gone when something else is written there.

#pragma once

#include <string>

namespace talcmp {

// Shows `text`, of less than a line, on standard error instead of what was shown before.
void show_status(const std::string& text);

// Takes the line off the terminal, if it is there.
void clear_status();

// From now on SIGHUP, SIGINT and SIGTERM, unless they were ignored, take the line off before they
// end the process as they do without it.
void clear_status_at_signals();

} // namespace talcmp
