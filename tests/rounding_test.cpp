// The module against the oracle under every kind of arithmetic that a program can ask for: the
// answer is that of the rule, worked out in that arithmetic.

#include "promotion_rules.h"

#include "support/arrays.h"
#include "support/checked_calls.h"
#include "support/floating_point_modes.h"
#include "support/oracle.h"
#include "support/random_arrays.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iostream>
#include <vector>

namespace {

// In a thread that has not compared yet.
template <typename Scope>
void expect_no_mismatch(const Scope& make_scope) {
    const std::uint64_t seed = oracle::printed_seed();
    const std::uint64_t calls = oracle::requested_calls() / 10;
    ASSERT_GT(calls, 0U);
    std::cout << calls << " calls" << std::endl;
    in_new_thread([&] {
        const auto scope = make_scope();
        const oracle::Tally tally = oracle::run_checked_calls(seed, calls);
        EXPECT_EQ(tally.mismatches, 0U);
        EXPECT_GT(tally.same, calls / 10);
        EXPECT_LT(tally.same, calls - calls / 10);
    });
}

TEST(Rounded, AnswersFollowTheRuleInEveryDirection) {
    for (const Rounding& rounding : roundings) {
        SCOPED_TRACE(rounding.name);
        expect_no_mismatch([&rounding] { return RoundingScope(rounding); });
    }
}

// Arrays long enough for blocks, of sevens with one hard pair after the middle.
template <typename T1, typename T2>
void expect_no_mismatch_in_blocks(oracle::Random& random) {
    using T = type_common_t<T1, T2>;
    constexpr std::size_t place = 100;
    constexpr talint count = 140;
    std::vector<T1> elements1(count, T1(7));
    std::vector<T2> elements2(count, T2(7));
    const std::uint64_t calls = oracle::requested_calls() / 200;
    for (const double tol : {4.0, 10.5, 20.25, 22.0}) {
        for (std::uint64_t call = 0; call < calls; ++call) {
            oracle::draw_elements(random, tol, element_type_id<T1>, element_type_id<T2>, true,
                                  &elements1[place], &elements2[place]);
            const Array<T1> array1({count}, elements1);
            const Array<T2> array2({count}, elements2);
            oracle::State state;
            const bool expected = oracle::same(
                state, tol, true, {element_type_id<T1>, {count}, count, elements1.data()},
                {element_type_id<T2>, {count}, count, elements2.data()});
            sameQ_of(tol, T(7), std::nextafter(T(7), T(8))); // so that the factor is remembered
            ASSERT_EQ(sameQ(tol, array1, array2), expected ? 1 : 0)
                << tol << ": " << testing::PrintToString(elements1[place]) << " and "
                << testing::PrintToString(elements2[place]);
        }
    }
}

TEST(Rounded, AnswersInBlocksFollowTheRuleInEveryDirection) {
    oracle::Random random(oracle::printed_seed());
    for (const Rounding& rounding : roundings) {
        SCOPED_TRACE(rounding.name);
        const RoundingScope scope(rounding);
        expect_no_mismatch_in_blocks<double, double>(random);
        expect_no_mismatch_in_blocks<float, float>(random);
        expect_no_mismatch_in_blocks<float, double>(random);
        expect_no_mismatch_in_blocks<std::int64_t, double>(random);
        expect_no_mismatch_in_blocks<std::uint64_t, float>(random);
    }
}

TEST(Flushed, AnswersFollowTheRule) {
    if (flushing == 0) {
        GTEST_SKIP() << "NOT TESTED: this processor takes no subnormal number for zero";
    }
    expect_no_mismatch([] { return FlushingScope(); });
}

// Except where bits are compared.
TEST(Flushed, SubnormalNumbersCountAsZero) {
    if (flushing == 0) {
        GTEST_SKIP() << "NOT TESTED: this processor takes no subnormal number for zero";
    }
    const FlushingScope scope;
    for (const double tol : {-1.0, 10.0, 10.5, 23.5, 53.0}) {
        EXPECT_EQ(sameQ_of(tol, 1e-310, 0.0), 1) << tol;
        EXPECT_EQ(sameQ_of(tol, 1e-40F, 0.0F), 1) << tol;
        EXPECT_EQ(sameQ_of(tol, 1e-40F, 1e-40), 0) << tol;
    }
    EXPECT_EQ(sameQ_of(0, 1e-310, 0.0), 0);
    EXPECT_EQ(sameQ_of(0, 1e-40F, 0.0F), 0);
}

} // namespace
