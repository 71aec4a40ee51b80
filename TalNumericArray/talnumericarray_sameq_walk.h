// The walk over the elements of two arrays that are not compared as bytes.
//
// The element test decides, in order, up to the first pair that is not the same. Elements that are
// certainly the same are passed over, with vectors where there are any: this changes neither the
// answer nor the factor that is remembered afterwards.

#ifndef TALNUMERICARRAY_SAMEQ_WALK_H
#define TALNUMERICARRAY_SAMEQ_WALK_H

#include "strict_floating_point.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_certainty.h"
#include "talnumericarray_sameq_elements.h"
#include "talnumericarray_vectors.h"
#include "to_type.h"
#include "type_properties.h"

#include <algorithm>
#include <cstddef>
#include <type_traits>

#pragma GCC visibility push(hidden)

namespace talnumericarray {

// ---- The certain prefix: the leading elements of two arrays of `len` that are certainly the same
//
// Each function returns the length of the prefix that it finds. A longer one may exist.

// For a pair of types in the order of the list.
//
// A set needs a whole vector before the end of the page. If none fits there, shorter vectors take
// what the page still has, and the next page gets a new choice.
template <typename... Sets, typename Bound, typename T1, typename T2>
inline std::size_t certain_prefix_by_best_set(type_list<Sets...> sets, const Bound bound,
                                              const T1* data1, const T2* data2,
                                              const std::size_t len) noexcept {
    if constexpr (!any_has_loop<Bound, T1, T2>(sets)) {
        return certain_prefix_one_by_one(bound, data1, data2, len);
    }
#if TALNUMERICARRAY_HAS_VECTORS
    else {
        for (std::size_t passed = 0;;) {
            const std::size_t left = len - passed;
            const std::size_t end = elements_before_page_end(data1 + passed, data2 + passed, left);
            std::size_t found = 0;
            const auto pass_over = [&](auto tag) noexcept {
                using Set = typename decltype(tag)::type;
                if (end < Set::template elements<T1, T2> || !Set::supported()) {
                    return false;
                }
                found = Set::certain_prefix(bound, data1 + passed, data2 + passed, end, left);
                return true;
            };
            if ((... || pass_over(type_tag<Sets>{}))) {
                return passed + found;
            }
            found = baseline::short_certain_prefix(bound, data1 + passed, data2 + passed, end);
            passed += found;
            if (passed == len || found < end || found == 0) {
                return passed;
            }
        }
    }
#endif
}

// For a pair of types in the order of the list, under the bound that the tolerance gives at this
// moment: equality, or nearness once there is a divisor.
//
// Vectors that can only test for equality do so first; equal numbers need no divisor.
template <typename Sets, typename T1, typename T2>
[[gnu::noinline]] std::size_t certain_prefix_by_known_bound(const talreal& tol, const T1* data1,
                                                            const T2* data2,
                                                            const std::size_t len) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (std::is_integral_v<T>) {
        return certain_prefix_by_best_set(Sets{}, equality{}, data1, data2, len);
    } else {
        constexpr bool equal_first = !any_has_loop<nearness<T>, T1, T2>(Sets{});
        std::size_t passed = 0;
        if constexpr (equal_first) {
            passed = certain_prefix_by_best_set(Sets{}, equality{}, data1, data2, len);
            if (passed == len) {
                return passed;
            }
        }
        const T divisor = certain_divisor(static_cast<T>(tol));
        if (divisor != 0) {
            return passed
                   + certain_prefix_by_best_set(Sets{}, nearness<T>{divisor}, data1 + passed,
                                                data2 + passed, len - passed);
        }
        return equal_first ? passed
                           : certain_prefix_by_best_set(Sets{}, equality{}, data1, data2, len);
    }
}

