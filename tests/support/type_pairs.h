// Calls an action for every element type of the module's list, and for every ordered pair of them.

#pragma once

#include "taldata_array_element_types.h"

#include <type_traits>

template <typename Action, typename... Types>
void for_each_type_of(const Action& action, type_list<Types...> /*list*/) {
    (action(type_tag<Types>{}), ...);
}

// Calls `action` with the tag of each type.
template <typename Action>
void for_each_type(const Action& action) {
    for_each_type_of(action, element_type_list{});
}

// Calls `action` with the two tags of each pair.
template <typename Action>
void for_each_pair_of_types(const Action& action) {
    for_each_type([&](auto tag1) { for_each_type([&](auto tag2) { action(tag1, tag2); }); });
}

// Two arrays of one integer type are compared as bytes, all others element by element.
template <typename T1, typename T2>
inline constexpr bool have_loop = !(std::is_same_v<T1, T2> && std::is_integral_v<T1>);

template <typename Action>
void for_each_pair_with_loop(const Action& action) {
    for_each_pair_of_types([&](auto tag1, auto tag2) {
        if constexpr (have_loop<typename decltype(tag1)::type, typename decltype(tag2)::type>) {
            action(tag1, tag2);
        }
    });
}
