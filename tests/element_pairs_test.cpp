// Elements of each pair of types, and the element test itself.

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

TEST(Elements, FiveIsFiveInEveryPairOfTypes) {
    for_each_pair([](const ElementType& type1, const ElementType& type2) {
        const AnyArray array1(type1, {5});
        const AnyArray array2(type2, {5});
        const auto answer = [&](const talreal tol) {
            return TalNumericArray_sameQ(tol, 1, array1.handle(), array2.handle());
        };
        EXPECT_EQ(under_every_tolerance(answer), 1);
    });
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

TEST(ElementTest, TakesTheFirstArraysElementFirst) {
    EXPECT_TRUE((sameQ_test<BIT8, double>(30.0, BIT8{5}, 5.0000001)));
    EXPECT_FALSE((sameQ_test<BIT8, double>(10.0, BIT8{5}, 5.0000001)));
    EXPECT_TRUE((sameQ_test<double, BIT8>(30.0, 5.0000001, BIT8{5})));
}

} // namespace
