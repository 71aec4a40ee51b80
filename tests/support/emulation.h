// How many steps of a long loop over lengths, places and draws a test makes.

#pragma once

#include <cstddef>

// An emulator takes twenty times as long, and so does a build that is not optimised. There, only
// every eighth step is made of loops that are the same code on every platform and that optimised
// builds for this machine run in full.
#if defined(TALNUMERICARRAY_EMULATED) || !defined(__OPTIMIZE__)
inline constexpr std::size_t emulated_stride = 8;
#else
inline constexpr std::size_t emulated_stride = 1;
#endif
