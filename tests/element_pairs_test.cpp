// Integer and real elements of each pair of types.

#include "compare.h"
#include "talnumericarray_sameq_elements.h"

#include "support/arrays.h"
#include "support/tolerances.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>

namespace {

constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr double infinity = std::numeric_limits<double>::infinity();

TEST(Integers, OfOneTypeIgnoreTheTolerance) {
    for (const double tol : {-3.0, nan, 1e300, 0.0}) {
        EXPECT_EQ(sameQ(tol, Array<BIT16>{258, 7}, Array<BIT16>{258, 7}), 1) << tol;
        EXPECT_EQ(sameQ(tol, Array<BIT16>{258, 7}, Array<BIT16>{259, 7}), 0) << tol;
        EXPECT_EQ(sameQ(tol, Array<BIT16>{258, 7}, Array<BIT16>{2, 7}), 0) << tol;
    }
}

TEST(Integers, MinusOneIsNoUnsignedNumber) {
    EXPECT_EQ(sameQ_under_all(BIT8{-1}, UBIT8{255}), 0);
    EXPECT_EQ(sameQ_under_all(UBIT8{255}, BIT8{-1}), 0);
    EXPECT_EQ(sameQ_under_all(BIT8{-1}, UBIT64{18446744073709551615U}), 0);
    EXPECT_EQ(sameQ_under_all(UBIT64{18446744073709551615U}, BIT8{-1}), 0);
}

TEST(Integers, FiveIsFiveInEveryPairOfTypes) {
    int pairs = 0;
    const auto check = [&](const auto element1, const auto element2) {
        EXPECT_EQ(sameQ_under_all(element1, element2), 1);
        ++pairs;
    };
    const auto check_row = [&](const auto element1, auto... elements2) {
        (..., check(element1, elements2));
    };
    const auto check_all = [&](auto... elements) { (..., check_row(elements, elements...)); };
    check_all(BIT8{5}, UBIT8{5}, BIT16{5}, UBIT16{5}, BIT32{5}, UBIT32{5}, BIT64{5}, UBIT64{5});
    EXPECT_EQ(pairs, 64);
}

TEST(Integers, AreNotCutToTheNarrowerWidth) {
    EXPECT_EQ(sameQ_under_all(BIT64{261}, UBIT8{5}), 0);
    EXPECT_EQ(sameQ_under_all(UBIT8{5}, BIT64{261}), 0);
}

TEST(Reals, ZerosOfBothSigns) {
    EXPECT_EQ(sameQ_of(0.0, +0.0, -0.0), 0);
    EXPECT_EQ(sameQ_of(-0.0, +0.0, -0.0), 0);
    for (const double tol : {-1.0, 1e-300, 1.0, 53.0, nan}) {
        EXPECT_EQ(sameQ_of(tol, +0.0, -0.0), 1) << tol;
    }
}

TEST(Reals, NaNs) {
    EXPECT_EQ(sameQ_of(0.0, nan, nan), 1);
    EXPECT_EQ(sameQ_of(0.0, nan, -nan), 0);
    EXPECT_EQ(sameQ_of(10.0, nan, nan), 0);
    EXPECT_EQ(sameQ_of(-10.0, nan, nan), 0);
    EXPECT_EQ(sameQ_of(53.0, nan, nan), 1) << "neither is zero nor negative";
    EXPECT_EQ(sameQ_of(53.0, nan, 1.0), 1);
    EXPECT_EQ(sameQ_of(53.0, nan, -1.0), 0);
    EXPECT_EQ(sameQ_of(53.0, nan, 0.0), 0);
}

TEST(Reals, ToleranceThatIsZeroOnlyAsASingleTakesTheElementsOneByOne) {
    EXPECT_EQ(sameQ_of(1e-300, 0.0F, -0.0F), 1);
    EXPECT_EQ(sameQ_of(1e-300, 1.0F, 1.0F + 0x1p-23F), 0);
    const float single_nan = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(sameQ_of(1e-300, single_nan, single_nan), 0);
}

TEST(Mixed, SingleDecidesAgainstAnInteger) {
    EXPECT_EQ(sameQ_under_all(BIT32{16777217}, 16777216.0F), 1);
    EXPECT_EQ(sameQ_under_all(16777216.0F, BIT32{16777217}), 1);
    EXPECT_EQ(sameQ_of(0, BIT32{16777217}, 16777216.0), 0);
    EXPECT_EQ(sameQ_of(20, BIT32{16777217}, 16777216.0), 0);
    EXPECT_EQ(sameQ_of(30, BIT32{16777217}, 16777216.0), 1);
}

TEST(Mixed, LargeIntegerRoundsToDouble) {
    EXPECT_EQ(sameQ_under_all(BIT64{9007199254740993}, 9007199254740992.0), 1);
    EXPECT_EQ(sameQ_under_all(9007199254740992.0, BIT64{9007199254740993}), 1);
    EXPECT_EQ(sameQ_of(0, BIT64{9007199254740993}, 9007199254740994.0), 0);
}

TEST(Mixed, AnIntegerIsComparedAsTheRealOfItsValue) {
    in_new_thread([] {
        for (const double tol : every_tolerance) {
            for (const double x : {3.0, 3.0000001, std::nextafter(3.0, 4.0), 2.9, -3.0, 0.0, nan,
                                   infinity, 6.5, 1e-20}) {
                const int expected = nesk::detail::compare_impl(tol, 3.0, x) == 0 ? 1 : 0;
                EXPECT_EQ(sameQ_of(tol, BIT32{3}, x), expected) << tol << " " << x;
            }
        }
    });
}

TEST(Mixed, RealsOfDifferentWidthsAreNeverComparedAsBytes) {
    EXPECT_EQ(sameQ_of(0.0, 1.0F, 1.0), 1);
    EXPECT_EQ(sameQ_of(0.0, 1.0, 1.0F), 1);
    EXPECT_EQ(sameQ_of(0.0, 0.0F, -0.0), 1);
    EXPECT_EQ(sameQ_of(0.0, 0.1F, 0.1), 0) << "compared as doubles";
}

TEST(Order, NothingBehindTheFirstDifferenceMatters) {
    EXPECT_EQ(sameQ(10, Array<double>{1, nan, infinity}, Array<double>{2, nan, infinity}), 0);
    EXPECT_EQ(sameQ(10, Array<double>{1, 2, 3}, Array<double>{2, 2, 3}), 0);
}

// What is remembered on the way through an array decides for a tolerance that leaves less than one
// digit, so the elements have to be taken in order.
TEST(Order, IsThatOfTheElements) {
    in_new_thread([] {
        EXPECT_EQ(sameQ(52.5, Array<double>{1.0, 1.0}, Array<double>{2.5, 1.1}), 0);
        EXPECT_EQ(sameQ(52.5, Array<double>{1.0, 1.0}, Array<double>{1.1, 2.5}), 1);
        EXPECT_EQ(sameQ(52.5, Array<double>{1.0, 1.0}, Array<double>{2.5, 1.1}), 1);
    });
}

TEST(ElementTest, TakesTheFirstArraysElementFirst) {
    EXPECT_TRUE((sameQ_test<BIT8, double>(30.0, BIT8{5}, 5.0000001)));
    EXPECT_FALSE((sameQ_test<BIT8, double>(10.0, BIT8{5}, 5.0000001)));
    EXPECT_TRUE((sameQ_test<double, BIT8>(30.0, 5.0000001, BIT8{5})));
}

} // namespace
