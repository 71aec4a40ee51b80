// The factor that a tolerance in binary digits stands for.

#ifndef NESK_TOLERANCE_SHIFT_FACTOR_H
#define NESK_TOLERANCE_SHIFT_FACTOR_H

#include "strict_floating_point.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <type_traits>

#pragma GCC visibility push(hidden)

namespace nesk {
namespace detail {

template <typename T, std::enable_if_t<std::is_floating_point_v<T>, int> = 0>
inline T ToleranceShiftFactor_impl(const T& tol) noexcept {
    T tolfactor = 1;
    constexpr int bits = std::numeric_limits<T>::digits;
    T itol = 0;
    const T ftol = std::modf(tol, &itol);

    // Beyond 2^20 digits, ldexp has long overflowed or underflowed. So the limit changes no result,
    // and makes the conversion to int defined for every tolerance. In this order of operands it
    // holds for a NaN too, whose factor is NaN whatever the shift.
    constexpr T limit = 1 << 20;
    const T whole = std::max(-limit, std::min(limit, itol));
    const int tolshift = static_cast<int>(whole) - bits;

    // If a subnormal `ftol` is taken for zero, as NEON does, nothing changes: its power is 1 too.
    if (ftol != 0) {
        // Compilers may turn pow(2, x) into exp2(x), or fold it if they know x. Either can differ
        // from the library's pow in the last place, and then so would the answers of two builds.
        // The volatile hides the base.
        const volatile T two = 2;
        tolfactor = std::pow(two, ftol);
    }
    return std::ldexp(tolfactor, tolshift);
}

} // namespace detail

// Returns 2^(arg - bits), where `arg` is a tolerance in binary digits and `bits` is the number of
// significand digits of `T`: 53 for double, 24 for float. Exact for a whole `arg`; otherwise the
// error is that of the library's pow. Overflows to infinity and underflows to zero as ldexp does;
// NaN yields NaN.
template <typename T, std::enable_if_t<std::is_floating_point_v<T>, int> = 0>
inline T ToleranceShiftFactor(const T& arg) noexcept {
    return detail::ToleranceShiftFactor_impl<T>(arg);
}

} // namespace nesk

#pragma GCC visibility pop

#endif
