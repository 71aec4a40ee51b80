// The divisor by which the loops find near reals: large enough in every direction of rounding, and
// given only where no factor has to be computed for it.

#include "support/module_templates.h"

#include "support/floating_point_modes.h"
#include "support/loops.h"

#include <gtest/gtest.h>

#include <limits>

namespace {

template <typename T>
void expect_divisors_large_enough() {
    constexpr int bits = std::numeric_limits<T>::digits;
    constexpr long double epsilon = std::numeric_limits<T>::epsilon();
    for (const Rounding& rounding : roundings) {
        SCOPED_TRACE(rounding.name);
        for (const T tol : {T{0.5}, T{1}, T{10}, T{10.5}, T{bits - 1}, T{bits - 0.5}}) {
            const Remembered factors = factors_of(tol);
            remember(factors);
            const RoundingScope scope(rounding);
            const long double divisor = talnumericarray::certain_divisor(tol);
            const RoundingScope to_nearest(roundings[0]);
            const long double factor = factor_of_reals(bits, factors);
            EXPECT_GE(divisor * factor, 1 + factor) << tol;
            EXPECT_GE(divisor * factor, 1 + 4 * epsilon) << tol;
            EXPECT_LE(divisor * factor, (1 + factor) * (1 + 16 * epsilon)) << tol;
        }
    }
}

TEST(CertainDivisor, IsLargeEnoughInEveryDirectionOfRounding) {
    expect_divisors_large_enough<float>();
    expect_divisors_large_enough<double>();
}

// Only the factor of 20 is remembered.
template <typename T>
void expect_divisors_only_without_need_of_another_factor() {
    constexpr int bits = std::numeric_limits<T>::digits;
    for (const T tol :
         {T{-1}, T{0}, T{0.5}, T{10}, T{10.5}, T{bits - 1}, std::numeric_limits<T>::quiet_NaN()}) {
        remember(factors_of(20));
        EXPECT_EQ(talnumericarray::certain_divisor(tol), 0) << tol;
    }
    for (const T tol : {T{bits}, T{bits + 10}}) {
        remember(factors_of(20));
        EXPECT_EQ(talnumericarray::certain_divisor(tol), 1) << tol;
    }
}

TEST(CertainDivisor, IsOnlyGivenWhereTheFactorIsRememberedOrNotNeeded) {
    expect_divisors_only_without_need_of_another_factor<float>();
    expect_divisors_only_without_need_of_another_factor<double>();
}

} // namespace
