// The real-part type of a scalar type.

#ifndef NESK_TO_TYPE_H
#define NESK_TO_TYPE_H

#include <complex>
#include <type_traits>

template <typename T>
struct to_real_type {
    using type = T;
};

template <typename T>
struct to_real_type<std::complex<T>> {
    using type = T;
};

// The type of the parts of a complex `T`; a real or integer type is its own.
template <typename T>
using to_real_type_t = typename to_real_type<T>::type;

template <typename T>
inline constexpr bool is_complex_v = !std::is_same_v<T, to_real_type_t<T>>;

#endif
