// How much of a long loop over lengths, places and draws a test makes.

#ifndef TALNUMERICARRAY_TESTS_EMULATION_H
#define TALNUMERICARRAY_TESTS_EMULATION_H

#include <cstddef>

// An emulator takes twenty times as long, and a build that counts lines nearly so. There only every
// so many-th step is made of loops that are the same code everywhere and run in full elsewhere.
#ifdef TALNUMERICARRAY_SLOW
inline constexpr std::size_t emulated_stride = 8;
#else
inline constexpr std::size_t emulated_stride = 1;
#endif

#endif
