// What has to be set up in the process before talcmp opens a file.

#pragma once

namespace talcmp {

// Opens those of the three standard descriptors that are closed, so that no file gets one of their
// numbers: it would be read as standard input, or messages would be written to it. Reading or
// writing these descriptors fails as before. Also makes writing a file that becomes too large fail,
// instead of ending the process. Throws Trouble.
void set_up_process();

} // namespace talcmp
