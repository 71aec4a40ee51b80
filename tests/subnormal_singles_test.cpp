// Subnormal singles, which some vector units take for zero.
//
// The loops here have no early exit, so that compilers vectorise them where they can.

#include "support/arrays.h"

#include "compare.h"
#include "talnumericarray_sameq_elements.h"

#include <gtest/gtest.h>

#include <complex>
#include <cstddef>
#include <vector>

namespace {

constexpr std::size_t count = 64;
constexpr float subnormal = 1e-40F;

// A caller's loop, in a function of its own, so that the compiler knows nothing of the values.
template <typename T1, typename T2>
[[gnu::noinline]] std::size_t comparisons_that_answer_same(const talreal tol, const T1* data1,
                                                           const T2* data2) {
    std::size_t same = 0;
    for (std::size_t i = 0; i < count; ++i) {
        same += nesk::compare(tol, data1[i], data2[i]) == 0 ? 1U : 0U;
    }
    return same;
}

// A loop that is compiled as the module's own are.
NESK_STRICT_SINGLES_BEGIN
template <typename T1, typename T2>
[[gnu::noinline]] std::size_t tests_that_answer_same(const talreal tol, const T1* data1,
                                                     const T2* data2) {
    std::size_t same = 0;
    for (std::size_t i = 0; i < count; ++i) {
        same += sameQ_test(tol, data1[i], data2[i]) ? 1U : 0U;
    }
    return same;
}
NESK_STRICT_SINGLES_END

TEST(SubnormalSingles, DifferFromZeroInLoopsOfComparisons) {
    const std::vector<float> subnormals(count, subnormal);
    const std::vector<float> zeros(count, 0.0F);
    const std::vector<BIT8> integers(count, 0);
    for (const double tol : every_tolerance) {
        EXPECT_EQ(comparisons_that_answer_same(tol, subnormals.data(), zeros.data()), 0U) << tol;
        EXPECT_EQ(comparisons_that_answer_same(tol, zeros.data(), subnormals.data()), 0U) << tol;
        EXPECT_EQ(comparisons_that_answer_same(tol, subnormals.data(), integers.data()), 0U) << tol;
    }
}

TEST(SubnormalSingles, DifferFromZeroInLoopsOfElementTests) {
    using Complex = std::complex<float>;
    const std::vector<Complex> subnormals(count, Complex(0, subnormal));
    const std::vector<Complex> zeros(count);
    const std::vector<float> reals(count, 0.0F);
    for (const double tol : every_tolerance) {
        EXPECT_EQ(tests_that_answer_same(tol, subnormals.data(), zeros.data()), 0U) << tol;
        EXPECT_EQ(tests_that_answer_same(tol, zeros.data(), subnormals.data()), 0U) << tol;
        EXPECT_EQ(tests_that_answer_same(tol, subnormals.data(), reals.data()), 0U) << tol;
        EXPECT_EQ(tests_that_answer_same(tol, reals.data(), subnormals.data()), 0U) << tol;
    }
}

TEST(SubnormalSingles, DifferFromEachOther) {
    const std::vector<float> ones(count, subnormal);
    const std::vector<float> twos(count, 2 * subnormal);
    for (const double tol : {-1.0, 0.0, 10.0, 22.5}) {
        EXPECT_EQ(comparisons_that_answer_same(tol, ones.data(), twos.data()), 0U) << tol;
        EXPECT_EQ(comparisons_that_answer_same(tol, ones.data(), ones.data()), count) << tol;
    }
}

TEST(SubnormalSingles, DifferFromZeroInArrays) {
    const auto length = static_cast<talint>(count);
    const Array<float> zeros({length}, std::vector<float>(count, 0.0F));
    for (std::size_t position = 0; position < count; ++position) {
        std::vector<float> elements(count, 0.0F);
        elements[position] = subnormal;
        const Array<float> array({length}, elements);
        for (const double tol : every_tolerance) {
            EXPECT_EQ(sameQ(tol, array, zeros), 0) << position << ' ' << tol;
            EXPECT_EQ(sameQ(tol, zeros, array), 0) << position << ' ' << tol;
        }
    }
}

} // namespace
