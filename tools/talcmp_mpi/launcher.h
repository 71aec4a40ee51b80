// The program that starts the ranks, through which their output goes.

#pragma once

#include "descriptor.h"

namespace talcmp {

// What shows what is written to `descriptor`: the launcher's own one of the same number if there is
// a launcher on this machine. It gives ranks a terminal even where its own output goes to a file,
// and a pipe even where that goes to a terminal.
Descriptor shown_by_launcher(int descriptor);

} // namespace talcmp
