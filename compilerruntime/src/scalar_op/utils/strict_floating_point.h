// Stops builds without IEEE arithmetic, and keeps NEON out of the comparison of singles.
//
// The comparison of reals is defined step by step in IEEE arithmetic of the operands' own width. A
// compiler that is allowed to assume that there are no NaNs, to reassociate, to use reciprocals or
// to keep excess precision can silently change answers. GCC has had a macro for each of these since
// version 12; earlier versions and Clang have them only for -ffast-math and -ffinite-math-only.

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

// Functions between NESK_STRICT_SINGLES_BEGIN and NESK_STRICT_SINGLES_END compare singles in IEEE
// arithmetic on 32-bit ARM too.
//
// There NEON takes subnormal numbers for zero. GCC leaves floating point to VFP for that reason.
// Clang vectorises loops of comparisons, and 1e-40 becomes the same as 0. So under Clang these
// functions are compiled without NEON, and are not inlined into code that has it. LLVM inlines
// across feature differences only for allow-listed features; wide-stride-vfp isn't listed and
// affects only register allocation, so flipping it blocks inlining. It is off by default, except on
// the Swift processor. Files compiled without NEON flip it too, as link-time optimisation may
// combine them with others. Only a caller marked [[gnu::flatten]] still inlines these functions.
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
