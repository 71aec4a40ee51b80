// The recorded calls, answered on this platform.

#include "support/arrays.h"
#include "support/golden_calls.h"

#include <gtest/gtest.h>

#include <fstream>
#include <iostream>
#include <sstream>

namespace {

TEST(GoldenCalls, AreAnsweredAsOnThePlatformThatRecordedThem) {
    std::ifstream records(GOLDEN_CALLS);
    ASSERT_TRUE(records.is_open()) << GOLDEN_CALLS;
    golden::Tally tally;
    in_new_thread([&] { tally = golden::check(records); });

    std::cout << tally.calls << " calls, " << tally.same << " the same, " << tally.factors
              << " factors, " << tally.factors_rounded_otherwise << " rounded otherwise"
              << std::endl;
    EXPECT_GE(tally.calls, 100000U);
    EXPECT_GT(tally.same, tally.calls / 5);
    EXPECT_LT(tally.same, tally.calls / 5 * 4);
    EXPECT_EQ(tally.pairs_of_types, 144U);
    // glibc's pow rounds about one factor in a thousand differently.
    EXPECT_LE(tally.factors_rounded_otherwise, tally.factors / 200);
}

TEST(GoldenCalls, AreReadAsTheyAreRecorded) {
    std::stringstream records;
    golden::Tally tally;
    in_new_thread([&] { golden::record(records, 1, 20); });
    in_new_thread([&] { tally = golden::check(records); });
    EXPECT_EQ(tally.calls, 20 * golden::calls_per_block);
}

} // namespace
