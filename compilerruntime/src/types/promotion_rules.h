// The common type of two scalar types.

#ifndef NESK_PROMOTION_RULES_H
#define NESK_PROMOTION_RULES_H

#include <type_traits>

namespace promotion_rules {

template <typename T1, typename T2>
constexpr auto common_type() noexcept {
    static_assert(std::is_arithmetic_v<T1> && std::is_arithmetic_v<T2>,
                  "only integers and reals have a common type");
    using wider = std::conditional_t<(sizeof(T1) < sizeof(T2)), T2, T1>;
    if constexpr (std::is_same_v<T1, double> || std::is_same_v<T2, double>) {
        return double{};
    } else if constexpr (std::is_same_v<T1, float> || std::is_same_v<T2, float>) {
        return float{};
    } else if constexpr (std::is_signed_v<T1> == std::is_signed_v<T2>) {
        return wider{};
    } else {
        return std::make_unsigned_t<wider>{};
    }
}

} // namespace promotion_rules

// The type in which a `T1` and a `T2` are compared: double if either is double; otherwise float if
// either is float, whatever the width of the other; for two integers of one signedness the wider
// type, and for mixed signedness the unsigned type of the wider width.
template <typename T1, typename T2>
using type_common_t = decltype(promotion_rules::common_type<T1, T2>());

#endif
