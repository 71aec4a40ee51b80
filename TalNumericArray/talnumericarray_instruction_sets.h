// The instruction sets that have loops, and the choice between them.
//
// The walk takes the first set in `instruction_sets` that the processor supports and whose full
// vector fits before the end of the page.

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
// The loops of each set (`talnumericarray_sameq_vectors.h`) are compiled in a namespace of their
// own, for the set's target.

// No vectors: the elements one by one.
struct none {
    static constexpr const char* name = "none";

    static bool supported() noexcept { return true; }

    template <typename Bound, typename T1, typename T2>
    static constexpr bool has_loop = false;
};

#if TALNUMERICARRAY_HAS_VECTORS

namespace for_baseline {
inline constexpr std::size_t vector_bytes = 16;
#    if defined(__SSE2__)
#        include "talnumericarray_sse2.h"
#    else
#        include "talnumericarray_neon.h"
#    endif
#    include "talnumericarray_sameq_vectors.h"
} // namespace for_baseline

// The instructions that the compiler may use everywhere.
struct baseline : for_baseline::loops {
    static constexpr const char* name = "baseline";

    static bool supported() noexcept { return true; }

#    if defined(__arm__)
    // On 32-bit ARM, NEON takes subnormal numbers for zero and has no doubles. So it may compare
    // only the bits of reals.
    template <typename Bound, typename T1, typename T2>
    static constexpr bool has_loop =
        std::is_integral_v<
            comparison_t<T1, T2>> || (std::is_same_v<T1, T2> && std::is_same_v<Bound, equality>);
#    endif
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
// GCC 12 warns of values that its own header leaves undefined on purpose.
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

    // Every processor with AVX-512 has FMA.
    static bool supported() noexcept {
        return static_cast<bool>(__builtin_cpu_supports("avx512f"))
               && static_cast<bool>(__builtin_cpu_supports("avx512bw"))
               && static_cast<bool>(__builtin_cpu_supports("avx512dq"))
               && static_cast<bool>(__builtin_cpu_supports("avx512vl"));
    }
};

#endif

// ---- The choice

// Best first. TALNUMERICARRAY_INSTRUCTION_SETS may name others, separated by commas.
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

template <typename Bound, typename T1, typename T2, typename... Sets>
constexpr bool any_has_loop(type_list<Sets...> /*sets*/) noexcept {
    return (... || Sets::template has_loop<Bound, T1, T2>);
}

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
