// Two threads compare at once under tolerances of their own. A factor that leaks from one to the
// other changes answers, as all pairs lie close to the limit.

#include "support/checked_calls.h"

#include <gtest/gtest.h>

#include <atomic>
#include <iostream>
#include <thread>

namespace {

TEST(Threads, KeepTheirTolerancesApart) {
    const std::uint64_t seed = oracle::printed_seed();
    const std::uint64_t calls = oracle::requested_calls() / 4;
    ASSERT_GT(calls, 0U);
    std::cout << calls << " calls a thread" << std::endl;

    std::atomic<int> waiting{2};
    const auto run = [&](std::uint64_t own_seed, const std::vector<double>& tolerances) {
        --waiting;
        while (waiting > 0) {
            std::this_thread::yield();
        }
        EXPECT_EQ(oracle::run_checked_calls(own_seed, calls, tolerances).mismatches, 0U);
    };
    std::thread one(run, seed, std::vector<double>{52.75, 23.75, 50.3, 17.5});
    std::thread other(run, seed + 1, std::vector<double>{52.25, 23.25, 49.5, 10.75});
    one.join();
    other.join();
}

} // namespace
