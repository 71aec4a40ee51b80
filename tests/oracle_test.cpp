// Worked examples, by which a reader can trust the oracle before the oracle judges anything.

#include "support/floating_point_modes.h"
#include "support/oracle.h"
#include "support/worked_examples.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstddef>
#include <iterator>

namespace {

TEST(Oracle, ComparesDoubles) {
    for (const ExampleOfReals& example : examples_of_doubles) {
        oracle::State state;
        EXPECT_EQ(oracle::compare_doubles(state, example.tolerance, example.x, example.y),
                  example.result)
            << example.name;
    }
}

TEST(Oracle, ComparesSingles) {
    oracle::State state;
    EXPECT_EQ(oracle::compare_singles(state, 10, 1, 1 + 0x1p-15F), 0);
    EXPECT_EQ(oracle::compare_singles(state, 10, 1, 1 + 0x1p-13F), -1);
    EXPECT_EQ(oracle::compare_singles(state, static_cast<float>(23.99999999), 1, 3), 0);
}

TEST(Oracle, ComputesFactors) {
    EXPECT_EQ(oracle::double_factor(10), 1.1368683772161603e-13);
    EXPECT_EQ(oracle::double_factor(10.5), 1.6077746776921858e-13);
    EXPECT_EQ(oracle::double_factor(53), 1);
    EXPECT_EQ(oracle::single_factor(10), 6.103515625e-05F);
    EXPECT_TRUE(std::isnan(oracle::double_factor(nan_of_doubles)));
}

TEST(Oracle, LetsTheCacheDecideBetweenHalfAndTheFactor) {
    oracle::State state;
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 2.5), -1);
    EXPECT_EQ(state.of_doubles.last_tolerance, 53);
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 1.1), 0);
    EXPECT_EQ(state.of_doubles.last_tolerance, 52.5);
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 2.5), 0);
    EXPECT_EQ(oracle::compare_doubles(state, nan_of_doubles, 1, 1.1), -1);
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 2.5), -1);
    EXPECT_EQ(state.of_singles.last_tolerance, 24);
}

bool same(const double tolerance, const ExampleElement& first, const ExampleElement& second) {
    oracle::State state;
    return oracle::same(state, tolerance, true, {first.type(), {1}, 1, first.data()},
                        {second.type(), {1}, 1, second.data()});
}

TEST(Oracle, ComparesElements) {
    std::size_t index = 0;
    for (const auto& [tolerances, element1, element2, expected] : examples_of_elements()) {
        SCOPED_TRACE(index++);
        for (const double tolerance : tolerances) {
            EXPECT_EQ(same(tolerance, element1, element2), expected) << tolerance;
            EXPECT_EQ(same(tolerance, element2, element1), expected) << tolerance << ", swapped";
        }
    }
}

// 2^24 + 1 lies midway between two singles.
TEST(Oracle, RoundsAnIntegerInTheDirectionOfRounding) {
    const BIT32 midway = 16777217;
    const float below = 16777216.0F;
    const float above = 16777218.0F;
    const bool goes_up[] = {false, true, false, false};
    const bool opposite_goes_up[] = {true, true, false, true};
    for (std::size_t i = 0; i < std::size(roundings); ++i) {
        SCOPED_TRACE(roundings[i].name);
        const RoundingScope scope(roundings[i]);
        EXPECT_TRUE(same(0, midway, goes_up[i] ? above : below));
        EXPECT_TRUE(same(0, -midway, opposite_goes_up[i] ? -below : -above));
        EXPECT_TRUE(same(0, midway - 1, below));
    }
}

TEST(Oracle, LooksAtShapesBeforeTypes) {
    oracle::State state;
    const oracle::Array wide{5, {2, 3}, 6, nullptr};
    const oracle::Array tall{5, {3, 2}, 6, nullptr};
    const oracle::Array untyped{0, {4}, 4, nullptr};
    const oracle::Array empty{42, {0}, 0, nullptr};
    const oracle::Array empty_reals{10, {0}, 0, nullptr};
    EXPECT_FALSE(oracle::same(state, 0, true, wide, tall));
    EXPECT_FALSE(oracle::equivalent(wide, tall));
    EXPECT_FALSE(oracle::same(state, 0, true, untyped, untyped));
    EXPECT_TRUE(oracle::equivalent(untyped, untyped));
    EXPECT_TRUE(oracle::same(state, 0, false, empty, empty_reals));
    EXPECT_FALSE(oracle::equivalent(empty, empty_reals));
}

} // namespace
