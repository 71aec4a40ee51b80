// Fast tests of whether two elements are certainly the same.
//
// If such a test passes, the rule would find the pair the same and leave the remembered factor as
// it is, so the pair can be passed over. If it fails, the pair is in doubt, and the rule decides.

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

// The type in which two elements, or their parts, are compared.
template <typename T1, typename T2>
using comparison_t = type_common_t<to_real_type_t<T1>, to_real_type_t<T2>>;

// ---- Bounds: what makes two reals certainly the same
//
// A bound is made at the beginning of a call, and again whenever the rule may have changed the
// remembered factor.

// They are equal.
struct equality {};

// They are equal and finite, or differ by clearly less than the magnitude of the second one divided
// by `divisor`; see `certain_divisor`.
template <typename T>
struct nearness {
    T divisor;
};

// Whether subnormal results are flushed to zero while subnormal operands are not taken for zero.
// Only x86 has this mode. The mode is read, as trying it out would raise flags.
inline bool ftz_without_daz() noexcept {
#if defined(__SSE2__)
    constexpr unsigned ftz = 0x8000;
    constexpr unsigned daz = 0x0040;
    return (__builtin_ia32_stmxcsr() & (ftz | daz)) == ftz;
#else
    return false;
#endif
}

// The divisor under which pairs are certainly the same, or 0 if there is none (yet).
//
// Let d be |x - y| and m be |y|, as the test computes them, max the larger of |x| and |y|, and D
// the divisor. The test is m - D * d >= d, where D * d may or may not be rounded before it is
// subtracted. If x or y is a NaN or an infinity, the left side is a NaN or minus infinity, and the
// pair is in doubt.
//
// If d is 0, x and y are equal numbers. Where subnormal numbers are taken for zero, they may also
// be of one sign and so near that the rule finds them the same. Where only subnormal results are
// flushed to zero, two subnormal numbers of different signs would pass, so there is no divisor.
//
// Otherwise d is above 0. A result that is above zero when rounded was above zero before, and a
// product that is below a number when rounded was below it before. Hence D * d < m exactly, whether
// the product is rounded or not and in any rounding direction. As D >= 1, also d < m, which never
// holds for numbers of different signs or beside a zero.
//
// If `tol` is `bits` or more, that is all the rule asks, and 1 is a sufficient divisor.
//
// If a factor f is remembered, let e be epsilon. However the operations that compute D are rounded,
// D is at least ((1/f)(1 + 8e)(1 - e)^2 + 1)(1 - e). So D is at least (1/f)(1 + 4e) and, as 1/f is
// 1 or more, at least 1/f + 1. Rounding changes a result by less than e times that result, or by
// less than the least positive number s if the result is subnormal; a subnormal difference is
// exact. The rule's difference may be taken in the other order, and so rounded the opposite way. It
// is at most d (1 + e)/(1 - e).
//
// - For max >= 1 it has to be below max * f, rounded. That is at least max * f (1 - e), which is
//   above d (1 + 4e)(1 - e).
// - For max < 1 it is divided by f, and the quotient has to be below max. If the quotient is not
//   subnormal, it is at most (d / f)(1 + e)^2/(1 - e) <= D * d < max. Otherwise it is below
//   d / f + s <= d / f + d <= D * d < max.
//
// In both cases the difference is below max too.
template <typename T>
inline T certain_divisor(const T tol) noexcept {
    constexpr int bits = std::numeric_limits<T>::digits;
    if (!(tol > 0) || ftz_without_daz()) {
        return 0;
    }
    if (tol >= bits) {
        return 1;
    }
    T tolfactor = 0;
    if (!nesk::recall_factor(tol, tolfactor)) {
        return 0;
    }
    constexpr T slack = 1 + 8 * std::numeric_limits<T>::epsilon();
    return 1 / tolfactor * slack + 1;
}

// ---- One pair

// Not std::fabs: on 32-bit ARM Clang would not inline it, see `real_part`.
inline float magnitude(const float x) noexcept {
    return __builtin_fabsf(x);
}

inline double magnitude(const double x) noexcept {
    return __builtin_fabs(x);
}

// 32-bit ARM has no instruction that converts 64-bit integers. Compilers call a function of 25
// instructions, which always rounds to nearest. Small numbers need no rounding: those of 53 bits
// are the exact sum of two halves in doubles, and those of 24 bits are exact singles.
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

// Gives the result of a cast to the type of comparison.
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
    static_assert(std::is_floating_point_v<T>, "a conversion may make different integers equal");
    return x == y;
}

template <typename T>
inline bool certainly_same_reals(const nearness<T> bound, const T x, const T y) noexcept {
    const T difference = magnitude(x - y);
    return magnitude(y) - bound.divisor * difference >= difference;
}

// An integer or a real beside an integer, a real or a complex number, whose imaginary part has to
// be zero.
template <typename Bound, typename T1, typename T2>
inline bool certainly_same(const Bound bound, const T1& data1, const T2& data2) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (is_complex_v<T2>) {
        return certainly_same(bound, data1, real_part(data2)) && imaginary_part(data2) == 0;
    } else {
        return certainly_same_reals(bound, converted<T>(data1), converted<T>(data2));
    }
}

// The number of leading elements of two arrays of `len` that are certainly the same. Nothing after
// the first pair in doubt is read.
template <typename Bound, typename T1, typename T2>
inline std::size_t certain_prefix_one_by_one(const Bound bound, const T1* const data1,
                                             const T2* const data2,
                                             const std::size_t len) noexcept {
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
