// The three-way comparison of two reals of one type.

#include "compare.h"

#include "support/arrays.h"
#include "support/tolerances.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>

namespace {

using nesk::detail::compare_impl;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

struct Case {
    const char* name;
    double tol;
    double x;
    double y;
    int expected;
};

class DoubleComparison : public testing::TestWithParam<Case> {};

TEST_P(DoubleComparison, HasTheExpectedResult) {
    in_new_thread([] {
        const Case& c = GetParam();
        EXPECT_EQ(compare_impl(c.tol, c.x, c.y), c.expected);
    });
}

// A factor that is remembered changes no result but those that are documented to depend on it.
TEST_P(DoubleComparison, HasTheSameResultWithTheFactorRemembered) {
    in_new_thread([] {
        const Case& c = GetParam();
        compare_impl(c.tol, 1.0, 1.0 + 0x1p-52);
        EXPECT_EQ(compare_impl(c.tol, c.x, c.y), c.expected);
    });
}

const Case double_cases[] = {
    {"BelowTheLimit", 10, 1.0, 1.0 + 0x1p-44, 0},
    {"AboveTheLimit", 10, 1.0, 1.0 + 0x1p-42, -1},
    {"AboveTheLimitSwapped", 10, 1.0 + 0x1p-42, 1.0, 1},
    {"AtTheLimitFromBelowOne", 10, 1.0 - 0x1p-43, 1.0, -1},
    {"JustInsideTheLimitFromBelowOne", 10, 1.0 - 0x1p-43 + 0x1p-53, 1.0, 0},
    {"AtTheLimitBelowOne", 10, 0.5 - 0x1p-44, 0.5, -1},
    {"JustInsideTheLimitBelowOne", 10, 0.5 - 0x1p-44 + 0x1p-54, 0.5, 0},
    {"LastDigitUnderOneDigit", 1, 1.0, 1.0 + 0x1p-52, 0},
    {"LastDigitUnderHalfADigit", 0.5, 1.0, 1.0 + 0x1p-52, -1},
    {"LastDigitUnderNone", 0, 1.0, 1.0 + 0x1p-52, -1},
    {"LastDigitUnderMinusZero", -0.0, 1.0, 1.0 + 0x1p-52, -1},
    {"LastDigitUnderLessThanNone", -7, 1.0 + 0x1p-52, 1.0, 1},
    {"SeventhDecimal", 30, 5.0, 5.0000001, 0},
    {"FifthDecimal", 30, 5.0, 5.00001, -1},
    {"ZeroAboveNegative", 60, 0.0, -1e-300, 1},
    {"NegativeBelowZero", 60, -1e-300, 0.0, -1},
    {"ZerosOfBothSigns", 10, 0.0, -0.0, 0},
    {"ZerosOfBothSignsUnderNone", 0, -0.0, 0.0, 0},
    {"TwoNegatives", 10, -1.0, -3.0, 1},
    {"TwoNegativesSwapped", 10, -3.0, -1.0, -1},
    {"TwoNegativesNear", 10, -1.0, -1.0 - 0x1p-44, 0},
    {"TwoNegativesNearSwapped", 10, -1.0 - 0x1p-44, -1.0, 0},
    {"AllDigitsTolerated", 53, 1.0, 1e300, 0},
    {"AllDigitsToleratedUpToInfinity", 53, 1.0, infinity, 0},
    {"AllDigitsToleratedNaN", 53, nan, 1.0, 0},
    {"AllDigitsToleratedZero", 53, 0.0, 1.0, -1},
    {"MoreThanAllDigits", 1e300, 1.0, 1e300, 0},
    {"InfiniteTolerance", infinity, 1.0, 1e300, 0},
    {"InfinityAndHuge", 10, infinity, 1e308, 1},
    {"HugeAndInfinity", 10, 1e308, infinity, -1},
    {"EqualInfinities", 10, infinity, infinity, 0},
    {"EqualNegativeInfinities", 0, -infinity, -infinity, 0},
    {"OppositeInfinities", 60, -infinity, infinity, -1},
    {"Vanishing", 10, 1.0, 1e-17, 1},
    {"VanishingUnderNearlyAllDigits", 52.99, 1.0, 1e-17, 1},
    {"NaNAndOne", 10, nan, 1.0, -1},
    {"OneAndNaN", 10, 1.0, nan, -1},
    {"NaNAndNaN", 10, nan, nan, -1},
    {"NaNAndMinusOne", 10, nan, -1.0, 1},
    {"MinusOneAndNaN", 10, -1.0, nan, -1},
    {"NaNAndMinusOneUnderNone", 0, nan, -1.0, 1},
    {"ZeroAndNaN", 10, 0.0, nan, -1},
    {"NaNAndZero", 10, nan, 0.0, 1},
    {"NaNTolerance", nan, 1.0, 1.0 + 0x1p-52, -1},
    {"NaNToleranceSwapped", nan, 1.0 + 0x1p-52, 1.0, 1},
    {"NaNToleranceEqual", nan, 1.5, 1.5, 0},
    {"Subnormals", 10, 0x1p-1070, 0x1p-1074, 1},
    {"BelowOneTheDifferenceIsScaled", 10, 0x1.4p-1031 - 0x1p-1074, 0x1.4p-1031, 0},
    {"LeadingDigitOfSubnormals", 52, 0x3p-1074, 0x5p-1074, 0},
    {"SubnormalsNear", 51, 0x1.8p-1070, 0x1.7p-1070, 0},
};

std::string case_name(const testing::TestParamInfo<Case>& info) {
    return info.param.name;
}

INSTANTIATE_TEST_SUITE_P(Table, DoubleComparison, testing::ValuesIn(double_cases), case_name);

// The result under every tolerance; 99 where that is not one result.
int compare_under_all(const double x, const double y) {
    return under_every_tolerance([&](const double tol) { return compare_impl(tol, x, y); });
}

TEST(EveryTolerance, KeepsZeroFromTheSmallestNumbers) {
    EXPECT_EQ(compare_under_all(0.0, 1e-300), -1);
    EXPECT_EQ(compare_under_all(1e-300, 0.0), 1);
    EXPECT_EQ(compare_under_all(0.0, 0x1p-1074), -1);
    EXPECT_EQ(compare_under_all(-0.0, 0x1p-1074), -1);
}

TEST(EveryTolerance, KeepsOppositeSignsApart) {
    EXPECT_EQ(compare_under_all(1.0, -1.0), 1);
    EXPECT_EQ(compare_under_all(-1.0, 1.0), -1);
    EXPECT_EQ(compare_under_all(0x1p-1074, -0x1p-1074), 1);
}

TEST(SingleComparison, HasALimitOfItsOwn) {
    EXPECT_EQ(compare_impl(10.0F, 1.0F, 1.0F + 0x1p-15F), 0);
    EXPECT_EQ(compare_impl(10.0F, 1.0F, 1.0F + 0x1p-13F), -1);
    EXPECT_EQ(compare_impl(10.0F, 1.0F + 0x1p-13F, 1.0F), 1);
    EXPECT_EQ(compare_impl(24.0F, 1.0F, 3.0F), 0);
    EXPECT_EQ(compare_impl(24.0F, 0.0F, 3.0F), -1);
    EXPECT_EQ(compare_impl(23.0F, 1.0F, 3.0F), -1);
    EXPECT_EQ(compare_impl(0.0F, 1.0F, 1.0F + 0x1p-23F), -1);
}

// ---- Tolerances that leave less than one digit: the one place where a result depends on what has
// been compared before.

TEST(RememberedFactor, MakesAPairTheSameThatDiffersInItsLeadingDigit) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.5), -1) << "another tolerance is remembered";
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.5), -1) << "which the call above has not changed";
        EXPECT_EQ(compare_impl(52.5, 1.0, 1.1), 0) << "needs the factor, and remembers it";
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.5), 0) << "1.5 < 2.5 * 2^-0.5";
        EXPECT_EQ(compare_impl(10.0, 1.0, 1.1), -1) << "needs another factor";
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.5), -1);
    });
}

