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

#if defined(__clang__)
inline constexpr bool compiled_by_gcc = false;
#else
inline constexpr bool compiled_by_gcc = true;
#endif

#if defined(__arm__)
inline constexpr bool vectors_have_reals = false;
#else
inline constexpr bool vectors_have_reals = true;
#endif

// ---- The sets
//
// Each has one function, which is `leading_certainly_same` compiled for it. What that calls is
// inlined into it, so that nothing else of the program is compiled for the set. `pays` tells where
// it is faster than the element test.

// What the compiler has been told that the processor has.
struct baseline {
    static constexpr const char* name = "baseline";

    static bool supported() noexcept { return true; }

    // NEON on 32-bit ARM takes subnormal singles for zero and knows no doubles. GCC makes slow work
    // of testing the lanes of two doubles for equality.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool pays() noexcept {
        constexpr bool integers = std::is_integral_v<comparison_t<T1, T2>>;
        constexpr bool slow_lanes =
            compiled_by_gcc
            && std::is_same_v<
                Bound,
                equality> && std::is_same_v<comparison_t<T1, T2>, double> && !std::is_same_v<T1, T2>;
        constexpr bool slow_conversion =
            compiled_by_gcc && std::is_same_v<Bound, equality> && sizeof(T1) == 8;
        return integers || (vectors_have_reals && !slow_lanes && !slow_conversion);
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

    static bool supported() noexcept { return __builtin_cpu_supports("avx2") != 0; }

    // There are no instructions that convert 64-bit integers to reals.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool pays() noexcept {
        constexpr bool converts = std::is_integral_v<T1> && sizeof(T1) == 8
                                  && std::is_floating_point_v<comparison_t<T1, T2>>;
        return !(compiled_by_gcc && std::is_same_v<Bound, equality> && converts);
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
        return __builtin_cpu_supports("avx512f") != 0 && __builtin_cpu_supports("avx512bw") != 0
               && __builtin_cpu_supports("avx512dq") != 0
               && __builtin_cpu_supports("avx512vl") != 0;
    }

    template <typename Bound, typename T1, typename T2>
    static constexpr bool pays() noexcept {
        return true;
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

// `leading_certainly_same` by the best set that the processor has; 0 where it does not pay.
template <typename... Sets, typename Bound, typename T1, typename T2>
inline std::size_t by_best_set(type_list<Sets...> /*sets*/, const Bound bound, const T1* data1,
                               const T2* data2, const std::size_t len) noexcept {
    std::size_t passed = 0;
    [[maybe_unused]] const auto ask = [&](auto tag) noexcept {
        using Set = typename decltype(tag)::type;
        if constexpr (Set::template pays<Bound, T1, T2>()) {
            passed = Set::leading_certainly_same(bound, data1, data2, len);
        }
        return true;
    };
    (void)(... || (Sets::supported() && ask(type_tag<Sets>{})));
    return passed;
}

// The number of leading elements of two arrays of `len` that can be passed over as the same.
//
// Being certainly the same is symmetric, so that a pair of types and its reverse share a loop; and
// two arrays of complex numbers are arrays of twice as many reals.
template <typename Sets, typename T1, typename T2>
inline std::size_t passed_over(const talreal& tol, const T1* data1, const T2* data2,
                               const std::size_t len) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
        return passed_over<Sets>(tol, reinterpret_cast<const to_real_type_t<T1>*>(data1),
                                 reinterpret_cast<const to_real_type_t<T2>*>(data2), 2 * len)
               / 2;
    } else if constexpr ((element_type_id<T1> > element_type_id<T2>)) {
        return passed_over<Sets>(tol, data2, data1, len);
    } else if constexpr (std::is_integral_v<T>) {
        return by_best_set(Sets{}, equality{}, data1, data2, len);
    } else {
        const T divisor = certain_divisor(static_cast<T>(tol));
        return divisor == 0 ? by_best_set(Sets{}, equality{}, data1, data2, len)
                            : by_best_set(Sets{}, nearness<T>{divisor}, data1, data2, len);
    }
}

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
