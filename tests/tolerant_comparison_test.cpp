// The three-way comparison of two reals of one type.

#include "compare.h"
#include "factor_cache.h"

#include "support/arrays.h"
#include "support/tolerances.h"
#include "support/worked_examples.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace {

using nesk::detail::compare_impl;

TEST(DoubleComparison, HasTheExpectedResults) {
    for (const ExampleOfReals& example : examples_of_doubles) {
        in_new_thread([&example] {
            EXPECT_EQ(compare_impl(example.tolerance, example.x, example.y), example.result)
                << example.name;
        });
    }
}

// A factor that is remembered changes no result except those that are documented to depend on it.
TEST(DoubleComparison, HasTheSameResultsWithTheFactorRemembered) {
    for (const ExampleOfReals& example : examples_of_doubles) {
        in_new_thread([&example] {
            compare_impl(example.tolerance, 1.0, 1.0 + 0x1p-52);
            EXPECT_EQ(compare_impl(example.tolerance, example.x, example.y), example.result)
                << example.name;
        });
    }
}

// The result under every tolerance, or 99 if it is not always the same.
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

// The factor that a thread which has compared nothing recalls for `tol`; -1 if it recalls none.
template <typename T>
T recalled_in_a_new_thread(const T tol) {
    T factor = -1;
    in_new_thread([&] {
        T recalled = 0;
        if (nesk::recall_factor(tol, recalled)) {
            factor = recalled;
        }
    });
    return factor;
}

// No comparison can show that factor, as none looks it up.
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
