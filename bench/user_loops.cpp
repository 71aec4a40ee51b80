// Compiled twice: USER_LOOP is the name of the function under the flags in force.

#include "user_loops.h"

#include "filled_arrays.h"
#include "promotion_rules.h"
#include "taldata_array_element_types.h"
#include "to_type.h"
#include "type_properties.h"

#include <algorithm>
#include <cmath>
#include <type_traits>

// What is compiled twice needs two names, or the linker would keep only one copy: all code of the
// loops is in this namespace, of which each file has its own, or inlined.
namespace {

template <typename T>
bool near(const T relative, const T x, const T y) {
    return std::fabs(x - y) <= relative * std::max(std::fabs(x), std::fabs(y));
}

template <typename R1, typename R2>
bool same_parts([[maybe_unused]] const double relative, const R1 part1, const R2 part2) {
    using R = type_common_t<R1, R2>;
    if constexpr (std::is_floating_point_v<R>) {
        return near(static_cast<R>(relative), static_cast<R>(part1), static_cast<R>(part2));
    } else if constexpr (std::is_signed_v<R1> == std::is_signed_v<R2>) {
        return part1 == part2;
    } else if constexpr (std::is_signed_v<R1>) {
        return part1 >= 0 && static_cast<std::make_unsigned_t<R1>>(part1) == part2;
    } else {
        return part2 >= 0 && part1 == static_cast<std::make_unsigned_t<R2>>(part2);
    }
}

template <typename T1, typename T2>
bool same_elements(const double relative, const T1* const element1, const T2* const element2) {
    // Not with functions of the standard library, whose names are the same in both files.
    const auto* const parts1 = reinterpret_cast<const to_real_type_t<T1>*>(element1);
    const auto* const parts2 = reinterpret_cast<const to_real_type_t<T2>*>(element2);
    if (!same_parts(relative, parts1[0], parts2[0])) {
        return false;
    }
    if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
        return same_parts(relative, parts1[1], parts2[1]);
    } else if constexpr (is_complex_v<T1>) {
        return parts1[1] == 0;
    } else if constexpr (is_complex_v<T2>) {
        return parts2[1] == 0;
    } else {
        return true;
    }
}

template <typename T1, typename T2>
bool same_arrays(const double relative, const void* const memory1, const void* const memory2,
                 const talint len) {
    const T1* const data1 = static_cast<const T1*>(memory1);
    const T2* const data2 = static_cast<const T2*>(memory2);
    for (talint i = 0; i < len; ++i) {
        if (!same_elements(relative, data1 + i, data2 + i)) {
            return false;
        }
    }
    return true;
}

} // namespace

UserLoop USER_LOOP(const type_t id1, const type_t id2) {
    UserLoop found = nullptr;
    for_each_pair_with_loop([&](auto tag1, auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        if (id1 == element_type_id<T1> && id2 == element_type_id<T2>) {
            found = same_arrays<T1, T2>;
        }
    });
    return found;
}
