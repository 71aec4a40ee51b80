// What is proved: the functions below are compiled to LLVM's intermediate representation, from
// which the formulas of the proofs are made, and to libraries that are held against these formulas.

#include "compare.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_certainty.h"
#include "talnumericarray_sameq_elements.h"
#include "talnumericarray_sameq_impl.h"
#include "to_type.h"
#include "type_pairs.h"
#include "type_properties.h"

#include <complex>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <utility>

namespace proved {

using talnumericarray::comparison_t;

// ---- Scalars

// The rule for two reals, and for two integers.
template <typename T>
int compare_reals(const T tol, const T x, const T y) {
    return nesk::detail::compare_impl(tol, x, y);
}

template <typename T1, typename T2>
int compare_integers(const T1 x, const T2 y) {
    return nesk::detail::compare_impl(x, y);
}

// The element test.
template <typename T1, typename T2>
bool same(const double tol, const T1* const x, const T2* const y) {
    return sameQ_test(tol, *x, *y);
}

template <typename T>
T divisor_of(const T tol) {
    return talnumericarray::certain_divisor(tol);
}

template <typename T>
T factor_of(const T tol) {
    return nesk::ToleranceShiftFactor(tol);
}

// Which element type the dispatch finds for an id; 0 for none.
int element_type(const type_t id) {
    return talnumericarray::with_element_type(id, element_type_list{}, [](auto tag) {
        return int{element_type_id<typename decltype(tag)::type>};
    });
}

// ---- The tests for certainty of one pair, and of `lanes` pairs in each of some vectors
//
// A divisor of type `T` stands for nearness, and `equality` for itself.

struct equal {};

inline talnumericarray::equality bound_of(equal /*none*/) {
    return {};
}

template <typename T>
talnumericarray::nearness<T> bound_of(const T divisor) {
    return {divisor};
}

template <typename Bound, typename T1, typename T2>
bool certain(const Bound bound, const T1* const x, const T2* const y) {
    return talnumericarray::certainly_same(bound_of(bound), *x, *y);
}

#if TALNUMERICARRAY_HAS_VECTORS

struct baseline : talnumericarray::baseline {
    static constexpr std::size_t bytes = talnumericarray::for_baseline::vector_bytes;

    template <std::size_t lanes, std::size_t vectors, typename Bound, typename T1, typename T2>
    static bool block(const Bound bound, const T1* const x, const T2* const y) {
        return talnumericarray::for_baseline::certainly_same_block<lanes, vectors>(bound, x, y);
    }
};

#endif

#if defined(__x86_64__)

struct avx2 : talnumericarray::avx2 {
    static constexpr std::size_t bytes = talnumericarray::for_avx2::vector_bytes;

    template <std::size_t lanes, std::size_t vectors, typename Bound, typename T1, typename T2>
    static bool block(const Bound bound, const T1* const x, const T2* const y) {
        return talnumericarray::for_avx2::certainly_same_block<lanes, vectors>(bound, x, y);
    }
};

struct avx512 : talnumericarray::avx512 {
    static constexpr std::size_t bytes = talnumericarray::for_avx512::vector_bytes;

    template <std::size_t lanes, std::size_t vectors, typename Bound, typename T1, typename T2>
    static bool block(const Bound bound, const T1* const x, const T2* const y) {
        return talnumericarray::for_avx512::certainly_same_block<lanes, vectors>(bound, x, y);
    }
};

using sets = type_list<avx512, avx2, baseline>;
#elif TALNUMERICARRAY_HAS_VECTORS
using sets = type_list<baseline>;
#else
using sets = type_list<>;
#endif

template <typename Set, std::size_t vectors, typename Bound, typename T1, typename T2>
bool block(const Bound bound, const T1* const x, const T2* const y) {
    constexpr std::size_t lanes = Set::bytes / sizeof(comparison_t<T1, T2>);
    return Set::template block<lanes, vectors>(bound_of(bound), x, y);
}

// `len` elements, which do not fill a vector.
template <std::size_t len, typename Bound, typename T1, typename T2>
std::size_t short_prefix(const Bound bound, const T1* const x, const T2* const y) {
    return baseline::short_certain_prefix(bound_of(bound), x, y, len);
}

// ---- All of them

// Every function whose address comes here is compiled.
const void* volatile kept;

template <typename... Functions>
void keep(const Functions... functions) {
    ((kept = reinterpret_cast<const void*>(functions)), ...);
}

template <typename Bound, typename T1, typename T2, std::size_t... lens>
void keep_short(std::index_sequence<lens...> /*lens*/) {
    keep(&short_prefix<lens + 1, Bound, T1, T2>...);
}

template <typename Bound, typename T1, typename T2, typename... Sets>
void keep_tests(type_list<Sets...> /*sets*/) {
    // Integers are tested by vectors or by the rule.
    if constexpr (!std::is_integral_v<comparison_t<T1, T2>>) {
        keep(&certain<Bound, T1, T2>);
    }
    using TestBound = decltype(bound_of(Bound{}));
    const auto keep_set = [](auto tag) {
        using Set = typename decltype(tag)::type;
        if constexpr (Set::template has_loop<TestBound, T1, T2>) {
            keep(&block<Set, 1, Bound, T1, T2>,
                 &block<Set, talnumericarray::vectors_per_block, Bound, T1, T2>);
        }
    };
    (keep_set(type_tag<Sets>{}), ...);
    if constexpr (baseline::has_loop<TestBound, T1, T2>) {
        keep_short<Bound, T1, T2>(std::make_index_sequence<baseline::elements<T1, T2> - 1>{});
    }
}

template <typename T1, typename T2>
void keep_pair() {
    keep(&same<T1, T2>);
    if constexpr (std::is_integral_v<T1> && std::is_integral_v<T2>) {
        keep(&compare_integers<T1, T2>);
    }
    // A pair of types and its reverse share a loop, and complex numbers are compared as reals.
    if constexpr (!is_complex_v<T1> && (element_type_id<T1>) <= element_type_id<T2>) {
        keep_tests<equal, T1, T2>(sets{});
        if constexpr (!std::is_integral_v<comparison_t<T1, T2>>) {
            keep_tests<comparison_t<T1, T2>, T1, T2>(sets{});
        }
    }
}

// All of them, unless some are named.
void keep_all() {
#if defined(PROVED_FUNCTIONS)
    keep(PROVED_FUNCTIONS);
#else
    keep(&compare_reals<float>, &compare_reals<double>, &divisor_of<float>, &divisor_of<double>,
         &factor_of<float>, &factor_of<double>);
    for_each_pair_of_types([](auto tag1, auto tag2) {
        keep_pair<typename decltype(tag1)::type, typename decltype(tag2)::type>();
    });
#endif
}

// The factor that the next comparison remembers.
template <typename T>
void remember(const T lasttol, const T factor) {
    nesk::remember_factor<T>({lasttol, factor});
}

template void remember(float, float);
template void remember(double, double);

} // namespace proved

// What the thread remembers, of singles and of doubles.
extern "C" void* remembered_by_thread(const bool of_doubles) {
    return of_doubles ? static_cast<void*>(&nesk::factor_cache_of_thread<double>())
                      : static_cast<void*>(&nesk::factor_cache_of_thread<float>());
}

#if defined(__SSE2__)
extern "C" void set_control_word(const unsigned word) {
    __builtin_ia32_ldmxcsr(word);
}
#endif
