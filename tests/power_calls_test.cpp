// How often a comparison computes a factor, counted by calls to the library's power functions,
// which the linker redirects to this file.

#include "support/arrays.h"
#include "tolerance_shift_factor.h"

#include <gtest/gtest.h>

#include <limits>
#include <vector>

namespace {

int double_powers = 0;
int single_powers = 0;
double last_base = 0;

void forget_calls() {
    double_powers = 0;
    single_powers = 0;
    last_base = 0;
}

} // namespace

// The names that the linker's --wrap option gives to a function and to what replaces it.
// NOLINTBEGIN(clang-diagnostic-reserved-identifier)
extern "C" double __real_pow(double base, double exponent);
extern "C" float __real_powf(float base, float exponent);

extern "C" double __wrap_pow(double base, double exponent) {
    ++double_powers;
    last_base = base;
    return __real_pow(base, exponent);
}

extern "C" float __wrap_powf(float base, float exponent) {
    ++single_powers;
    last_base = static_cast<double>(base);
    return __real_powf(base, exponent);
}
// NOLINTEND(clang-diagnostic-reserved-identifier)

namespace {

class PowerCalls : public testing::Test {
  protected:
    void SetUp() override { forget_calls(); }
};

// A thousand pairs that differ in their last digits, and so each need a factor.
template <typename T>
int compare_thousand(const talreal tol) {
    const std::vector<T> ones(1000, T(1));
    const std::vector<T> above(1000, T(1) + std::numeric_limits<T>::epsilon());
    return sameQ(tol, Array<T>({1000}, ones), Array<T>({1000}, above));
}

TEST_F(PowerCalls, WholeToleranceNeedsNone) {
    EXPECT_EQ(nesk::ToleranceShiftFactor(10.0), 0x1p-43);
    EXPECT_EQ(nesk::ToleranceShiftFactor(10.0F), 0x1p-14F);
    EXPECT_EQ(compare_thousand<double>(10), 1);
    EXPECT_EQ(double_powers + single_powers, 0);
}

TEST_F(PowerCalls, FractionalToleranceIsAPowerOfTwo) {
    EXPECT_EQ(nesk::ToleranceShiftFactor(10.5), 1.6077746776921858e-13);
    EXPECT_EQ(double_powers, 1);
    EXPECT_EQ(last_base, 2.0);
    nesk::ToleranceShiftFactor(10.5F);
    EXPECT_EQ(single_powers, 1);
    EXPECT_EQ(last_base, 2.0);
}

TEST_F(PowerCalls, OneForAWholeArray) {
    in_new_thread([] {
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(double_powers, 1);
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(double_powers, 1) << "the factor is remembered over calls";
        EXPECT_EQ(compare_thousand<double>(11.5), 1);
        EXPECT_EQ(double_powers, 2);
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(double_powers, 3) << "only the last one is remembered";
        EXPECT_EQ(single_powers, 0);
    });
}

TEST_F(PowerCalls, SinglesAndDoublesRememberOnTheirOwn) {
    in_new_thread([] {
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(compare_thousand<float>(11.5), 1);
        EXPECT_EQ(compare_thousand<float>(12.5), 1);
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(double_powers, 1);
        EXPECT_EQ(single_powers, 2);
    });
}

TEST_F(PowerCalls, EachThreadRemembersItsOwn) {
    in_new_thread([] { EXPECT_EQ(compare_thousand<double>(10.5), 1); });
    in_new_thread([] { EXPECT_EQ(compare_thousand<double>(10.5), 1); });
    EXPECT_EQ(double_powers, 2);
}

TEST_F(PowerCalls, NaNToleranceIsNeverRemembered) {
    in_new_thread([] {
        const double nan = std::numeric_limits<double>::quiet_NaN();
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(compare_thousand<double>(nan), 0);
        EXPECT_EQ(compare_thousand<double>(nan), 0);
        EXPECT_EQ(double_powers, 3);
        EXPECT_EQ(compare_thousand<double>(10.5), 1) << "the NaN took the place of 10.5";
        EXPECT_EQ(double_powers, 4);
        EXPECT_EQ(compare_thousand<double>(10.5), 1);
        EXPECT_EQ(double_powers, 4);
    });
}

TEST_F(PowerCalls, NoneWherePairsDifferInTheirLeadingDigit) {
    in_new_thread([] {
        EXPECT_EQ(sameQ_of(10.5, 1.0, 2.5), 0);
        EXPECT_EQ(sameQ_of(10.5, 0.1, 0.3), 0);
        EXPECT_EQ(double_powers, 0);
    });
}

TEST_F(PowerCalls, NoneWhereNoFactorIsNeeded) {
    in_new_thread([] {
        EXPECT_EQ(sameQ_of(10.5, 1.0, 1.0F), 1);  // equal
        EXPECT_EQ(sameQ_of(10.5, 0.0, 1.0), 0);   // a zero
        EXPECT_EQ(sameQ_of(10.5, 1.0, -1.0), 0);  // opposite signs
        EXPECT_EQ(sameQ_of(-10.5, 1.0, 1.1), 0);  // no tolerance
        EXPECT_EQ(sameQ_of(60.5, 1.0, 1.1), 1);   // every digit tolerated
        EXPECT_EQ(sameQ_of(10.5, 1.0, 1e-17), 0); // one vanishes beside the other
        EXPECT_EQ(double_powers, 0);
    });
}

} // namespace
