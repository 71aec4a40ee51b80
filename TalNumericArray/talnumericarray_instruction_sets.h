// The block test, compiled for each instruction set that is worth it, and the choice among them.

#ifndef TALNUMERICARRAY_INSTRUCTION_SETS_H
#define TALNUMERICARRAY_INSTRUCTION_SETS_H

#include "taldata_array_element_types.h"
#include "talnumericarray_sameq_blocks.h"
#include "to_type.h"
#include "type_properties.h"

#include <cstddef>
#include <type_traits>

#pragma GCC visibility push(hidden)

namespace talnumericarray {

// ---- The sets
//
// Each has one function, which is `leading_certainly_same` compiled for it. What that calls is
// inlined into it, so that nothing else of the program is compiled for the set. `pays` tells where
// it is faster than the sets behind it and the element test.

// What the compiler has been told that the processor has.
struct baseline {
    static constexpr const char* name = "baseline";

    static bool supported() noexcept { return true; }

    // NEON on 32-bit ARM takes subnormal singles for zero and knows no doubles; on 64-bit ARM it
    // does not convert 64-bit integers to singles. SSE2 converts no 64-bit integers at all, and GCC
    // is slow at testing a vector of two doubles.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool pays() noexcept {
        [[maybe_unused]] constexpr bool integers = std::is_integral_v<comparison_t<T1, T2>>;
        [[maybe_unused]] constexpr bool singles = std::is_same_v<comparison_t<T1, T2>, float>;
        [[maybe_unused]] constexpr bool near = !std::is_same_v<Bound, equality>;
#if defined(__arm__)
        return integers;
#elif defined(__aarch64__)
        return integers || near || !singles || sizeof(T1) < 8;
#elif defined(__SSE2__) && !defined(__clang__)
        return integers || near || std::is_same_v<T1, T2> || (singles && sizeof(T1) < 8);
#else
        return true;
#endif
    }

    template <typename Bound, typename T1, typename T2>
    [[gnu::noinline]] static std::size_t leading_certainly_same(const Bound bound, const T1* data1,
                                                                const T2* data2,
                                                                const std::size_t len) noexcept {
        return talnumericarray::leading_certainly_same(bound, data1, data2, len);
    }
};

#if defined(__x86_64__)

struct avx2 {
    static constexpr const char* name = "AVX2";

    static bool supported() noexcept { return static_cast<bool>(__builtin_cpu_supports("avx2")); }

    // There is no instruction that converts 64-bit integers, and GCC does so one at a time.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool pays() noexcept {
#    if defined(__clang__)
        return true;
#    else
        constexpr bool converts = std::is_integral_v<T1> && sizeof(T1) == 8
                                  && std::is_floating_point_v<comparison_t<T1, T2>>;
        return !converts || !std::is_same_v<Bound, equality>;
#    endif
    }

    template <typename Bound, typename T1, typename T2>
    [[gnu::noinline, gnu::target("avx2")]] static std::size_t
    leading_certainly_same(const Bound bound, const T1* data1, const T2* data2,
                           const std::size_t len) noexcept {
        return talnumericarray::leading_certainly_same(bound, data1, data2, len);
    }
};

struct avx512 {
    static constexpr const char* name = "AVX-512";

    static bool supported() noexcept {
        return static_cast<bool>(__builtin_cpu_supports("avx512f"))
               && static_cast<bool>(__builtin_cpu_supports("avx512bw"))
               && static_cast<bool>(__builtin_cpu_supports("avx512dq"))
               && static_cast<bool>(__builtin_cpu_supports("avx512vl"));
    }

    // For equality of reals GCC's loops are hardly faster than those for AVX2, but for conversions
    // that only this set has.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool pays() noexcept {
#    if defined(__clang__)
        return true;
#    else
        constexpr bool converted_by_avx2 =
            std::is_floating_point_v<T1> || sizeof(T1) < 4 || std::is_same_v<T1, BIT32>;
        return std::is_integral_v<comparison_t<T1, T2>> || is_complex_v<T2> || !converted_by_avx2
               || !std::is_same_v<Bound, equality>;
#    endif
    }

    template <typename Bound, typename T1, typename T2>
