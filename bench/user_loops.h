// What a program without the library would write: one plain loop over two arrays, for every pair of
// element types that the library has a loop for.

#pragma once

#include "type_properties.h"

// Whether two arrays of `len` are the same; two reals are if they differ by at most `relative`
// times the larger magnitude.
using UserLoop = bool (*)(double relative, const void* data1, const void* data2, talint len);

// The loop of the two types with these ids: compiled with the flags of the library, and for this
// very processor. The code of both is the same.
UserLoop user_loop(type_t id1, type_t id2);
UserLoop user_loop_for_this_processor(type_t id1, type_t id2);
