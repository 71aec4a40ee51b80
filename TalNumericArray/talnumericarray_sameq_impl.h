// Dispatch from two records of the same shape to the routine for their pair of element types.
//
// `TalNumericArray_sameQ_impl` has three levels: by the first array's type, by the second array's
// type, and the pair routine, which compares bytes where the rule says so and otherwise walks the
// elements.

#ifndef TALNUMERICARRAY_SAMEQ_IMPL_H
#define TALNUMERICARRAY_SAMEQ_IMPL_H

#include "strict_floating_point.h"
#include "taldata_array.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_walk.h"
#include "type_properties.h"

#include <cstddef>
#include <cstring>
#include <type_traits>

#pragma GCC visibility push(hidden)
NESK_STRICT_SINGLES_BEGIN

namespace talnumericarray {

// Whether two arrays of `T` are the same exactly when their bytes are.
template <typename T>
inline bool compared_as_bytes(const talreal& tol) noexcept {
    return std::is_integral_v<T> || tol == 0.0;
}

// Calls `routine` with the tag of the element type that `id` names, and returns its answer; 0 for
// an id that names no type.
template <typename... Types, typename Routine>
inline int with_element_type(const type_t id, type_list<Types...> /*types*/,
                             const Routine& routine) noexcept {
    // Optimising compilers turn this chain of equalities into a range test and a jump table.
    int answer = 0;
    (void)(... || (id == element_type_id<Types> && (answer = routine(type_tag<Types>{}), true)));
    return answer;
}

} // namespace talnumericarray

// The pair routine: `na1` has elements of type `T1`, and `na2` of type `T2`.
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

// Selects the pair routine by the type of `na2`.
template <typename T1>
inline int TalNumericArray_sameQ_impl(const talreal& tol, TalNumericArray na1,
                                      TalNumericArray na2) noexcept {
    return talnumericarray::with_element_type(
        na2->data_type, element_type_list{}, [&](auto tag2) noexcept {
            return TalNumericArray_sameQ_impl<T1, typename decltype(tag2)::type>(tol, na1, na2);
        });
}

// Selects by the type of `na1`.
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
