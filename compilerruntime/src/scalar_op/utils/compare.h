// Three-way comparison of two scalars of any two non-complex element types.

#ifndef NESK_COMPARE_H
#define NESK_COMPARE_H

#include "factor_cache.h"
#include "promotion_rules.h"
#include "strict_floating_point.h"
#include "tolerance_shift_factor.h"

#include <limits>
#include <type_traits>

// The comparison is fast when it is inlined into the element loops. GCC does not always inline it
// by itself. Clang does, and would reject the attribute in code with NEON.
#if defined(__OPTIMIZE__) && !defined(__OPTIMIZE_SIZE__) && !defined(__clang__)
#    define NESK_FORCE_INLINE [[gnu::always_inline]] inline
#else
#    define NESK_FORCE_INLINE inline
#endif

// In a build for size, the comparison of reals is not inlined.
#if defined(__OPTIMIZE_SIZE__)
#    define NESK_INLINE_UNLESS_SMALL [[gnu::noinline]] inline
#else
#    define NESK_INLINE_UNLESS_SMALL NESK_FORCE_INLINE
#endif

#pragma GCC visibility push(hidden)
NESK_STRICT_SINGLES_BEGIN

namespace nesk {
namespace detail {

template <typename T1, typename T2>
inline constexpr bool both_integral_v =
    std::conjunction_v<std::is_integral<T1>, std::is_integral<T2>>;

template <typename T1, typename T2>
inline constexpr bool either_floating_v =
    std::disjunction_v<std::is_floating_point<T1>, std::is_floating_point<T2>>;

// ---- Integers: -1, 0 or +1 if `arg1` is below, equal to or above `arg2` as a mathematical integer

template <typename T>
inline int compare_equal_types(const T arg1, const T arg2) noexcept {
    return arg1 == arg2 ? 0 : arg1 < arg2 ? -1 : 1;
}

template <typename T1, typename T2,
          std::enable_if_t<
              both_integral_v<T1, T2> && std::is_unsigned_v<T1> && std::is_signed_v<T2>, int> = 0>
inline int compare_impl(const T1& arg1, const T2& arg2) noexcept {
    using UT = type_common_t<T1, T2>;
    constexpr T2 zero = 0;
    if (arg2 < zero) {
        return 1;
    }
    const UT uarg2 = static_cast<UT>(arg2);
    return compare_equal_types<UT>(static_cast<UT>(arg1), uarg2);
}

template <typename T1, typename T2,
          std::enable_if_t<
              both_integral_v<T1, T2> && std::is_signed_v<T1> && std::is_unsigned_v<T2>, int> = 0>
inline int compare_impl(const T1& arg1, const T2& arg2) noexcept {
    using UT = type_common_t<T1, T2>;
    constexpr T1 zero = 0;
    if (arg1 < zero) {
        return -1;
    }
    const UT uarg1 = static_cast<UT>(arg1);
    return compare_equal_types<UT>(uarg1, static_cast<UT>(arg2));
}

template <typename T1, typename T2,
          std::enable_if_t<both_integral_v<T1, T2> && std::is_signed_v<T1> == std::is_signed_v<T2>,
                           int> = 0>
inline int compare_impl(const T1& arg1, const T2& arg2) noexcept {
    return compare_equal_types<type_common_t<T1, T2>>(arg1, arg2);
}

// ---- Reals: the tolerant comparison

// Computes the factor and remembers it. Not inlined, as a loop needs it once.
template <typename T>
[[gnu::noinline]] T new_factor(const T tol) noexcept {
    const T tolfactor = ToleranceShiftFactor(tol);
    remember_factor<T>({tol, tolfactor});
    return tolfactor;
}

// Returns 0 when `x` and `y` are the same under `tol`; else +1 when `x` is the greater and -1 when
// `y` is. With a NaN, a nonzero result may have either sign.
//
// Two nonzero reals of one sign are the same when they differ by less than 2^(tol - bits) times the
// larger magnitude. No tolerance makes zero the same as another number, or two numbers of opposite
// signs the same.
template <typename T, std::enable_if_t<std::is_floating_point_v<T>, int> = 0>
NESK_INLINE_UNLESS_SMALL int compare_impl(const T& tol, const T& x, const T y) noexcept {
    constexpr int bits = std::numeric_limits<T>::digits;

    if (x == y) {
        return 0;
    }
    if (x == 0) {
        return y < 0 ? 1 : -1;
    }
    if (y == 0) {
        return x < 0 ? -1 : 1;
    }
    const bool nx = x < 0;
    const bool ny = y < 0;
    if (nx != ny) {
        return nx ? -1 : 1;
    }
    if (tol <= 0) {
        return y < x ? 1 : -1;
    }
    if (tol >= bits) {
        return 0;
    }

    int s = -1;
    T diff = 0;
    T max = 0;
    if (y < x) {
        s = 1;
        diff = x - y;
        max = nx ? -y : x;
    } else {
        diff = y - x;
        max = ny ? -x : y;
    }
    // The smaller operand vanishes beside the larger, as when one of them is infinite.
    if (diff == max) {
        return s;
    }

    T tolfactor = 0;
    if (!recall_factor(tol, tolfactor)) {
        // A pair that differs in its leading binary digit needs no factor. For tolerances up to
        // `bits` - 1 the factor is at most 1/2, and this changes no answer. Above that, this exit
        // is part of the rule: such a pair is the same only if the factor is remembered already.
        const bool far_apart = max >= 1 ? diff >= max * T(0.5) : max <= diff + diff;
        if (far_apart) {
            return s;
        }
        tolfactor = new_factor(tol);
    }

    // A magnitude of at least 1 is multiplied by the factor, or a difference below 1 is divided by
    // it: neither becomes zero or overflows.
    if (max >= 1) {
        max = max * tolfactor;
    } else {
        diff = diff / tolfactor;
    }
    return diff < max ? 0 : s;
}

} // namespace detail

// Two integers of any widths and signedness are compared exactly, without the tolerance. Returns 0
// when they are equal, -1 when `arg1` is the smaller, +1 when it is the greater.
template <typename Ttol, typename T1, typename T2,
          std::enable_if_t<detail::both_integral_v<T1, T2>, int> = 0>
inline int compare(const Ttol& /*tol*/, const T1& arg1, const T2& arg2) noexcept {
    return detail::compare_impl(arg1, arg2);
}

// Two reals, or a real and an integer: both values, and the tolerance in binary digits, are
// converted to the common type of the two values in the current rounding direction, and compared in
// that type. (On 32-bit ARM, the function that converts 64-bit integers always rounds to nearest.)
// An integer beside a single is compared as a single, whatever its width. Returns 0 when they are
// the same, else -1 or +1.
template <typename Ttol, typename T1, typename T2,
          std::enable_if_t<detail::either_floating_v<T1, T2>, int> = 0>
NESK_FORCE_INLINE int compare(const Ttol& tol_, const T1& arg1_, const T2& arg2_) noexcept {
    using common_type = type_common_t<T1, T2>;
    const auto tol = static_cast<common_type>(tol_);
    const auto arg1 = static_cast<common_type>(arg1_);
    const auto arg2 = static_cast<common_type>(arg2_);
    return detail::compare_impl(tol, arg1, arg2);
}

} // namespace nesk

NESK_STRICT_SINGLES_END
#pragma GCC visibility pop
#undef NESK_INLINE_UNLESS_SMALL

#endif
