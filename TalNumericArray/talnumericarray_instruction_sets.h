// The loops over elements that are certainly the same, compiled for each instruction set that is
// worth it, and the choice among them.

#ifndef TALNUMERICARRAY_INSTRUCTION_SETS_H
#define TALNUMERICARRAY_INSTRUCTION_SETS_H

#include "taldata_array_element_types.h"
#include "talnumericarray_sameq_certainty.h"
#include "talnumericarray_vectors.h"
#include "to_type.h"
#include "type_properties.h"

#if defined(__SSE2__)
#    include <immintrin.h>
#elif defined(__ARM_NEON)
#    include <arm_neon.h>
#endif

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>

#pragma GCC visibility push(hidden)

namespace talnumericarray {

// ---- The sets
//
// Each set says for which bounds and types it has loops, and how many leading elements of two
// arrays they find to be certainly the same.

// The elements one by one.
struct none {
    static constexpr const char* name = "none";

    static bool supported() noexcept { return true; }

    template <typename Bound, typename T1, typename T2>
    static constexpr bool has_loop = false;
};

// So many vectors are asked before anything is made of their answers, which takes 32-bit ARM as
// long as two of them.
#if defined(__arm__)
inline constexpr std::size_t vectors_together = 8;
#else
inline constexpr std::size_t vectors_together = 4;
#endif

#if TALNUMERICARRAY_HAS_VECTORS

namespace for_baseline {

inline constexpr std::size_t vector_bytes = 16;
#    if defined(__SSE2__)
#        include "talnumericarray_sse2.h"
#    else
#        include "talnumericarray_neon.h"
#    endif
#    include "talnumericarray_sameq_vectors.h"

// How many leading elements are found to be certainly the same by two vectors of `lanes` that
// overlap, or by shorter ones.
template <std::size_t lanes, typename Bound, typename T1, typename T2>
inline std::size_t leading_of_few(const Bound bound, const T1* const data1, const T2* const data2,
                                  const std::size_t len) noexcept {
    constexpr std::size_t elements = is_complex_v<T2> ? lanes / 2 : lanes;
    if constexpr (lanes < 2) {
        return 0;
    } else {
        if (len < elements) {
            return leading_of_few<lanes / 2>(bound, data1, data2, len);
        }
        const std::size_t count = std::min(len, 2 * elements);
        Doubts<T1, T2, lanes> doubts;
        add_doubts<lanes>(doubts, bound, data1, data2);
        add_doubts<lanes>(doubts, bound, data1 + (count - elements), data2 + (count - elements));
        return doubts.none() ? count : 0;
    }
}

} // namespace for_baseline

// What the compiler has been told that the processor has.
struct baseline : for_baseline::loops {
    static constexpr const char* name = "baseline";

    static bool supported() noexcept { return true; }

#    if defined(__arm__)
    // NEON on 32-bit ARM takes subnormal numbers for zero and knows no doubles, so that it may only
    // look at the bits of reals.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool has_loop =
        std::is_integral_v<
            comparison_t<T1, T2>> || (std::is_same_v<T1, T2> && std::is_same_v<Bound, equality>);
#    endif

    // The same for fewer elements than a vector takes.
    template <typename Bound, typename T1, typename T2>
    [[gnu::noinline]] static std::size_t leading_of_few(const Bound bound, const T1* const data1,
                                                        const T2* const data2,
                                                        const std::size_t len) noexcept {
        constexpr std::size_t lanes = for_baseline::vector_bytes / sizeof(comparison_t<T1, T2>);
        return for_baseline::leading_of_few<lanes / 2>(bound, data1, data2, len);
    }
};

#endif

#if defined(__x86_64__)

#    if defined(__clang__)
#        pragma clang attribute push(__attribute__((target("avx2,fma"))), apply_to = function)
#    else
#        pragma GCC push_options
#        pragma GCC target("avx2,fma")
#    endif
namespace for_avx2 {
inline constexpr std::size_t vector_bytes = 32;
#    include "talnumericarray_avx2.h"
#    include "talnumericarray_sameq_vectors.h" // NOLINT(readability-duplicate-include)
} // namespace for_avx2
#    if defined(__clang__)
#        pragma clang attribute pop
#    else
#        pragma GCC pop_options
#    endif

struct avx2 : for_avx2::loops {
    static constexpr const char* name = "AVX2";

    static bool supported() noexcept {
        return static_cast<bool>(__builtin_cpu_supports("avx2"))
               && static_cast<bool>(__builtin_cpu_supports("fma"));
    }
};

#    if defined(__clang__)
#        pragma clang attribute push(                                                              \
            __attribute__((target("fma,avx512f,avx512bw,avx512dq,avx512vl"))),                     \
            apply_to = function)
#    else
#        pragma GCC push_options
#        pragma GCC diagnostic push
// GCC 12 takes what its own header leaves undefined for a mistake.
#        pragma GCC diagnostic ignored "-Wuninitialized"
#        pragma GCC diagnostic ignored "-Wmaybe-uninitialized"
#        pragma GCC target("fma,avx512f,avx512bw,avx512dq,avx512vl")
#    endif
namespace for_avx512 {
inline constexpr std::size_t vector_bytes = 64;
#    include "talnumericarray_avx512.h"
#    include "talnumericarray_sameq_vectors.h" // NOLINT(readability-duplicate-include)
} // namespace for_avx512
#    if defined(__clang__)
#        pragma clang attribute pop
#    else
#        pragma GCC diagnostic pop
#        pragma GCC pop_options
#    endif