// For any pair of types.
//
// The order of two elements never matters to the rule, so a pair of types and its reverse share
// their loops. Two arrays of complex numbers are arrays of twice as many reals.
template <typename Sets, typename T1, typename T2>
inline talint certain_prefix(const talreal& tol, const T1* data1, const T2* data2,
                             const talint len) noexcept {
    // The element test is as fast for a single pair.
    if (len < 2) {
        return 0;
    }
    const auto count = static_cast<std::size_t>(len);
    if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
        const auto* const parts1 = reinterpret_cast<const to_real_type_t<T1>*>(data1);
        const auto* const parts2 = reinterpret_cast<const to_real_type_t<T2>*>(data2);
        return static_cast<talint>(
            certain_prefix_by_known_bound<Sets>(tol, parts1, parts2, 2 * count) / 2);
    } else if constexpr ((element_type_id<T1>) > element_type_id<T2>) {
        return static_cast<talint>(certain_prefix_by_known_bound<Sets>(tol, data2, data1, count));
    } else {
        return static_cast<talint>(certain_prefix_by_known_bound<Sets>(tol, data1, data2, count));
    }
}

// ---- The walk

NESK_STRICT_SINGLES_BEGIN

// The element test alone. A `len` below 1 means no elements.
template <typename T1, typename T2>
inline int each_sameQ(const talreal& tol, const T1* data1, const T2* data2,
                      const talint len) noexcept {
    for (talint i = 0; i < len; ++i) {
        if (!sameQ_test(tol, data1[i], data2[i])) {
            return 0;
        }
    }
    return 1;
}

// Walks on from a pair in doubt: alternately a stretch for the element test and a certain prefix of
// the rest.
template <typename Sets, typename T1, typename T2>
[[gnu::noinline]] int doubtful_sameQ(const talreal& tol, const T1* data1, const T2* data2,
                                     const talint len) noexcept {
    // While vectors pass over nothing, the stretches grow, so that trying in vain costs next to
    // nothing.
    constexpr talint longest_stretch = 1024;
    talint stretch = 1;
    for (talint i = 0; i < len;) {
        const talint judged = std::min(stretch, len - i);
        if (each_sameQ(tol, data1 + i, data2 + i, judged) == 0) {
            return 0;
        }
        i += judged;
        const talint passed = certain_prefix<Sets>(tol, data1 + i, data2 + i, len - i);
        i += passed;
        stretch = passed > 0 ? 1 : std::min(2 * stretch, longest_stretch);
    }
    return 1;
}

// Gives the answer of `each_sameQ`, and leaves the same factor remembered.
//
// The first pair gets the element test: most different arrays differ there, and it may put the
// factor in the cache. The walk with vectors that follows is out of line, so a call that ends at
// the first pair has little to set up.
template <typename Sets, typename T1, typename T2>
inline int elements_sameQ(const talreal& tol, const T1* data1, const T2* data2,
                          const talint len) noexcept {
    if constexpr (any_has_loop<equality, T1, T2>(Sets{})) {
        if (len < 1) {
            return 1;
        }
        if (!sameQ_test(tol, data1[0], data2[0])) {
            return 0;
        }
        const talint passed = 1 + certain_prefix<Sets>(tol, data1 + 1, data2 + 1, len - 1);
        if (passed == len) {
            return 1;
        }
        // As in `certain_prefix`, a pair of types and its reverse share the loop.
        if constexpr (element_type_id<T1> <= element_type_id<T2>) {
            return doubtful_sameQ<Sets>(tol, data1 + passed, data2 + passed, len - passed);
        } else {
            return doubtful_sameQ<Sets>(tol, data2 + passed, data1 + passed, len - passed);
        }
    } else if constexpr (std::is_floating_point_v<comparison_t<T1, T2>>) {
        for (talint i = 0; i < len; ++i) {
            if (!sameQ_test(tol, data1[i], data2[i])) {
                return 0;
            }
            i += certain_prefix<Sets>(tol, data1 + i + 1, data2 + i + 1, len - i - 1);
        }
        return 1;
    } else {
        return each_sameQ(tol, data1, data2, len);
    }
}

NESK_STRICT_SINGLES_END

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
