// A long sequence of random calls over all pairs of element types. Some tens of thousands of calls
// are needed before every pair has given both answers.

#include "support/checked_calls.h"

#include <gtest/gtest.h>

#include <iostream>
#include <thread>

namespace {

TEST(RandomCalls, AnswerAsTheOracle) {
    const std::uint64_t seed = oracle::printed_seed();
    oracle::Tally tally;
    std::thread([&] { tally = oracle::run_checked_calls(seed, oracle::requested_calls()); }).join();

    int pairs = 0;
    for (int first = 0; first < 12; ++first) {
        for (int second = 0; second < 12; ++second) {
            const bool different = tally.answered[0][first][second];
            const bool same = tally.answered[1][first][second];
            pairs += different || same ? 1 : 0;
            EXPECT_TRUE(different && same)
                << "types " << first + 1 << " and " << second + 1 << " did not give both answers";
        }
    }
    std::cout << tally.calls << " calls, " << tally.same << " the same, " << pairs
              << " pairs of types" << std::endl;
    EXPECT_EQ(pairs, 144);
    EXPECT_EQ(tally.mismatches, 0U);
}

} // namespace
