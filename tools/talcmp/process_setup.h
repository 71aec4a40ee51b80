// What a process has to be before talcmp opens a file.

#pragma once

namespace talcmp {

// Opens those of the three standard descriptors that are closed, so that no file gets the number of
// one: it would be read as standard input, or messages would be written to it. To read or write
// them fails as before. And has a file that becomes too large fail to be written, instead of ending
// the process. Throws Trouble.
void set_up_process();

} // namespace talcmp
