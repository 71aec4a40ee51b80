// What talcmp knows about an element type: its size, its name and how its values are written.

#pragma once

#include "taldata_array_element_types.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <string>

namespace talcmp {

struct ElementType {
    type_t id;             // of `TalNumericArrayTypeId`
    char kind;             // 'i' signed, 'u' unsigned, 'f' real, 'c' complex: the letters of .npy
    std::size_t size;      // bytes
    std::size_t part_size; // bytes of a real or imaginary part; those of an element without parts
    std::size_t alignment; // bytes
    std::string name;      // NumPy's name: int8, float64, complex128

    // Writes the element at `element` in the fewest digits that read back as the same value; a NaN
    // with its bits. With `as_doubles`, a value of singles is written as the double of the same
    // value.
    std::string (*text)(const void* element, bool as_doubles);

    // The real and the imaginary part, rounded to doubles: signs, zeros and NaNs stay what they
    // are.
    std::array<double, 2> (*parts)(const void* element);
};

inline bool is_integer(const ElementType& type) {
    return type.kind == 'i' || type.kind == 'u';
}

inline bool is_complex(const ElementType& type) {
    return type.kind == 'c';
}

template <typename... Types>
constexpr std::size_t largest_size(type_list<Types...> /*types*/) {
    return std::max({sizeof(Types)...});
}

// The size in bytes of the largest element type.
inline constexpr std::size_t largest_element_size = largest_size(element_type_list{});

// All element types, in the order of their ids.
const std::array<ElementType, element_type_list::size>& element_types();

// The element type of an id from 1 to 12.
const ElementType& element_type(type_t id);

} // namespace talcmp
