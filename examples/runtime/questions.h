// What both programs ask the runtime, however they have come by its function.

#ifndef QUESTIONS_H
#define QUESTIONS_H

#include "small_runtime.h"

using BytesToStore = decltype(&small_runtime_bytes_to_store);

// Asks from several threads at once, each with a tolerance of its own. Prints what was found and
// returns the exit status of the program: 0 when every answer was right, else 1.
int ask_from_threads(BytesToStore bytes_to_store);

#endif
