// Stops a build in which floating-point arithmetic does not mean what is written, and keeps NEON
// from taking part where it does not.
//
// The comparison of reals is defined step by step in IEEE arithmetic of the operands' own width. A
// compiler that may assume that there are no NaNs, reassociate, take reciprocals or keep excess
// precision can give other answers, silently. GCC tells of each of these from version 12 on;
// earlier ones and Clang only of -ffast-math and -ffinite-math-only.

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

// Between NESK_STRICT_SINGLES_BEGIN and its end, functions compare singles as IEEE says on 32-bit
// ARM too.
//
// There NEON takes subnormal numbers for zero. GCC leaves floating point to VFP for that reason,
// whereas Clang vectorises loops of comparisons, in whose answers 1e-40 is then the same as 0. So
// these functions are compiled without NEON, and are not inlined into code that has it: LLVM
// inlines a function only where all features outside a list of its own agree with the caller's. One
// that is not in the list, and changes no result, says how registers of VFP are handed out; here it
// is set against the default, which is off but for one processor. The same goes for files compiled
// without NEON, as a program that is optimised when it is linked may have others with it. Only a
// caller marked [[gnu::flatten]] takes these functions in all the same.
#if defined(__clang__) && defined(__arm__)
// clang-format off
#    if defined(__ARM_ARCH_7S__)
#        define NESK_STRICT_SINGLES_BEGIN \
            _Pragma("clang attribute push(__attribute__((target(\"no-neon,no-wide-stride-vfp\"))), apply_to = function)")
#    else
#        define NESK_STRICT_SINGLES_BEGIN \
            _Pragma("clang attribute push(__attribute__((target(\"no-neon,wide-stride-vfp\"))), apply_to = function)")
#    endif
// clang-format on
#    define NESK_STRICT_SINGLES_END _Pragma("clang attribute pop")
#else
#    define NESK_STRICT_SINGLES_BEGIN
#    define NESK_STRICT_SINGLES_END
#endif

#endif
