// The comparison of two scalars of any two non-complex types.

#include "compare.h"
#include "promotion_rules.h"
#include "to_type.h"

#include "support/tolerances.h"

#include <gtest/gtest.h>

#include <complex>
#include <cstdint>
#include <limits>
#include <type_traits>

namespace {

using nesk::compare;

template <typename T1, typename T2>
int compare_under_all(const T1 arg1, const T2 arg2) {
    return under_every_tolerance([&](const double tol) { return compare(tol, arg1, arg2); });
}

// ---- Integers

TEST(IntegerComparison, EqualBytesOfDifferentSignednessAreDifferentNumbers) {
    EXPECT_EQ(compare_under_all(std::int8_t{-1}, std::uint8_t{255}), -1);
    EXPECT_EQ(compare_under_all(std::uint8_t{255}, std::int8_t{-1}), 1);
}

TEST(IntegerComparison, MinusOneIsNotTheLargestUnsigned) {
    const std::uint64_t largest = 18446744073709551615U;
    EXPECT_EQ(compare_under_all(std::int64_t{-1}, largest), -1);
    EXPECT_EQ(compare_under_all(largest, std::int64_t{-1}), 1);
}

TEST(IntegerComparison, TwoHundredIsNotMinusFiftySix) {
    EXPECT_EQ(compare_under_all(std::uint8_t{200}, std::int8_t{-56}), 1);
}

TEST(IntegerComparison, UnsignedFitsTheWiderSigned) {
    EXPECT_EQ(compare_under_all(std::uint32_t{4294967295U}, std::int64_t{4294967295}), 0);
}

TEST(IntegerComparison, NegativesOfDifferentWidths) {
    EXPECT_EQ(compare_under_all(std::int16_t{-5}, std::int64_t{-5}), 0);
}

TEST(IntegerComparison, IgnoresTheTolerance) {
    EXPECT_EQ(compare(100.0, std::int16_t{5}, std::int32_t{6}), -1);
    EXPECT_EQ(compare_under_all(std::int16_t{5}, std::int32_t{6}), -1);
    EXPECT_EQ(compare_under_all(std::int32_t{6}, std::int32_t{6}), 0);
}

TEST(IntegerComparison, EveryBitOfTheWiderTypeTakesPart) {
    EXPECT_EQ(compare_under_all(std::int64_t{261}, std::uint8_t{5}), 1);
    EXPECT_EQ(compare_under_all(std::uint8_t{5}, std::int64_t{261}), -1);
    EXPECT_EQ(compare_under_all(std::uint32_t{0x80000000U}, std::int32_t{0}), 1);
}

// ---- Integers and reals

TEST(MixedComparison, SingleDecidesAgainstAnInteger) {
    EXPECT_EQ(compare_under_all(std::int32_t{16777217}, 16777216.0F), 0);
    EXPECT_EQ(compare_under_all(16777216.0F, std::int32_t{16777217}), 0);
}

TEST(MixedComparison, LargeIntegerRoundsToDouble) {
    EXPECT_EQ(compare_under_all(std::uint64_t{9007199254740993U}, 9007199254740992.0), 0);
}

TEST(MixedComparison, ZeroIsMinusZero) {
    EXPECT_EQ(compare_under_all(std::int32_t{0}, -0.0), 0);
}

TEST(MixedComparison, ToleranceAppliesToAnIntegerAndADouble) {
    EXPECT_EQ(compare(30.0, std::int32_t{5}, 5.0000001), 0);
    EXPECT_EQ(compare(30.0, std::int32_t{5}, 5.00001), -1);
}

TEST(MixedComparison, SingleAndDoubleAreComparedAsDoubles) {
    EXPECT_EQ(compare(30.0, 0.1F, 0.1), 0);
    EXPECT_EQ(compare(20.0, 0.1F, 0.1), 1);
}

TEST(MixedComparison, ToleranceIsRoundedToSingle) {
    EXPECT_EQ(compare(23.99999999, 1.0F, 3.0F), 0) << "24 as a single: all digits are tolerated";
    EXPECT_EQ(compare(23.99999999, 1.0, 1.0 + 0x1.8p-30), 0) << "a factor just below 2^-29";
    EXPECT_EQ(compare(23.99999999, 1.0, 1.0 + 0x1p-29), -1);
    EXPECT_EQ(compare(1e-300, 1.0F, 1.0F + 0x1p-23F), -1) << "zero as a single";
}

TEST(MixedComparison, IntegerAgainstSingleHasTheDigitsOfASingle) {
    EXPECT_EQ(compare(30.0, std::int64_t{1}, 1000.0F), 0);
    EXPECT_EQ(compare(30.0, std::int64_t{1}, 1000.0), -1);
}

TEST(MixedComparison, IntegerGoesToSingleInOneRounding) {
    // By way of a double, the first number would become the middle of two singles and then 2^60; in
    // one step it is above the middle.
    const std::int64_t above_the_middle = (std::int64_t{1} << 60) + (std::int64_t{1} << 36) + 1;
    EXPECT_EQ(compare(0.0, above_the_middle, 0x1.000002p60F), 0);
    EXPECT_EQ(compare(0.0, above_the_middle, 0x1p60F), 1);
}

// ---- Types

TEST(CommonType, OfReals) {
    EXPECT_TRUE((std::is_same_v<type_common_t<double, float>, double>));
    EXPECT_TRUE((std::is_same_v<type_common_t<std::int8_t, double>, double>));
    EXPECT_TRUE((std::is_same_v<type_common_t<float, std::uint64_t>, float>));
    EXPECT_TRUE((std::is_same_v<type_common_t<float, float>, float>));
}

TEST(CommonType, OfIntegers) {
    EXPECT_TRUE((std::is_same_v<type_common_t<std::int8_t, std::uint16_t>, std::uint16_t>));
    EXPECT_TRUE((std::is_same_v<type_common_t<std::uint32_t, std::int64_t>, std::uint64_t>));
    EXPECT_TRUE((std::is_same_v<type_common_t<std::uint32_t, std::int16_t>, std::uint32_t>));
    EXPECT_TRUE((std::is_same_v<type_common_t<std::int8_t, std::int64_t>, std::int64_t>));
    EXPECT_TRUE((std::is_same_v<type_common_t<std::uint8_t, std::int8_t>, std::uint8_t>));
}

TEST(RealType, OfEachKind) {
    EXPECT_TRUE((std::is_same_v<to_real_type_t<std::complex<float>>, float>));
    EXPECT_TRUE((std::is_same_v<to_real_type_t<std::complex<double>>, double>));
    EXPECT_TRUE((std::is_same_v<to_real_type_t<double>, double>));
    EXPECT_TRUE((std::is_same_v<to_real_type_t<std::int16_t>, std::int16_t>));
}

} // namespace
