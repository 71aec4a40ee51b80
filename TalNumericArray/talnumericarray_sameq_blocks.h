// The block test: are the elements of two short blocks certainly the same?
//
// It is never the last word. Where it is sure, judging the elements one by one would find them all
// the same and would leave the remembered factor as it is, so that they can be passed over. Where
// it is in doubt it says nothing, and the element test decides. It is written without branches, for
// compilers to turn into vector instructions.
//
// Outside the functions that are compiled without NEON on 32-bit ARM: reals are not looked at in
// blocks there.

#ifndef TALNUMERICARRAY_SAMEQ_BLOCKS_H
#define TALNUMERICARRAY_SAMEQ_BLOCKS_H

#include "compare.h"
#include "promotion_rules.h"
#include "to_type.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>

#pragma GCC visibility push(hidden)

namespace talnumericarray {

// ---- What makes two reals certainly the same

// They are equal.
struct equality {};

// They are equal, or differ by less than the larger magnitude divided by `divisor`.
template <typename T>
struct nearness {
    T divisor;
    // The least number above zero. Not a constant in the loops, as GCC compares and selects to find
    // the larger of a number and a constant.
    T least = std::numeric_limits<T>::denorm_min();
};

// Whether results of arithmetic are rounded to the nearest number, as they are unless a program has
// asked for another direction.
template <typename T>
inline bool rounds_to_nearest() noexcept {
    const volatile T one = 1;
    const volatile T little = std::numeric_limits<T>::epsilon() / 4;
    return one + little == one && -one - little == -one && one - little / 2 == one;
}

// The divisor under which pairs that are near are certainly the same, or 0 if there is none (yet).
//
// Let f be the factor of `tol` and d the difference of two reals, rounded to nearest.
//
// f remembered and `tol` whole: the divisor is 1/f, a power of two, so that d * (1/f) is exact or
// overflows. The rule tests d < max * f, if max >= 1, or d / f < max, and both are then the same
// question as d * (1/f) < max, in which no operation loses a digit.
//
// f remembered and `tol` not whole: with u = epsilon/2 the divisor is at least (1/f)(1 + 5u), the
// two roundings below included. If the rounded d * divisor is below max, then so is the exact one,
// as max is a number of its type. For max < 1, d / f is below d * divisor and rounding keeps the
// order. For max >= 1, d < max * f / (1 + 5u) < max * f * (1 - u), which is no more than the
// rounded max * f.
//
// A `tol` of `bits` or more: nonzero reals of one sign are the same. 1 will do as divisor, as
// d < max only where that is so.
//
// In each case d * divisor >= max, and the answer is doubt, where one of the two is zero, where the
// signs differ and where the smaller vanishes beside the larger; NaN compares as false.
template <typename T>
inline T certain_divisor(const T tol) noexcept {
    constexpr int bits = std::numeric_limits<T>::digits;
    if (!(tol > 0) || !rounds_to_nearest<T>()) {
        return 0;
    }
    if (tol >= bits) {
        return 1;
    }
    T tolfactor = 0;
    if (!nesk::detail::recall_factor(tol, tolfactor)) {
        return 0;
    }
    const T inverse = 1 / tolfactor;
    const bool whole = static_cast<T>(static_cast<int>(tol)) == tol;
    return whole ? inverse : inverse * (1 + 4 * std::numeric_limits<T>::epsilon());
}

// ---- Doubt about one pair: zero only if the two are certainly the same
//
// An unsigned integer of the width in which the two are compared, so that compilers can gather the
// doubts of a block in a vector register.

template <typename T>
using unsigned_of_size_t = std::conditional_t<
    sizeof(T) == 1, std::uint8_t,
    std::conditional_t<sizeof(T) == 2, std::uint16_t,
                       std::conditional_t<sizeof(T) == 4, std::uint32_t, std::uint64_t>>>;

template <typename T1, typename T2>
using comparison_t = type_common_t<to_real_type_t<T1>, to_real_type_t<T2>>;

template <typename T1, typename T2>
using doubt_t = unsigned_of_size_t<comparison_t<T1, T2>>;

// Two integers: the bits that differ when both are widened.
template <typename T1, typename T2,
          std::enable_if_t<std::is_integral_v<T1> && std::is_integral_v<T2>, int> = 0>
[[gnu::always_inline]] inline doubt_t<T1, T2> doubt(equality /*unused*/, const T1 x,
                                                    const T2 y) noexcept {
    using D = doubt_t<T1, T2>;
    using Unsigned = std::conditional_t<std::is_unsigned_v<T1>, T1, T2>;
    const D wide_x = static_cast<D>(x);
    const D wide_y = static_cast<D>(y);
    D difference = wide_x ^ wide_y;
    // Equal bits are different numbers where a negative one meets an unsigned one as wide.
    if constexpr (std::is_signed_v<T1> != std::is_signed_v<T2> && sizeof(Unsigned) == sizeof(D)) {
        constexpr D sign = static_cast<D>(D{1} << (std::numeric_limits<D>::digits - 1));
        difference = static_cast<D>(difference | (wide_x & sign));
    }
    return difference;
}

template <typename T1, typename T2>
inline constexpr bool compared_as_reals_v =
    !is_complex_v<T1> && !is_complex_v<T2> && std::is_floating_point_v<comparison_t<T1, T2>>;

template <typename T1, typename T2, std::enable_if_t<compared_as_reals_v<T1, T2>, int> = 0>
[[gnu::always_inline]] inline doubt_t<T1, T2> doubt(equality /*unused*/, const T1 x,
                                                    const T2 y) noexcept {
    using T = comparison_t<T1, T2>;
    using D = doubt_t<T1, T2>;
    return static_cast<T>(x) == static_cast<T>(y) ? D{0} : static_cast<D>(-1);
}

template <typename T1, typename T2, std::enable_if_t<compared_as_reals_v<T1, T2>, int> = 0>
[[gnu::always_inline]] inline doubt_t<T1, T2> doubt(const nearness<comparison_t<T1, T2>> near,
                                                    const T1 x_, const T2 y_) noexcept {
    using T = comparison_t<T1, T2>;
    using D = doubt_t<T1, T2>;
    const T x = static_cast<T>(x_);
    const T y = static_cast<T>(y_);
    const T magnitude_x = std::is_unsigned_v<T1> ? x : std::fabs(x);
    const T magnitude_y = std::fabs(y);
    // The least number above zero in the place of zero: two zeros are near, and nothing else is
    // nearer to a zero than that. It saves a test for equality, which only two infinities miss.
    const T larger = magnitude_x > magnitude_y ? magnitude_x : magnitude_y;
    const T max = larger > near.least ? larger : near.least;
    return std::fabs(x - y) * near.divisor < max ? D{0} : static_cast<D>(-1);
}

// Integer or real against the parts of a complex number: the imaginary one has to be a zero, of
// either sign.
template <typename Bound, typename T1, typename T2>
[[gnu::always_inline]] inline doubt_t<T1, T2> doubt(const Bound bound, const T1 x, const T2 real,
                                                    const T2 imaginary) noexcept {
    using Bits = unsigned_of_size_t<T2>;
    Bits imaginary_bits;
    std::memcpy(&imaginary_bits, &imaginary, sizeof imaginary_bits);
    return doubt(bound, x, real) | static_cast<Bits>(imaginary_bits << 1);
}

// ---- Doubt about a block

// Long enough for the vectors of every instruction set, and for what it costs to gather their
// doubts, to be a small part of the work. A power of two, so that pages end with a block.
template <typename T1, typename T2>
inline constexpr std::size_t block_length = is_complex_v<T1> || is_complex_v<T2> ? 64 : 128;

template <typename Bound, typename T1, typename T2>
[[gnu::always_inline]] inline bool certainly_sameQ(const Bound bound, const T1* data1,
                                                   const T2* data2) noexcept {
    constexpr std::size_t length = block_length<T1, T2>;
    doubt_t<T1, T2> doubts = 0;
    if constexpr (is_complex_v<T2>) {
        const auto* parts = reinterpret_cast<const to_real_type_t<T2>*>(data2);
        for (std::size_t k = 0; k < length; ++k) {
            doubts |= doubt(bound, data1[k], parts[2 * k], parts[2 * k + 1]);
        }
    } else {
        for (std::size_t k = 0; k < length; ++k) {
            doubts |= doubt(bound, data1[k], data2[k]);
        }
    }
    return doubts == 0;
}

// The smallest page of any platform's memory; the larger ones are multiples of it.
inline constexpr std::size_t page_bytes = 4096;

// The number of whole elements from `data` on to the end of its page.
template <typename T>
inline std::size_t elements_in_page(const T* data) noexcept {
    const std::size_t behind = reinterpret_cast<std::uintptr_t>(data) % page_bytes;
    return (page_bytes - behind) / sizeof(T);
}

// The number of leading elements of two arrays of `len` that are found to be certainly the same,
// block by block.
//
// No block reaches into another page than its first element that has not been passed yet, so that
// none is read that a program could tell is behind the first pair that differs. The last block in
// front of a page's end begins, if need be, among elements that have been passed already.
template <typename Bound, typename T1, typename T2>
[[gnu::always_inline]] inline std::size_t leading_certainly_same(const Bound bound, const T1* data1,
                                                                 const T2* data2,
                                                                 const std::size_t len) noexcept {
    constexpr std::size_t length = block_length<T1, T2>;
    std::size_t passed = 0;
    for (;;) {
        const std::size_t in_pages =
            std::min(elements_in_page(data1 + passed), elements_in_page(data2 + passed));
        const std::size_t end = passed + std::min(len - passed, in_pages);
        if (passed == end || end < length) {
            return passed;
        }
        do {
            const std::size_t begin = std::min(passed, end - length);
            if (!certainly_sameQ(bound, data1 + begin, data2 + begin)) {
                return passed;
            }
            passed = begin + length;
        } while (passed < end);
    }
}

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
