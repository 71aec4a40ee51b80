// From two records of one shape to one routine for their pair of element types.
//
// Three levels of one name: by the first array's type, by the second's, and the routine for the
// pair, which compares bytes where that is the rule and walks the elements where it is not.

#ifndef TALNUMERICARRAY_SAMEQ_IMPL_H
#define TALNUMERICARRAY_SAMEQ_IMPL_H

#include "taldata_array.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_elements.h"
#include "type_properties.h"

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <type_traits>

#pragma GCC visibility push(hidden)
NESK_STRICT_SINGLES_BEGIN

namespace talnumericarray {

// Whether two arrays of element type `T` are the same exactly when their bytes are.
template <typename T>
inline bool compared_as_bytes(const talreal& tol) noexcept {
    return std::is_integral_v<T> || tol == 0.0;
}

// The elements one by one, in order, up to the first pair that is not the same. A count below 1 is
// no elements.
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

// The elements from one in doubt on. The rule is asked about that and about every pair in doubt
// behind it; the others are passed over.
template <typename Sets, typename T1, typename T2>
[[gnu::noinline]] int doubtful_sameQ(const talreal& tol, const T1* data1, const T2* data2,
                                     const talint len) noexcept {
    // As long as vectors pass none, the stretches that the rule is asked about grow, so that
    // looking in vain costs next to nothing.
    constexpr talint longest_stretch = 1024;
    talint stretch = 1;
    for (talint i = 0; i < len;) {
        const talint judged = std::min(stretch, len - i);
        if (each_sameQ(tol, data1 + i, data2 + i, judged) == 0) {
            return 0;
        }
        i += judged;
        const talint passed = passed_over<Sets>(tol, data1 + i, data2 + i, len - i);
        i += passed;
        stretch = passed > 0 ? 1 : std::min(2 * stretch, longest_stretch);
    }
    return 1;
}

// The same answer as that of the elements one by one, and the same factor remembered after it.
//
// The rule is asked about the first pair, where most different arrays differ and which may put the
// factor in the cache. With vectors, a routine that ends there has next to nothing to set up.
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
        const talint sure = 1 + passed_over<Sets>(tol, data1 + 1, data2 + 1, len - 1);
        if (sure == len) {
            return 1;
        }
        // The rule says the same in either order, so that a pair of types and its reverse share
        // what is left.
        if constexpr (element_type_id<T1> <= element_type_id<T2>) {
            return doubtful_sameQ<Sets>(tol, data1 + sure, data2 + sure, len - sure);
        } else {
            return doubtful_sameQ<Sets>(tol, data2 + sure, data1 + sure, len - sure);
        }
    } else if constexpr (std::is_floating_point_v<comparison_t<T1, T2>>) {
        for (talint i = 0; i < len; ++i) {
            if (!sameQ_test(tol, data1[i], data2[i])) {
                return 0;
            }
            i += passed_over<Sets>(tol, data1 + i + 1, data2 + i + 1, len - i - 1);
        }
        return 1;
    } else {
        return each_sameQ(tol, data1, data2, len);
    }
}

// Calls `routine` with the tag of the element type that `id` names and returns its answer; 0 for an
// id that names none.
template <typename... Types, typename Routine>
inline int with_element_type(const type_t id, type_list<Types...> /*types*/,
                             const Routine& routine) noexcept {
    // Optimising compilers make one unsigned range test and a jump table of this chain of
    // equalities.
    int answer = 0;
    (void)(... || (id == element_type_id<Types> && (answer = routine(type_tag<Types>{}), true)));
    return answer;
}

} // namespace talnumericarray

// The pair routine: `na1` has elements of type `T1`, `na2` of type `T2`, and their shapes are
// equal.
template <typename T1, typename T2>
[[gnu::noinline]] int TalNumericArray_sameQ_impl(const talreal& tol, TalNumericArray na1,
                                                 TalNumericArray na2) noexcept {
    const T1* data1 = static_cast<const T1*>(na1->data);
    const T2* data2 = static_cast<const T2*>(na2->data);
    const talint len = na1->nelems;
    if constexpr (std::is_same_v<T1, T2>) {
        if (talnumericarray::compared_as_bytes<T1>(tol)) {
            const std::size_t bytes = static_cast<std::size_t>(len) * sizeof(T1);
            return std::memcmp(data1, data2, bytes) == 0 ? 1 : 0;
        }
    }
    return talnumericarray::elements_sameQ<talnumericarray::instruction_sets>(tol, data1, data2,
                                                                              len);
}

// The row: selects the pair routine by the type of `na2`.
template <typename T1>
inline int TalNumericArray_sameQ_impl(const talreal& tol, TalNumericArray na1,
                                      TalNumericArray na2) noexcept {
    return talnumericarray::with_element_type(
        na2->data_type, element_type_list{}, [&](auto tag2) noexcept {
            return TalNumericArray_sameQ_impl<T1, typename decltype(tag2)::type>(tol, na1, na2);
        });
}

// Selects the row by the type of `na1`.
inline int TalNumericArray_sameQ_impl(const talreal& tol, TalNumericArray na1,
                                      TalNumericArray na2) noexcept {
    return talnumericarray::with_element_type(
        na1->data_type, element_type_list{}, [&](auto tag1) noexcept {
            return TalNumericArray_sameQ_impl<typename decltype(tag1)::type>(tol, na1, na2);
        });
}

NESK_STRICT_SINGLES_END
#pragma GCC visibility pop

#endif