#    if defined(__clang__)
    [[gnu::noinline, gnu::target("avx512f,avx512bw,avx512dq,avx512vl")]]
#    else
    [[gnu::noinline, gnu::target("avx512f,avx512bw,avx512dq,avx512vl,prefer-vector-width=512")]]
#    endif
    static std::size_t
    leading_certainly_same(const Bound bound, const T1* data1, const T2* data2,
                           const std::size_t len) noexcept {
        return talnumericarray::leading_certainly_same(bound, data1, data2, len);
    }
};

#endif

// The sets that there are block tests for, the best one first. TALNUMERICARRAY_INSTRUCTION_SETS, a
// list with commas between, chooses fewer of them.
#if defined(__OPTIMIZE_SIZE__)
using instruction_sets = type_list<>;
#elif defined(TALNUMERICARRAY_INSTRUCTION_SETS)
using instruction_sets = type_list<TALNUMERICARRAY_INSTRUCTION_SETS>;
#elif defined(__x86_64__)
using instruction_sets = type_list<avx512, avx2, baseline>;
#elif defined(__SSE2__) || defined(__ARM_NEON)
using instruction_sets = type_list<baseline>;
#else
using instruction_sets = type_list<>;
#endif

// ---- The choice

// Whether a block test of any of the sets is ever faster than the element test. Between reals, one
// for nearness is wherever one for equality is.
template <typename T1, typename T2, typename... Sets>
constexpr bool blocks_pay(type_list<Sets...> /*sets*/) noexcept {
    if constexpr ((element_type_id<T1>) > element_type_id<T2>) {
        return blocks_pay<T2, T1>(type_list<Sets...>{});
    } else if constexpr (is_complex_v<T1>) {
        return blocks_pay<to_real_type_t<T1>, to_real_type_t<T2>>(type_list<Sets...>{});
    } else {
        using T = comparison_t<T1, T2>;
        using Bound = std::conditional_t<std::is_integral_v<T>, equality, nearness<T>>;
        return (... || Sets::template pays<Bound, T1, T2>());
    }
}

// `leading_certainly_same` by the best set that the processor has and that pays; 0 if none does.
template <typename... Sets, typename Bound, typename T1, typename T2>
inline std::size_t by_best_set(type_list<Sets...> /*sets*/, const Bound bound, const T1* data1,
                               const T2* data2, const std::size_t len) noexcept {
    std::size_t passed = 0;
    [[maybe_unused]] const auto ask = [&](auto tag) noexcept {
        using Set = typename decltype(tag)::type;
        if constexpr (Set::template pays<Bound, T1, T2>()) {
            if (Set::supported()) {
                passed = Set::leading_certainly_same(bound, data1, data2, len);
                return true;
            }
        }
        return false;
    };
    (void)(... || ask(type_tag<Sets>{}));
    return passed;
}

// By what is known of the tolerance at this moment. For a pair of types in the order of the list.
template <typename Sets, typename T1, typename T2>
[[gnu::noinline]] std::size_t by_known_bound(const talreal& tol, const T1* data1, const T2* data2,
                                             const std::size_t len) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (std::is_floating_point_v<T>) {
        const T divisor = certain_divisor(static_cast<T>(tol));
        if (divisor != 0) {
            return by_best_set(Sets{}, nearness<T>{divisor}, data1, data2, len);
        }
    }
    return by_best_set(Sets{}, equality{}, data1, data2, len);
}

// The number of leading elements of two arrays of `len` that can be passed over as the same.
//
// Being certainly the same is symmetric, so that a pair of types and its reverse share a loop; and
// two arrays of complex numbers are arrays of twice as many reals.
template <typename Sets, typename T1, typename T2>
inline std::size_t passed_over(const talreal& tol, const T1* data1, const T2* data2,
                               const std::size_t len) noexcept {
    if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
        return passed_over<Sets>(tol, reinterpret_cast<const to_real_type_t<T1>*>(data1),
                                 reinterpret_cast<const to_real_type_t<T2>*>(data2), 2 * len)
               / 2;
    } else if constexpr ((element_type_id<T1>) > element_type_id<T2>) {
        return by_known_bound<Sets>(tol, data2, data1, len);
    } else {
        return by_known_bound<Sets>(tol, data1, data2, len);
    }
}

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
