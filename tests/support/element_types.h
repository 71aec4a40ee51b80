// The element types at run time, made from the one list, and a check for every ordered pair of
// them.

#ifndef TALNUMERICARRAY_TESTS_ELEMENT_TYPES_H
#define TALNUMERICARRAY_TESTS_ELEMENT_TYPES_H

#include "taldata_array_element_types.h"
#include "to_type.h"

#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <cstring>
#include <string>
#include <type_traits>

struct ElementType {
    type_t id;
    std::size_t size;      // bytes
    std::size_t part_size; // bytes of a real or imaginary part; those of the element without parts
    bool is_integer;
    void (*store)(void* element, double value); // an integer holds no fraction
};

template <typename T>
void store_element(void* element, const double value) {
    const T stored = static_cast<to_real_type_t<T>>(value);
    std::memcpy(element, &stored, sizeof stored);
}

template <typename... Types>
constexpr std::array<ElementType, sizeof...(Types)>
make_element_types(type_list<Types...> /*list*/) {
    return {ElementType{element_type_id<Types>, sizeof(Types), sizeof(to_real_type_t<Types>),
                        std::is_integral_v<Types>, store_element<Types>}...};
}

inline constexpr auto element_types = make_element_types(element_type_list{});

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

#endif