// A factor that nothing has computed would make these numbers the same: they differ by less than
// the larger, but by more than a quarter of it.
TEST(RememberedFactor, IsInANewThreadThatOfNoToleranceThatNeedsOne) {
    for (int quarters = 1; quarters <= 4 * 51; ++quarters) {
        const double tol = quarters * 0.25;
        in_new_thread([=] { EXPECT_EQ(compare_impl(tol, 1.0, 1.75), -1) << tol; });
    }
    for (int quarters = 1; quarters <= 4 * 22; ++quarters) {
        const float tol = static_cast<float>(quarters) * 0.25F;
        in_new_thread([=] { EXPECT_EQ(compare_impl(tol, 1.0F, 1.75F), -1) << tol; });
    }
}

TEST(RememberedFactor, IsNotForgottenByComparisonsThatNeedNone) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(52.5, 1.0, 1.1), 0);
        EXPECT_EQ(compare_impl(10.0, 1.0, 2.5), -1) << "differs in the leading digit";
        EXPECT_EQ(compare_impl(60.0, 1.0, 2.5), 0);
        EXPECT_EQ(compare_impl(0.0, 1.0, 1.1), -1);
        EXPECT_EQ(compare_impl(-3.0, 1.0, 1.1), -1);
        EXPECT_EQ(compare_impl(23.5F, 1.0F, 1.1F), 0) << "singles remember on their own";
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.5), 0);
    });
}

