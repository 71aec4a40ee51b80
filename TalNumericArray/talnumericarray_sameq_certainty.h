// What can be said of a pair of elements at little cost: are they certainly the same?
//
// It is never the last word. Where it is sure, judging the pair by the rule would find it the same
// and would leave the remembered factor as it is, so that the pair can be passed over. Where it is
// in doubt it says nothing, and the rule decides.

#ifndef TALNUMERICARRAY_SAMEQ_CERTAINTY_H
#define TALNUMERICARRAY_SAMEQ_CERTAINTY_H

#include "compare.h"
#include "factor_cache.h"
#include "promotion_rules.h"
#include "talnumericarray_sameq_elements.h"
#include "to_type.h"

#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>

#pragma GCC visibility push(hidden)
NESK_STRICT_SINGLES_BEGIN

namespace talnumericarray {

// The type in which two elements, or the parts of them, are compared.
template <typename T1, typename T2>
using comparison_t = type_common_t<to_real_type_t<T1>, to_real_type_t<T2>>;

// ---- Bounds: what makes two reals certainly the same
//
// A bound is made at the beginning of a call, and again whenever the rule may have changed what is
// remembered.

// They are equal.
struct equality {};

// They are equal and finite, or differ by clearly less than the second one's magnitude divided by
// `divisor`: see `certain_divisor`.
template <typename T>
struct nearness {
    T divisor;
};

// Whether the processor takes results that are subnormal for zero, but not operands, which only
// that of x86 can be told to do. Trying it out would raise flags.
inline bool flushes_results_alone() noexcept {
#if defined(__SSE2__)
    constexpr unsigned results = 0x8000;
    constexpr unsigned operands = 0x0040;
    return (__builtin_ia32_stmxcsr() & (results | operands)) == results;
#else
    return false;
#endif
}

// The divisor under which pairs are certainly the same, or 0 if there is none (yet).
//
// Let d be |x - y| and m be |y| as the test has them, max the larger of |x| and |y|, and D the
// divisor. The test is m - D * d >= d, with D * d rounded to a number before it is subtracted or
// not. A NaN and an infinity in either place make the left side NaN or an infinity below zero, and
// the answer doubt. If d is 0, x and y are equal numbers; or, where subnormal numbers are taken for
// zero, of one sign and so near that the rule finds the same. But where only results are, subnormal
// numbers of different signs would pass, and no divisor is given. Let d be above 0 now. What is
// above zero when it has been rounded was so before, and what is below a number was below it: hence
// D * d < m exactly, in either form and in any direction of rounding. As D >= 1, so is d, which is
// never so with signs that differ or beside a zero.
//
// A `tol` of `bits` or more: that is all, and 1 is divisor enough.
//
// f remembered: with e = epsilon, D is at least ((1/f)(1 + 8e)(1 - e)^2 + 1)(1 - e) however its
// operations are rounded, and so at least (1/f)(1 + 4e) and, as 1/f is 1 or more, at least 1/f + 1.
// A rounded result is off by less than the share e, or less than the least number s above zero if
// it is subnormal; a subnormal difference is exact. The rule's difference, which upward and
// downward may be rounded the other way, is at most d (1 + e)/(1 - e). For max >= 1 it has to be
// below max * f, rounded, which is at least max * f (1 - e) > d (1 + 4e)(1 - e). For max < 1 it is
// divided by f: if the quotient is not subnormal, it is at most (d / f)(1 + e)^2/(1 - e) <= D * d <
// max; else it is below d / f + s <= d / f + d <= D * d < max. Either way the difference is below
// max too.
template <typename T>
inline T certain_divisor(const T tol) noexcept {
    constexpr int bits = std::numeric_limits<T>::digits;
    if (!(tol > 0) || flushes_results_alone()) {
        return 0;
    }
    if (tol >= bits) {
        return 1;
    }
    T tolfactor = 0;
    if (!nesk::recall_factor(tol, tolfactor)) {
        return 0;
    }
    return 1 / tolfactor * (1 + 8 * std::numeric_limits<T>::epsilon()) + 1;
}

// ---- One pair

// Not by std::fabs, which Clang would call on 32-bit ARM: see `real_part`.
inline float magnitude(const float x) noexcept {
    return __builtin_fabsf(x);
}

inline double magnitude(const double x) noexcept {
    return __builtin_fabs(x);
}

// 32-bit ARM has no instruction that converts integers of 64 bits; compilers call a function of 25
// instructions, which knows one direction of rounding alone. What is exact is the same in all: the
// double of 53 bits whose halves are exact doubles, and the single of 24 bits.
template <typename T, typename From>
inline T by_halves(const From number) noexcept {
    constexpr int bits = std::numeric_limits<T>::digits;
    constexpr auto limit = static_cast<std::uint64_t>(1) << bits;
    constexpr std::uint64_t below_zero = std::is_signed_v<From> ? limit : 0;
    if (static_cast<std::uint64_t>(number) + below_zero >= limit + below_zero) {
        return static_cast<T>(number);
    }
    if constexpr (std::is_same_v<T, float>) {
        return static_cast<T>(static_cast<std::int32_t>(number));
    } else {
        const auto upper = static_cast<std::int32_t>(number >> 32);
        const auto lower = static_cast<std::uint32_t>(number);
        return static_cast<T>(upper) * 0x1p32 + static_cast<T>(lower);
    }
}

// A number in the type of comparison, the same as a cast gives.
template <typename T, typename From>
inline T converted(const From number) noexcept {
#if defined(__arm__) && !defined(__OPTIMIZE_SIZE__)
    constexpr bool in_halves =
        std::is_integral_v<From> && sizeof(From) == 8 && std::is_floating_point_v<T>;
#else
    constexpr bool in_halves = false;
#endif
    if constexpr (in_halves) {
        return by_halves<T>(number);
    } else {
        return static_cast<T>(number);
    }
}

template <typename T>
inline bool certainly_same_reals(equality /*bound*/, const T x, const T y) noexcept {
    return x == y;
}

template <typename T>
inline bool certainly_same_reals(const nearness<T> bound, const T x, const T y) noexcept {
    const T difference = magnitude(x - y);
    return magnitude(y) - bound.divisor * difference >= difference;
}

// An integer or a real beside a real, or beside a complex number, whose imaginary part has to be a
// zero then.
template <typename Bound, typename T1, typename T2>
inline bool certainly_same(const Bound bound, const T1& data1, const T2& data2) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (is_complex_v<T2>) {
        return certainly_same(bound, data1, real_part(data2)) && imaginary_part(data2) == 0;
    } else {
        return certainly_same_reals(bound, converted<T>(data1), converted<T>(data2));
    }
}

// The number of leading elements of two arrays of `len` that are found to be certainly the same,
// without vectors. None is read behind the first pair in doubt.
template <typename Bound, typename T1, typename T2>
inline std::size_t leading_one_by_one(const Bound bound, const T1* const data1,
                                      const T2* const data2, const std::size_t len) noexcept {
    std::size_t i = 0;
    while (i < len && certainly_same(bound, data1[i], data2[i])) {
        ++i;
    }
    return i;
}

} // namespace talnumericarray

NESK_STRICT_SINGLES_END
#pragma GCC visibility pop

#endif
