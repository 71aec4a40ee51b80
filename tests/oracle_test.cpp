// Worked examples, by which a reader can trust the oracle before the oracle judges anything.

#include "support/floating_point_modes.h"
#include "support/oracle.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <limits>

namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();
const double nan = std::numeric_limits<double>::quiet_NaN();

struct DoubleCase {
    const char* name;
    double tolerance;
    double x;
    double y;
    int result;
};

const DoubleCase double_cases[] = {
    {"half the limit", 10, 1, 1 + 0x1p-44, 0},
    {"twice the limit", 10, 1, 1 + 0x1p-42, -1},
    {"twice the limit, swapped", 10, 1 + 0x1p-42, 1, 1},
    {"last digit", 1, 1, 1 + 0x1p-52, 0},
    {"last digit, half a digit allowed", 0.5, 1, 1 + 0x1p-52, -1},
    {"last digit, none allowed", 0, 1, 1 + 0x1p-52, -1},
    {"last digit, negative tolerance", -3, 1, 1 + 0x1p-52, -1},
    {"30 digits, near", 30, 5, 5.0000001, 0},
    {"30 digits, far", 30, 5, 5.00001, -1},
    {"zero and tiny", 60, 0, 1e-300, -1},
    {"tiny and zero", 60, 1e-300, 0, 1},
    {"zeros of both signs", 10, 0.0, -0.0, 0},
    {"opposite signs", 60, 1, -1, 1},
    {"both negative", 10, -1, -3, 1},
    {"all digits", 53, 1, 1e300, 0},
    {"all digits, infinity", 53, 1, infinity, 0},
    {"all digits, NaN", 53, nan, 1, 0},
    {"all digits, zero", 53, 0, 1, -1},
    {"infinity and large", 10, infinity, 1e308, 1},
    {"large and infinity", 10, 1e308, infinity, -1},
    {"infinities", 10, infinity, infinity, 0},
    {"vanishing beside the larger", 52.9, 1, 1e-17, 1},
    {"NaN and one", 10, nan, 1, -1},
    {"one and NaN", 10, 1, nan, -1},
    {"NaN and NaN", 10, nan, nan, -1},
    {"NaN and minus one", 10, nan, -1, 1},
    {"minus one and NaN", 10, -1, nan, -1},
    {"zero and NaN", 10, 0, nan, -1},
    {"NaN and zero", 10, nan, 0, 1},
    {"NaN tolerance", nan, 1, 1 + 0x1p-52, -1},
};

TEST(Oracle, ComparesDoubles) {
    for (const DoubleCase& c : double_cases) {
        oracle::State state;
        EXPECT_EQ(oracle::compare_doubles(state, c.tolerance, c.x, c.y), c.result) << c.name;
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
    EXPECT_TRUE(std::isnan(oracle::double_factor(nan)));
}

TEST(Oracle, LetsTheCacheDecideBetweenHalfAndTheFactor) {
    oracle::State state;
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 2.5), -1);
    EXPECT_EQ(state.of_doubles.last_tolerance, 53);
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 1.1), 0);
    EXPECT_EQ(state.of_doubles.last_tolerance, 52.5);
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 2.5), 0);
    EXPECT_EQ(oracle::compare_doubles(state, nan, 1, 1.1), -1);
    EXPECT_EQ(oracle::compare_doubles(state, 52.5, 1, 2.5), -1);
    EXPECT_EQ(state.of_singles.last_tolerance, 24);
}

template <typename First, typename Second>
bool same(double tolerance, int first_id, const First& first, int second_id, const Second& second) {
    oracle::State state;
    return oracle::same(state, tolerance, true, {first_id, {1}, 1, &first},
                        {second_id, {1}, 1, &second});
}

TEST(Oracle, ComparesIntegersByValue) {
    EXPECT_FALSE(same(60, 1, std::int8_t{-1}, 2, std::uint8_t{255}));
    EXPECT_FALSE(same(60, 7, std::int64_t{-1}, 8, ~std::uint64_t{0}));
    EXPECT_FALSE(same(60, 2, std::uint8_t{200}, 1, std::int8_t{-56}));
    EXPECT_TRUE(same(0, 6, std::uint32_t{4294967295}, 7, std::int64_t{4294967295}));
    EXPECT_TRUE(same(0, 3, std::int16_t{-5}, 7, std::int64_t{-5}));
    EXPECT_FALSE(same(100, 3, std::int16_t{5}, 5, std::int32_t{6}));
    EXPECT_FALSE(same(100, 7, std::int64_t{261}, 2, std::uint8_t{5}));
}

