// The element types at run time, made from the module's list, and a function that visits every
// ordered pair of them.

#pragma once

#include "taldata_array_element_types.h"
#include "to_type.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <type_traits>

struct ElementType {
    type_t id;
    std::size_t size;      // bytes
    std::size_t part_size; // bytes of a real or imaginary part, or of an element that has none
    std::size_t alignment;
    bool is_integer;
    bool is_signed;
    void (*store_parts)(void* element, double real, double imaginary);

    bool is_complex() const { return size != part_size; }
    bool holds_doubles() const { return !is_integer && part_size == sizeof(double); }

    // An integer drops the fraction, and stores 1 for an infinity or a NaN.
    void store(void* element, const double real, const double imaginary = 0) const {
        store_parts(element, real, imaginary);
    }
};

template <typename T>
void store_parts_of(void* element, const double real, const double imaginary) {
    using Part = to_real_type_t<T>;
    const auto part = [](const double value) {
        if constexpr (std::is_integral_v<Part>) {
            return std::isfinite(value) ? static_cast<Part>(static_cast<std::int64_t>(value))
                                        : Part{1};
        } else {
            return static_cast<Part>(value);
        }
    };
    const Part parts[] = {part(real), part(imaginary)};
    std::memcpy(element, parts, sizeof(T));
}

template <typename... Types>
constexpr std::array<ElementType, sizeof...(Types)>
make_element_types(type_list<Types...> /*list*/) {
    return {ElementType{element_type_id<Types>, sizeof(Types), sizeof(to_real_type_t<Types>),
                        alignof(Types), std::is_integral_v<Types>,
                        std::is_signed_v<to_real_type_t<Types>>, store_parts_of<Types>}...};
}

inline constexpr auto element_types = make_element_types(element_type_list{});

template <typename T>
constexpr const ElementType& element_type_of() {
    return element_types[static_cast<std::size_t>(element_type_id<T> - 1)];
}

// Calls `check(type1, type2)` for all 144 ordered pairs.
template <typename Check>
void for_each_pair(const Check& check) {
    int pairs = 0;
    for (const ElementType& type1 : element_types) {
        for (const ElementType& type2 : element_types) {
            SCOPED_TRACE("element types " + std::to_string(type1.id) + " and "
                         + std::to_string(type2.id));
            check(type1, type2);
            ++pairs;
        }
    }
    EXPECT_EQ(pairs, 144);
}

// The digits of the reals that elements of the two types are compared as; 0 for integers.
inline int compared_digits(const ElementType& type1, const ElementType& type2) {
    return type1.is_integer && type2.is_integer             ? 0
           : type1.holds_doubles() || type2.holds_doubles() ? std::numeric_limits<double>::digits
                                                            : std::numeric_limits<float>::digits;
}

// An element of each type, without imaginary parts.
struct Values {
    double value1, value2;
};

// A usual number and another, which goes to a side whose type holds every real that is compared.
inline Values usual_and(const ElementType& type1, const ElementType& type2, const double usual,
                        const double other) {
    const bool doubles = type1.holds_doubles() || type2.holds_doubles();
    const bool second_holds_it = doubles ? type2.holds_doubles() : !type2.is_integer;
    return second_holds_it ? Values{usual, other} : Values{other, usual};
}

// 3 and a real that is near it. No two integers are near each other.
inline Values near_threes(const ElementType& type1, const ElementType& type2) {
    const bool doubles = compared_digits(type1, type2) == std::numeric_limits<double>::digits;
    return usual_and(type1, type2, 3, doubles ? 3 + 0x1p-44 : 3 + 0x1p-15);
}