TEST(RememberedFactor, IsReplacedByAPairThatNeedsItAndIsNotTheSame) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(52.5, 1.0, 1.1), 0);
        EXPECT_EQ(compare_impl(1.0, 1.0, 1.1), -1);
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.5), -1);
    });
}

TEST(RememberedFactor, LeadingDigitsBelowOneAreJudgedAlike) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(52.5, 0.25, 0.625), -1);
        EXPECT_EQ(compare_impl(52.5, 0.25, 0.3), 0);
        EXPECT_EQ(compare_impl(52.5, 0.25, 0.625), 0);
    });
}

TEST(RememberedFactor, ADifferenceOfExactlyHalfIsOneOfTheLeadingDigit) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(52.5, 1.0, 2.0), -1);
        EXPECT_EQ(compare_impl(52.5, 0.25, 0.5), -1);
        EXPECT_EQ(compare_impl(52.5, 1.0, std::nextafter(2.0, 1.0)), 0);
    });
    in_new_thread([] { EXPECT_EQ(compare_impl(52.5, 0.25, std::nextafter(0.5, 0.0)), 0); });
}

TEST(RememberedFactor, OfSingles) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(23.5F, 1.0F, 2.5F), -1);
        EXPECT_EQ(compare_impl(23.5F, 1.0F, 1.1F), 0);
        EXPECT_EQ(compare_impl(23.5F, 1.0F, 2.5F), 0);
    });
}

// Whether a thread that has compared nothing yet recalls a factor for `tol`, and then which; -1 if
// it recalls none.
template <typename T>
T recalled_in_a_new_thread(const T tol) {
    T factor = -1;
    in_new_thread([&] {
        T recalled = 0;
        if (nesk::detail::recall_factor(tol, recalled)) {
            factor = recalled;
        }
    });
    return factor;
}

// No comparison can tell which it is, as none looks it up.
template <typename T>
void expect_a_true_factor_at_first() {
    constexpr int bits = std::numeric_limits<T>::digits;
    EXPECT_EQ(recalled_in_a_new_thread<T>(bits), 1);
    for (int quarters = -4; quarters <= 8 * bits; ++quarters) {
        const T tol = static_cast<T>(quarters) / 4;
        if (tol != bits) {
            EXPECT_EQ(recalled_in_a_new_thread<T>(tol), -1) << tol;
        }
    }
    EXPECT_EQ(recalled_in_a_new_thread<T>(std::nextafter(T(bits), T(0))), -1);
}

TEST(RememberedFactor, IsAtFirstThatOfAllDigits) {
    expect_a_true_factor_at_first<double>();
    expect_a_true_factor_at_first<float>();
}

TEST(RememberedFactor, TheInitialOneIsNeverUsed) {
    in_new_thread([] {
        EXPECT_EQ(compare_impl(52.999999, 1.0, 2.5), -1);
        EXPECT_EQ(compare_impl(53.0, 1.0, 0x1p300), 0) << "answered without a factor";
    });
}

} // namespace
