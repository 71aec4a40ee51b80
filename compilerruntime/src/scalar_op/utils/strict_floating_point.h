// Stops a build in which floating-point arithmetic does not mean what is written.
//
// The comparison of reals is defined step by step in IEEE arithmetic of the operands' own width. A
// compiler that may assume that there are no NaNs, reassociate, take reciprocals or keep excess
// precision can give other answers, silently. GCC tells of each of these; Clang only of -ffast-math
// and -ffinite-math-only.

#ifndef NESK_STRICT_FLOATING_POINT_H
#define NESK_STRICT_FLOATING_POINT_H

#include <cfloat>

#if defined(__FAST_MATH__) || (defined(__FINITE_MATH_ONLY__) && __FINITE_MATH_ONLY__ != 0)         \
    || defined(__ASSOCIATIVE_MATH__) || defined(__RECIPROCAL_MATH__)                               \
    || defined(__NO_SIGNED_ZEROS__) || defined(_M_FP_FAST)
#    error "array comparison needs IEEE arithmetic: build without -ffast-math and its parts"
#endif

#if FLT_EVAL_METHOD != 0
#    error                                                                                         \
        "array comparison needs arithmetic without excess precision (FLT_EVAL_METHOD 0): on x86 build with -msse2 -mfpmath=sse"
#endif

#endif
