// Whether the program is compiled as intended, with a product and a sum contracted into one
// operation.

#include <gtest/gtest.h>

namespace {

TEST(Contraction, IsOnInThisProgram) {
#if !defined(__FMA__) && !defined(__aarch64__) && !defined(__s390x__)
    GTEST_SKIP() << "the processor has no fused multiply-add";
#else
    const volatile double from = 1 + 0x1p-30;
    const volatile double rounded = from * from;
    const double x = from;
    EXPECT_EQ(x * x - rounded, 0x1p-60);
#endif
}

} // namespace
