// Integers of 64 bits become the same reals as by a cast, whether they are converted in halves or
// not.

#include "talnumericarray_sameq_certainty.h"

#include <gtest/gtest.h>

#include <cstdint>

namespace {

template <typename T, typename From>
void expect_cast(const std::uint64_t bits) {
    const auto number = static_cast<From>(bits);
    EXPECT_EQ(talnumericarray::by_halves<T>(number), static_cast<T>(number)) << number;
}

// Numbers around every power of two, and numbers between these that use both halves.
template <typename T, typename From>
void expect_casts() {
    for (int power = 0; power < 64; ++power) {
        const std::uint64_t bits = std::uint64_t{1} << power;
        for (std::uint64_t offset = 0; offset < 4; ++offset) {
            for (const std::uint64_t number :
                 {bits - offset, bits + offset, bits / 5 * 7 + offset}) {
                expect_cast<T, From>(number);
                expect_cast<T, From>(-number);
            }
        }
    }
}

TEST(ByHalves, GivesWhatACastGives) {
    expect_casts<double, std::int64_t>();
    expect_casts<double, std::uint64_t>();
    expect_casts<float, std::int64_t>();
    expect_casts<float, std::uint64_t>();
}

} // namespace
