// Parameterised tests of a table, in which each case has a member `name` that names its test.

#pragma once

#include <gtest/gtest.h>

#include <cstddef>
#include <ostream>
#include <vector>

template <typename Case>
struct NamedCase : Case {
    explicit NamedCase(const Case& fields) : Case(fields) {}
};

template <typename Case>
std::ostream& operator<<(std::ostream& out, const NamedCase<Case>& named) {
    return out << named.name;
}

template <typename Case>
using NamedCaseTest = testing::TestWithParam<NamedCase<Case>>;

template <typename Case, std::size_t count>
auto named_cases(const Case (&table)[count]) {
    return testing::ValuesIn(std::vector<NamedCase<Case>>(table, table + count));
}

// For the last argument of INSTANTIATE_TEST_SUITE_P.
inline constexpr auto name_of_case = [](const auto& info) {
    return testing::PrintToString(info.param);
};
