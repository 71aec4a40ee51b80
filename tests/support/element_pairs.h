// Runs a check for every ordered pair of element types.

#ifndef TALNUMERICARRAY_TESTS_ELEMENT_PAIRS_H
#define TALNUMERICARRAY_TESTS_ELEMENT_PAIRS_H

#include "taldata_array_element_types.h"

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <utility>

template <typename... Types, typename Check>
void for_each_type(type_list<Types...> /*types*/, const Check& check) {
    (..., check(type_tag<Types>{}));
}

// Calls `check` with the tags of both types, 144 times.
template <typename Check>
void for_each_pair(const Check& check) {
    std::set<std::pair<type_t, type_t>> pairs;
    for_each_type(element_type_list{}, [&](const auto tag1) {
        for_each_type(element_type_list{}, [&](const auto tag2) {
            const type_t id1 = element_type_id<typename decltype(tag1)::type>;
            const type_t id2 = element_type_id<typename decltype(tag2)::type>;
            SCOPED_TRACE("element types " + std::to_string(id1) + " and " + std::to_string(id2));
            check(tag1, tag2);
            pairs.emplace(id1, id2);
        });
    });
    EXPECT_EQ(pairs.size(), 144U);
}

#endif