TEST(Oracle, ComparesIntegersWithReals) {
    EXPECT_TRUE(same(0, 5, std::int32_t{16777217}, 9, 16777216.0F));
    EXPECT_FALSE(same(0, 5, std::int32_t{16777217}, 10, 16777216.0));
    EXPECT_TRUE(same(0, 8, std::uint64_t{9007199254740993}, 10, 9007199254740992.0));
    EXPECT_TRUE(same(0, 5, std::int32_t{0}, 10, -0.0));
    EXPECT_TRUE(same(30, 5, std::int32_t{5}, 10, 5.0000001));
    EXPECT_FALSE(same(30, 5, std::int32_t{5}, 10, 5.00001));
    EXPECT_TRUE(same(30, 7, std::int64_t{1}, 9, 1000.0F));
    EXPECT_FALSE(same(30, 7, std::int64_t{1}, 10, 1000.0));
}

// Rounded by way of a double it would lie midway between two singles and go to the even one.
TEST(Oracle, RoundsAnIntegerToSingleOnce) {
    const std::int64_t above_midway = (std::int64_t{1} << 60) + (std::int64_t{1} << 36) + 1;
    EXPECT_TRUE(same(0, 7, above_midway, 9, 0x1.000002p60F));
    EXPECT_FALSE(same(0, 7, above_midway, 9, 0x1p60F));
}

// 2^24 + 1 lies midway between two singles.
TEST(Oracle, RoundsAnIntegerInTheDirectionOfRounding) {
    const std::int32_t midway = 16777217;
    const float below = 16777216.0F;
    const float above = 16777218.0F;
    const bool goes_up[] = {false, true, false, false};
    const bool opposite_goes_up[] = {true, true, false, true};
    for (std::size_t i = 0; i < std::size(roundings); ++i) {
        SCOPED_TRACE(roundings[i].name);
        const RoundingScope scope(roundings[i]);
        EXPECT_TRUE(same(0, 5, midway, 9, goes_up[i] ? above : below));
        EXPECT_TRUE(same(0, 5, -midway, 9, opposite_goes_up[i] ? -below : -above));
        EXPECT_TRUE(same(0, 5, midway - 1, 9, below));
    }
}

TEST(Oracle, ComparesReals) {
    EXPECT_TRUE(same(30, 9, 0.1F, 10, 0.1));
    EXPECT_FALSE(same(20, 9, 0.1F, 10, 0.1));
    EXPECT_FALSE(same(0, 10, 0.0, 10, -0.0));
    EXPECT_FALSE(same(-0.0, 10, 0.0, 10, -0.0));
    EXPECT_TRUE(same(1e-300, 9, 0.0F, 9, -0.0F));
    EXPECT_TRUE(same(0, 10, nan, 10, nan));
    EXPECT_FALSE(same(1e-10, 10, nan, 10, nan));
    EXPECT_TRUE(same(0, 9, 1.0F, 10, 1.0));
}

TEST(Oracle, ComparesComplexNumbersPartByPart) {
    using Complex = double[2];
    using SingleComplex = float[2];
    const std::int8_t five = 5;
    EXPECT_TRUE(same(0, 1, five, 12, Complex{5, -0.0}));
    EXPECT_FALSE(same(60, 1, five, 12, Complex{5, 1e-300}));
    EXPECT_FALSE(same(60, 12, Complex{5, nan}, 1, five));
    EXPECT_FALSE(same(60, 12, Complex{5, 0}, 12, Complex{5, 1e-300}));
    EXPECT_FALSE(same(0, 12, Complex{0.0, 0}, 12, Complex{-0.0, 0}));
    EXPECT_TRUE(same(1e-10, 12, Complex{0.0, 0}, 12, Complex{-0.0, 0}));
    EXPECT_TRUE(same(0, 11, SingleComplex{1, 0.0F}, 12, Complex{1, -0.0}));
    EXPECT_TRUE(same(0, 5, std::int32_t{16777217}, 11, SingleComplex{16777216, 0}));
    EXPECT_FALSE(same(0, 5, std::int32_t{16777217}, 12, Complex{16777216, 0}));
    EXPECT_TRUE(same(1e-46, 11, SingleComplex{0.0F, 0}, 11, SingleComplex{-0.0F, 0}));
    EXPECT_FALSE(same(1e-46, 11, SingleComplex{1, 0}, 11, SingleComplex{1.0000001F, 0}));
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