struct avx512 : for_avx512::loops {
    static constexpr const char* name = "AVX-512";

    static bool supported() noexcept {
        return static_cast<bool>(__builtin_cpu_supports("avx512f"))
               && static_cast<bool>(__builtin_cpu_supports("avx512bw"))
               && static_cast<bool>(__builtin_cpu_supports("avx512dq"))
               && static_cast<bool>(__builtin_cpu_supports("avx512vl"));
    }
};

#endif

// The sets that there are loops for, the best one first. TALNUMERICARRAY_INSTRUCTION_SETS, a list
// with commas between, chooses others.
#if defined(TALNUMERICARRAY_INSTRUCTION_SETS)
using instruction_sets = type_list<TALNUMERICARRAY_INSTRUCTION_SETS>;
#elif defined(__OPTIMIZE_SIZE__)
using instruction_sets = type_list<none>;
#elif defined(__x86_64__)
using instruction_sets = type_list<avx512, avx2, baseline>;
#elif TALNUMERICARRAY_HAS_VECTORS
using instruction_sets = type_list<baseline>;
#else
using instruction_sets = type_list<none>;
#endif

// ---- The choice

template <typename Bound, typename T1, typename T2, typename... Sets>
constexpr bool any_has_loop(type_list<Sets...> /*sets*/) noexcept {
    return (... || Sets::template has_loop<Bound, T1, T2>);
}

// Leading elements that are certainly the same, by the best set that the processor has and that has
// vectors as short as what lies before the next end of a page.
template <typename... Sets, typename Bound, typename T1, typename T2>
inline std::size_t by_best_set(type_list<Sets...> sets, const Bound bound, const T1* data1,
                               const T2* data2, const std::size_t len) noexcept {
    if constexpr (!any_has_loop<Bound, T1, T2>(sets)) {
        return leading_one_by_one(bound, data1, data2, len);
    }
#if TALNUMERICARRAY_HAS_VECTORS
    else {
        for (std::size_t passed = 0;;) {
            const std::size_t left = len - passed;
            const std::size_t end = elements_before_page_end(data1 + passed, data2 + passed, left);
            std::size_t found = 0;
            const auto ask = [&](auto tag) noexcept {
                using Set = typename decltype(tag)::type;
                if (end < Set::template elements<T1, T2> || !Set::supported()) {
                    return false;
                }
                found =
                    Set::leading_certainly_same(bound, data1 + passed, data2 + passed, end, left);
                return true;
            };
            if ((... || ask(type_tag<Sets>{}))) {
                return passed + found;
            }
            found = baseline::leading_of_few(bound, data1 + passed, data2 + passed, end);
            passed += found;
            if (passed == len || found < end || found == 0) {
                return passed;
            }
        }
    }
#endif
}

// By what is known of the tolerance at this moment. For a pair of types in the order of the list.
//
// Where vectors find out only whether numbers are equal, they do that first; and equal numbers need
// no bound.
template <typename Sets, typename T1, typename T2>
[[gnu::noinline]] std::size_t by_known_bound(const talreal& tol, const T1* data1, const T2* data2,
                                             const std::size_t len) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (std::is_integral_v<T>) {
        return by_best_set(Sets{}, equality{}, data1, data2, len);
    } else {
        constexpr bool equal_first = !any_has_loop<nearness<T>, T1, T2>(Sets{});
        std::size_t passed = 0;
        if constexpr (equal_first) {
            passed = by_best_set(Sets{}, equality{}, data1, data2, len);
            if (passed == len) {
                return passed;
            }
        }
        const T divisor = certain_divisor(static_cast<T>(tol));
        if (divisor != 0) {
            return passed
                   + by_best_set(Sets{}, nearness<T>{divisor}, data1 + passed, data2 + passed,
                                 len - passed);
        }
        return equal_first ? passed : by_best_set(Sets{}, equality{}, data1, data2, len);
    }
}

// The number of leading elements of two arrays of `len` that can be passed over as the same.
//
// Being certainly the same is a question that the rule answers alike in either order, so that a
// pair of types and its reverse share a loop; and two arrays of complex numbers are arrays of twice
// as many reals.
template <typename Sets, typename T1, typename T2>
inline talint passed_over(const talreal& tol, const T1* data1, const T2* data2,
                          const talint len) noexcept {
    // A last pair alone is judged as fast as it is passed over.
    if (len < 2) {
        return 0;
    }
    const auto count = static_cast<std::size_t>(len);
    if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
        const auto* const parts1 = reinterpret_cast<const to_real_type_t<T1>*>(data1);
        const auto* const parts2 = reinterpret_cast<const to_real_type_t<T2>*>(data2);
        return static_cast<talint>(by_known_bound<Sets>(tol, parts1, parts2, 2 * count) / 2);
    } else if constexpr ((element_type_id<T1>) > element_type_id<T2>) {
        return static_cast<talint>(by_known_bound<Sets>(tol, data2, data1, count));
    } else {
        return static_cast<talint>(by_known_bound<Sets>(tol, data1, data2, count));
    }
}

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
