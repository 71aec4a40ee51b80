// Pairs of element types of which at least one is complex.

#include "talnumericarray_compare.h"

#include "support/arrays.h"
#include "support/tolerances.h"

#include <gtest/gtest.h>

#include <complex>
#include <limits>

namespace {

using Complex32 = std::complex<float>;
using Complex64 = std::complex<double>;

constexpr double nan = std::numeric_limits<double>::quiet_NaN();

TEST(RealAgainstComplex, ImaginaryPartMustBeZero) {
    EXPECT_EQ(sameQ_under_all(BIT8{5}, Complex64(5, 0)), 1);
    EXPECT_EQ(sameQ_under_all(BIT8{5}, Complex64(5, -0.0)), 1);
    EXPECT_EQ(sameQ_under_all(BIT8{5}, Complex64(5, 1e-300)), 0);
    EXPECT_EQ(sameQ_under_all(BIT8{5}, Complex64(5, nan)), 0);
}

TEST(ComplexAgainstReal, ImaginaryPartMustBeZero) {
    EXPECT_EQ(sameQ_under_all(Complex64(5, 0), BIT8{5}), 1);
    EXPECT_EQ(sameQ_under_all(Complex64(5, -0.0), BIT8{5}), 1);
    EXPECT_EQ(sameQ_under_all(Complex64(5, 1e-300), BIT8{5}), 0);
    EXPECT_EQ(sameQ_under_all(Complex64(5, nan), BIT8{5}), 0);
}

TEST(ComplexAgainstReal, EqualRealPartsAreNotEnough) {
    EXPECT_EQ(sameQ_under_all(Complex32(2, 3), BIT16{2}), 0);
    EXPECT_EQ(sameQ_under_all(BIT16{2}, Complex32(2, 3)), 0);
}

TEST(ComplexAgainstReal, RealPartsAreComparedUnderTheTolerance) {
    EXPECT_EQ(sameQ_of(30, Complex64(5.0000001, 0), BIT32{5}), 1);
    EXPECT_EQ(sameQ_of(10, Complex64(5.0000001, 0), BIT32{5}), 0);
    EXPECT_EQ(sameQ_of(30, 5.0, Complex64(5.0000001, 0)), 1);
    EXPECT_EQ(sameQ_of(10, 5.0, Complex64(5.0000001, 0)), 0);
}

TEST(ComplexAgainstComplex, ZeroImaginaryPartIsNotNearATinyOne) {
    EXPECT_EQ(sameQ_under_all(Complex64(1, 0), Complex64(1, 1e-300)), 0);
    EXPECT_EQ(sameQ_under_all(Complex64(1, 1e-300), Complex64(1, 0)), 0);
}

TEST(ComplexAgainstComplex, ZerosOfBothSigns) {
    EXPECT_EQ(sameQ_of(0.0, Complex64(0.0, 0), Complex64(-0.0, 0)), 0);
    EXPECT_EQ(sameQ_of(1e-10, Complex64(0.0, 0), Complex64(-0.0, 0)), 1);
    EXPECT_EQ(sameQ_of(0.0, Complex64(0, 0.0), Complex64(0, -0.0)), 0);
    EXPECT_EQ(sameQ_of(1e-10, Complex64(0, 0.0), Complex64(0, -0.0)), 1);
}

TEST(ComplexAgainstComplex, NaNsOfEqualBits) {
    const float single_nan = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(sameQ_of(0.0, Complex32(single_nan, 1), Complex32(single_nan, 1)), 1);
    EXPECT_EQ(sameQ_of(1e-10, Complex32(single_nan, 1), Complex32(single_nan, 1)), 0);
}

TEST(ComplexAgainstComplex, WidthsThatDifferAreNeverComparedAsBytes) {
    EXPECT_EQ(sameQ_of(0.0, Complex32(1.5F, -2), Complex64(1.5, -2)), 1);
    EXPECT_EQ(sameQ_of(0.0, Complex64(1.5, -2), Complex32(1.5F, -2)), 1);
    EXPECT_EQ(sameQ_of(0.0, Complex32(0.0F, -0.0F), Complex64(-0.0, 0.0)), 1);
}

TEST(ComplexAgainstInteger, SinglePartsDecide) {
    EXPECT_EQ(sameQ_under_all(BIT32{16777217}, Complex32(16777216, 0)), 1);
    EXPECT_EQ(sameQ_under_all(Complex32(16777216, 0), BIT32{16777217}), 1);
    EXPECT_EQ(sameQ_of(0, BIT32{16777217}, Complex64(16777216, 0)), 0);
}

TEST(ComplexAgainstComplex, ToleranceThatIsZeroOnlyAsASingle) {
    EXPECT_EQ(sameQ_of(1e-46, Complex32(0.0F, 0), Complex32(-0.0F, 0)), 1);
    EXPECT_EQ(sameQ_of(1e-46, Complex32(1, 0), Complex32(1.0000001F, 0)), 0);
    EXPECT_EQ(sameQ_of(0x1p-150, Complex32(1, 0), Complex32(1.0000001F, 0)), 0);
}

TEST(ComplexAgainstComplex, ToleranceBeyondTheSinglesIsInfiniteThere) {
    EXPECT_EQ(sameQ_of(1e300, Complex32(1, 2), Complex32(1000, 2000)), 1);
    EXPECT_EQ(sameQ_of(1e300, Complex32(1, 2), Complex32(1000, -2)), 0);
}

TEST(ComplexAgainstComplex, EachPartIsJudgedOnItsOwn) {
    // The modulus of the difference would be small beside that of the numbers.
    EXPECT_EQ(sameQ_of(10, Complex64(1e10, 1.0), Complex64(1e10, 1.001)), 0);
    EXPECT_EQ(sameQ_of(10, Complex64(1.0, 1e10), Complex64(1.001, 1e10)), 0);
    EXPECT_EQ(sameQ_of(45, Complex64(1.0, 1e10), Complex64(1.001, 1e10)), 1);
}

TEST(ComplexAgainstComplex, SinglePartsAreWidenedBesideDoubles) {
    EXPECT_EQ(sameQ_of(20, Complex32(0.1F, 0), Complex64(0.1, 0)), 0);
    EXPECT_EQ(sameQ_of(30, Complex32(0.1F, 0), Complex64(0.1, 0)), 1);
    EXPECT_EQ(sameQ_of(20, Complex32(0.1F, 0), 0.1), 0) << "a double decides here too";
    EXPECT_EQ(sameQ_of(20, Complex32(0.1F, 0), 0.1F), 1);
}

// Real parts that differ in their leading digit leave the imaginary parts, and what they would make
// the comparison remember, alone.
TEST(ComplexAgainstComplex, ImaginaryPartsComeSecond) {
    in_new_thread([] {
        EXPECT_EQ(sameQ_of(52.5, Complex64(1.0, 1.0), Complex64(2.5, 1.1)), 0);
        EXPECT_EQ(sameQ_of(52.5, 1.0, 2.5), 0) << "the factor is not remembered yet";
        EXPECT_EQ(sameQ_of(52.5, Complex64(1.0, 1.0), Complex64(1.1, 2.5)), 1);
    });
}

TEST(Unknown, TypeOfTheSecondArrayIsNeverTheSame) {
    for (const type_t type : {0, 13, 100}) {
        const Array<Complex32> singles = {Complex32(1, 0)};
        const Array<Complex64> doubles = {Complex64(1, 0)};
        Array<Complex64> unknown = {Complex64(1, 0)};
        unknown.record().data_type = type;
        EXPECT_EQ(sameQ(10, singles, unknown), 0) << type;
        EXPECT_EQ(sameQ(10, doubles, unknown), 0) << type;
    }
}

} // namespace
