// The search for pairs that differ, in elements after which nothing can be read.

#include "pairs.h"

#include "../support/protected_memory.h"

#include "support/type_names.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <limits>

namespace {

template <typename T>
class PairSearch : public testing::Test {};

using Types = testing::Types<std::int8_t, std::int64_t, float, double>;
TYPED_TEST_SUITE(PairSearch, Types, TypeNames);

TYPED_TEST(PairSearch, FindsTheFirstDifferenceAndReadsNothingPastTheElements) {
    using T = TypeParam;
    constexpr std::size_t longest = 150;
    const ProtectedMemory memory1(longest * sizeof(T));
    const ProtectedMemory memory2(longest * sizeof(T));
    for (const double tolerance : {0.0, 3.0}) {
        for (const std::size_t count : {0U, 1U, 2U, 3U, 31U, 64U, 100U, 127U, 150U}) {
            auto* const first = static_cast<T*>(memory1.before_end(count * sizeof(T)));
            auto* const second = static_cast<T*>(memory2.before_end(count * sizeof(T)));
            std::fill_n(first, count, T{1});
            std::fill_n(second, count, T{1});
            const talcmp::ElementType& type = talcmp::element_type(element_type_id<T>);
            const talcmp::Pairs pairs(type, first, type, second, count);
            EXPECT_EQ(pairs.find_different(tolerance, 0), count);
            for (std::size_t place = 0; place < count; ++place) {
                second[place] = second[count - 1] = 2;
                for (const std::size_t begin : {std::size_t{0}, place / 2, place}) {
                    EXPECT_EQ(pairs.find_different(tolerance, begin), place)
                        << "of " << count << " from " << begin << " on";
                }
                EXPECT_EQ(pairs.find_different(tolerance, place + 1),
                          place + 1 == count ? count : count - 1);
                second[place] = second[count - 1] = 1;
            }
        }
    }
}

// The answer under such a tolerance depends on whether its factor is remembered.
template <typename Real>
void expect_factor_is_remembered() {
    const double tolerance = std::numeric_limits<Real>::digits - 0.5;
    const Real one = 1;
    const Real far = 2.5;
    const talcmp::ElementType& type = talcmp::element_type(element_type_id<Real>);
    const talcmp::Pairs pair(type, &one, type, &far, 1);
    talcmp::remember_factor_of(1);
    EXPECT_FALSE(pair.same(1, 0));
    talcmp::remember_factor_of(tolerance);
    EXPECT_TRUE(pair.same(tolerance, 0));
}

TEST(Factor, IsRemembered) {
    expect_factor_is_remembered<float>();
    expect_factor_is_remembered<double>();
}

} // namespace
