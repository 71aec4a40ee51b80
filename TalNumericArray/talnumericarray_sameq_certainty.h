// What can be said of a pair of elements at little cost: are they certainly the same?
//
// It is never the last word. Where it is sure, judging the pair by the rule would find it the same
// and would leave the remembered factor as it is, so that the pair can be passed over. Where it is
// in doubt it says nothing, and the rule decides.

#ifndef TALNUMERICARRAY_SAMEQ_CERTAINTY_H
#define TALNUMERICARRAY_SAMEQ_CERTAINTY_H

#include "compare.h"
#include "promotion_rules.h"
#include "talnumericarray_sameq_elements.h"
#include "to_type.h"

#include <cmath>
#include <cstddef>
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

// The divisor under which pairs are certainly the same, or 0 if there is none (yet).
//
// Let d be |x - y| and m be |y|, max the larger of |x| and |y|, and D the divisor. The test is
// m - D * d >= d, with D * d rounded to a number before it is subtracted or not. A NaN and an
// infinity in either place make the left side NaN or an infinity below zero, and the answer doubt.
// If d is 0, x and y are equal numbers, or both so small that the processor takes d for zero; then
// the rule finds the same. Let d be above 0 now. As D >= 1, m is at least d plus the number in
// front of d: so d < m <= max, which is never so with signs that differ, beside a zero, or where
// the smaller vanishes beside the larger.
//
// A `tol` of `bits` or more: that is all, and 1 is divisor enough.
//
// f remembered: with e = epsilon, D is at least (1/f)(1 + 5e) + 1 - e however its four operations
// are rounded, and so at least (1/f)(1 + 4e) and, as 1/f is 1 or more, at least 1/f + 1. Where no
// result is subnormal, an operation changes its result by less than the share e, and the test says
// (1/f)(1 + 4e) d < m (1 + e). For max >= 1 the rule tests d < max * f, and max * f (1 - e) is
// above d; for max < 1 it tests d / f < max, and (d / f)(1 + e) is below max. Where d / f is
// subnormal, let s be the least number above 0, of which all these are multiples but for D * d and
// d / f themselves. D * d is at least d / f + s. If it is rounded before, it is then rounded to one
// number above what d / f is rounded to, or more; else m - D * d is at least s before it is
// rounded, hence d / f <= m - s. Either way d / f, rounded, is below m.
template <typename T>
inline T certain_divisor(const T tol) noexcept {
    constexpr int bits = std::numeric_limits<T>::digits;
    if (!(tol > 0)) {
        return 0;
    }
    if (tol >= bits) {
        return 1;
    }
    T tolfactor = 0;
    if (!nesk::detail::recall_factor(tol, tolfactor)) {
        return 0;
    }
    return 1 / tolfactor * (1 + 8 * std::numeric_limits<T>::epsilon()) + 1;
}

// ---- One pair

template <typename T>
inline bool certainly_same_reals(equality /*bound*/, const T x, const T y) noexcept {
    return x == y;
}

template <typename T>
inline bool certainly_same_reals(const nearness<T> bound, const T x, const T y) noexcept {
    const T difference = std::fabs(x - y);
    return std::fabs(y) - bound.divisor * difference >= difference;
}

// An integer or a real beside a real, or beside a complex number, whose imaginary part has to be a
// zero then.
template <typename Bound, typename T1, typename T2>
inline bool certainly_same(const Bound bound, const T1& data1, const T2& data2) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (is_complex_v<T2>) {
        return certainly_same(bound, data1, real_part(data2)) && imaginary_part(data2) == 0;
    } else {
        return certainly_same_reals(bound, static_cast<T>(data1), static_cast<T>(data2));
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
