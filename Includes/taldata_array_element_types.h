// The list of the element types, in the order of their ids.
//
// Whatever is needed once per element type (dispatch, tables, tests) is generated from this list.

#ifndef TALDATA_ARRAY_ELEMENT_TYPES_H
#define TALDATA_ARRAY_ELEMENT_TYPES_H

#include "taldata_array_types.h"
#include "type_properties.h"

#include <complex>
#include <cstddef>
#include <type_traits>

template <typename... Types>
struct type_list {
    static constexpr std::size_t size = sizeof...(Types);
};

// Names a type without making a value of it.
template <typename T>
struct type_tag {
    using type = T;
};

using element_type_list = type_list<BIT8, UBIT8, BIT16, UBIT16, BIT32, UBIT32, BIT64, UBIT64, float,
                                    double, std::complex<float>, std::complex<double>>;

// The number of types before `T` in the list.
template <typename T, typename... Types>
constexpr int position_in_list(type_list<Types...> /*types*/) noexcept {
    int position = 0;
    (void)(... || (std::is_same_v<T, Types> || (++position, false)));
    return position;
}

// The id of element type `T`.
template <typename T>
inline constexpr type_t element_type_id = position_in_list<T>(element_type_list{}) + 1;

static_assert(element_type_list::size == COMPLEX_REAL64_TYPE);
static_assert(element_type_id<BIT8> == BIT8_TYPE && element_type_id<UBIT8> == UBIT8_TYPE);
static_assert(element_type_id<BIT16> == BIT16_TYPE && element_type_id<UBIT16> == UBIT16_TYPE);
static_assert(element_type_id<BIT32> == BIT32_TYPE && element_type_id<UBIT32> == UBIT32_TYPE);
static_assert(element_type_id<BIT64> == BIT64_TYPE && element_type_id<UBIT64> == UBIT64_TYPE);
static_assert(element_type_id<float> == REAL32_TYPE && element_type_id<double> == REAL64_TYPE);
static_assert(element_type_id<std::complex<float>> == COMPLEX_REAL32_TYPE);
static_assert(element_type_id<std::complex<double>> == COMPLEX_REAL64_TYPE);
static_assert(sizeof(std::complex<float>) == 8 && sizeof(std::complex<double>) == 16,
              "a complex element is its real part and its imaginary part, without padding");

#endif
