// A child that is forked while other threads compare can compare at once, and begins with what the
// forking thread remembers.

#include "support/arrays.h"
#include "support/child_process.h"
#include "support/prepared_calls.h"

#include <gtest/gtest.h>

#include <atomic>
#include <thread>
#include <vector>

namespace {

// Two threads that compare for as long as it lives.
class ComparingThreads {
  public:
    explicit ComparingThreads(const PreparedCalls& prepared) {
        for (std::thread& thread : threads_) {
            thread = std::thread([this, &prepared] {
                while (!stopped_) {
                    wrong_answers_ += prepared.wrong_answers();
                    ++rounds_;
                }
            });
        }
        while (rounds_ == 0) {
            std::this_thread::yield();
        }
    }
    ComparingThreads(const ComparingThreads&) = delete;
    ComparingThreads& operator=(const ComparingThreads&) = delete;
    ~ComparingThreads() {
        stopped_ = true;
        for (std::thread& thread : threads_) {
            thread.join();
        }
        EXPECT_EQ(wrong_answers_, 0);
    }

  private:
    std::atomic<bool> stopped_{false};
    std::atomic<int> rounds_{0};
    std::atomic<int> wrong_answers_{0};
    std::thread threads_[2];
};

constexpr int children = 5;

TEST(Fork, LeavesAChildThatCompares) {
    const PreparedCalls prepared;
    const ComparingThreads threads(prepared);
    for (int child = 0; child < children; ++child) {
        ASSERT_EQ(in_child([&] { return prepared.wrong_answers() == 0 ? 0 : 1; }), success);
    }
}

// For numbers that differ by more than half the larger, the answer shows what is remembered.
class WhatIsRemembered {
  public:
    bool is_the_factor() const noexcept { return answer(one_, far_) == 1; }
    bool becomes_the_factor() const noexcept { return answer(one_, near_) == 1; }
    bool becomes_another() const noexcept {
        return TalNumericArray_sameQ(10, 1, one_.handle(), nearest_.handle()) == 1;
    }

  private:
    static int answer(const Array<double>& array1, const Array<double>& array2) noexcept {
        return TalNumericArray_sameQ(52.5, 1, array1.handle(), array2.handle());
    }

    Array<double> one_{1};
    Array<double> far_{2.5};
    Array<double> near_{1.25};
    Array<double> nearest_{1 + 0x1p-44};
};

TEST(Fork, LeavesEachProcessWhatItRemembers) {
    const PreparedCalls prepared;
    const ComparingThreads threads(prepared);
    const WhatIsRemembered factor;
    EXPECT_FALSE(factor.is_the_factor());
    EXPECT_TRUE(factor.becomes_the_factor());
    for (int child = 0; child < children; ++child) {
        ASSERT_EQ(in_child([&] {
                      const bool inherited = factor.is_the_factor();
                      return inherited && factor.becomes_another() && !factor.is_the_factor() ? 0
                                                                                              : 1;
                  }),
                  success);
        ASSERT_TRUE(factor.is_the_factor()) << "the child changed what its parent remembers";
    }
}

} // namespace
