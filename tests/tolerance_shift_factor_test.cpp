// The factor of a tolerance.

#include "tolerance_shift_factor.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <type_traits>
#include <utility>

namespace {

using nesk::ToleranceShiftFactor;

TEST(ToleranceShiftFactor, WholeDouble) {
    EXPECT_EQ(ToleranceShiftFactor(10.0), 0x1p-43);
    EXPECT_EQ(ToleranceShiftFactor(10.0), 1.1368683772161603e-13);
}

TEST(ToleranceShiftFactor, FractionalDouble) {
    EXPECT_EQ(ToleranceShiftFactor(10.5), 1.6077746776921858e-13);
}

TEST(ToleranceShiftFactor, WholeSingle) {
    EXPECT_EQ(ToleranceShiftFactor(10.0F), 0x1p-14F);
    EXPECT_EQ(ToleranceShiftFactor(10.0F), 6.103515625e-05F);
}

TEST(ToleranceShiftFactor, BelowOneDigit) {
    EXPECT_EQ(ToleranceShiftFactor(0.25), 0x1.306fe0a31b715p-53); // 2^0.25 * 2^-53
}

TEST(ToleranceShiftFactor, AsManyDigitsAsTheSignificand) {
    EXPECT_EQ(ToleranceShiftFactor(53.0), 1.0);
    EXPECT_EQ(ToleranceShiftFactor(24.0F), 1.0F);
}

TEST(ToleranceShiftFactor, NaN) {
    EXPECT_TRUE(std::isnan(ToleranceShiftFactor(std::numeric_limits<double>::quiet_NaN())));
    EXPECT_TRUE(std::isnan(ToleranceShiftFactor(std::numeric_limits<float>::quiet_NaN())));
}

TEST(ToleranceShiftFactor, EveryWholeToleranceIsAnExactPowerOfTwo) {
    double expected = 0x1p-53;
    for (int digits = 0; digits <= 1000; ++digits) {
        EXPECT_EQ(ToleranceShiftFactor(static_cast<double>(digits)), expected) << digits;
        expected *= 2;
    }
    float expected_single = 0x1p-24F;
    for (int digits = 0; digits <= 140; ++digits) {
        EXPECT_EQ(ToleranceShiftFactor(static_cast<float>(digits)), expected_single) << digits;
        expected_single *= 2;
    }
}

TEST(ToleranceShiftFactor, NegativeFractionSplitsTowardsZero) {
    EXPECT_EQ(ToleranceShiftFactor(-2.5), 0x1.6a09e667f3bcdp-56); // 2^-0.5 * 2^-55
}

TEST(ToleranceShiftFactor, ExtremesOverflowAndUnderflow) {
    const double infinity = std::numeric_limits<double>::infinity();
    EXPECT_EQ(ToleranceShiftFactor(1076.0), 0x1p1023);
    EXPECT_EQ(ToleranceShiftFactor(1077.0), infinity);
    EXPECT_EQ(ToleranceShiftFactor(2147483647.0), infinity);
    EXPECT_EQ(ToleranceShiftFactor(1e300), infinity);
    EXPECT_EQ(ToleranceShiftFactor(infinity), infinity);
    EXPECT_EQ(ToleranceShiftFactor(-1021.0), 0x1p-1074);
    EXPECT_EQ(ToleranceShiftFactor(-2147483648.0), 0.0);
    EXPECT_EQ(ToleranceShiftFactor(-1e300), 0.0);
    EXPECT_EQ(ToleranceShiftFactor(-infinity), 0.0);
    EXPECT_EQ(ToleranceShiftFactor(-std::numeric_limits<float>::infinity()), 0.0F);
}

TEST(ToleranceShiftFactor, ForwardsToItsImplementation) {
    EXPECT_EQ(nesk::detail::ToleranceShiftFactor_impl(3.75), ToleranceShiftFactor(3.75));
    EXPECT_EQ(nesk::detail::ToleranceShiftFactor_impl(3.75F), ToleranceShiftFactor(3.75F));
}

template <typename T, typename = void>
struct has_factor : std::false_type {};
template <typename T>
struct has_factor<T, std::void_t<decltype(ToleranceShiftFactor(std::declval<T>()))>>
    : std::true_type {};

TEST(ToleranceShiftFactor, ExistsForRealsOnly) {
    EXPECT_TRUE(has_factor<double>::value);
    EXPECT_TRUE(has_factor<float>::value);
    EXPECT_FALSE(has_factor<int>::value);
    EXPECT_FALSE(has_factor<unsigned char>::value);
}

// The library's functions, called in a way that no compiler can replace.
double (*volatile library_pow)(double, double) = std::pow;
double (*volatile library_exp2)(double) = std::exp2;

// Every factor is made with the library's pow, whatever the compiler: exp2, which a compiler may
// use instead, gives other factors for some of the same tolerances.
TEST(ToleranceShiftFactor, IsMadeWithPow) {
    constexpr int samples = 100000;
    int where_exp2_differs = 0;
    for (int i = 1; i < samples; ++i) {
        const double fraction = static_cast<double>(i) / samples;
        const double expected = library_pow(2.0, fraction);
        ASSERT_EQ(ToleranceShiftFactor(fraction), std::ldexp(expected, -53)) << fraction;
        where_exp2_differs += expected != library_exp2(fraction) ? 1 : 0;
    }
    RecordProperty("where_exp2_differs", where_exp2_differs);
#if defined(__GLIBC__) && defined(__x86_64__)
    EXPECT_GT(where_exp2_differs, 0) << "the samples cannot distinguish pow from exp2";
#endif
}

} // namespace
