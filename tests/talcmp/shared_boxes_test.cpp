// Comparisons whose boxes several processes share: threads stand for the processes here.

#include "comparison.h"

#include "support/compare_arrays.h"
#include "support/memory_array.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace {

using talcmp::Shape;

constexpr std::uint64_t length = std::uint64_t{1} << 22U; // 16 boxes of bytes
constexpr std::uint64_t box = std::uint64_t{1} << 18U;

using Bytes = FunctionArray<std::int8_t>;
using Read = Bytes::Read;

// What the processes have in common.
struct Exchange {
    std::atomic<std::uint64_t> next_box = 0;
    std::atomic<int> stops = 0;
    std::atomic<int> abandoned = 0;
    std::mutex mutex;
    std::condition_variable arrival;
    std::vector<talcmp::BoxResults> results; // of those that do not lead
};

// Hands out single boxes. The process with the number 0 leads.
class SharedBoxes : public talcmp::BoxSupply {
  public:
    SharedBoxes(Exchange& exchange, const std::size_t process, const std::size_t processes)
        : exchange_(exchange), process_(process), processes_(processes) {}

    bool is_shared() const override { return true; }
    bool leads() const override { return process_ == 0; }
    void begin(const talcmp::BoxPlan& plan, talcmp::ProgressListener& /*progress*/) override {
        count_ = plan.traversal().box_count();
    }
    talcmp::BoxRange next() override {
        const std::uint64_t next = exchange_.next_box++;
        return next < count_ ? talcmp::BoxRange{next, next + 1} : talcmp::BoxRange{};
    }
    void stop() override {
        ++exchange_.stops;
        exchange_.next_box += count_;
    }
    void merge(const talcmp::BoxPlan& /*plan*/, talcmp::BoxResults& results) override {
        std::unique_lock<std::mutex> lock(exchange_.mutex);
        if (!leads()) {
            exchange_.results.push_back(results);
            exchange_.arrival.notify_all();
            return;
        }
        exchange_.arrival.wait(lock, [&] { return exchange_.results.size() == processes_ - 1; });
        for (const talcmp::BoxResults& others : exchange_.results) {
            add(results.findings, others.findings);
            if (others.failure
                && (!results.failure || others.failure->box < results.failure->box)) {
                results.failure = others.failure;
                results.failure->elsewhere = true;
            }
        }
    }
    void abandon() override { ++exchange_.abandoned; }

  private:
    Exchange& exchange_;
    std::size_t process_;
    std::size_t processes_;
    std::uint64_t count_ = 0;
};

// Bytes as each process reads them.
using ReadOf = std::function<Read(std::size_t process)>;

class Processes : public testing::TestWithParam<std::size_t> {
  protected:
    Exchange exchange_;
    talcmp::Question question_ = question_of(2);
    bool leader_waits_ = false; // until others have stopped
    std::vector<talcmp::Comparison> results_ = std::vector<talcmp::Comparison>(GetParam());

    // Compares with zeros what each process reads. Returns the result of the one that leads.
    talcmp::Comparison compare(const ReadOf& read, const Access access = Access::random) {
        const std::size_t processes = GetParam();
        std::vector<std::thread> others;
        others.reserve(processes);
        for (std::size_t process = 1; process < processes; ++process) {
            others.emplace_back([&, process] { results_[process] = one(read, access, process); });
        }
        while (leader_waits_ && processes > 1 && exchange_.stops == 0) {
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        }
        talcmp::Comparison result;
        std::exception_ptr failure;
        try {
            result = one(read, access, 0);
        } catch (...) {
            failure = std::current_exception();
        }
        for (std::thread& thread : others) {
            thread.join();
        }
        if (failure) {
            std::rethrow_exception(failure);
        }
        return result;
    }

  private:
    talcmp::Comparison one(const ReadOf& read, const Access access, const std::size_t process) {
        SharedBoxes boxes(exchange_, process, GetParam());
        talcmp::NoProgress listener;
        return talcmp::compare(
            {"a", std::make_unique<Bytes>(Shape{length}, read(process), Order::c, access)},
            {"b", std::make_unique<Bytes>(Shape{length}, zeros)}, {}, question_, boxes, listener);
    }

    static void zeros(const std::uint64_t /*first*/, const std::uint64_t count,
                      std::int8_t* elements) {
        std::fill_n(elements, count, std::int8_t{0});
    }
};

// Ones at all positions that `period` divides.
Read ones_at_each(const std::uint64_t period) {
    return [period](const std::uint64_t first, const std::uint64_t count, std::int8_t* elements) {
        for (std::uint64_t i = 0; i < count; ++i) {
            elements[i] = (first + i) % period == 0 ? 1 : 0;
        }
    };
}

// Zeros, of which a process cannot read the box with the number `broken`.
ReadOf broken_in(const std::function<bool(std::size_t)>& process_fails,
                 const std::uint64_t broken) {
    return [=](const std::size_t process) -> Read {
        return [=](const std::uint64_t first, const std::uint64_t count, std::int8_t* elements) {
            if (first == broken * box && process_fails(process)) {
                throw talcmp::Trouble("a", "cannot be read by " + std::to_string(process));
            }
            std::fill_n(elements, count, std::int8_t{0});
        };
    };
}

TEST_P(Processes, CountTogetherWhatOneCounts) {
    constexpr std::uint64_t period = 1000;
    question_.report = true;
    question_.differences = 3;
    const auto result = compare([](std::size_t /*process*/) { return ones_at_each(period); });
    ASSERT_TRUE(result.report);
    EXPECT_EQ(result.report->totals.pairs, length);
    EXPECT_EQ(result.report->totals.differing, length / period + 1);
    ASSERT_EQ(result.places.size(), 3U);
    for (std::size_t i = 0; i < 3; ++i) {
        EXPECT_EQ(result.places[i].index, Shape{i * period});
    }
    EXPECT_EQ(exchange_.stops, 0);
    EXPECT_EQ(exchange_.abandoned, 0);
}

TEST_P(Processes, TakeEachBoxOnce) {
    std::mutex mutex;
    std::vector<std::uint64_t> read(length / box);
    compare([&](std::size_t /*process*/) -> Read {
        return [&](const std::uint64_t first, const std::uint64_t count, std::int8_t* elements) {
            const std::lock_guard<std::mutex> lock(mutex);
            ++read[static_cast<std::size_t>(first / box)];
            std::fill_n(elements, count, std::int8_t{0});
        };
    });
    EXPECT_EQ(read, std::vector<std::uint64_t>(length / box, 1));
}

TEST_P(Processes, HandOutNothingMoreOnceTheFirstDifferenceIsKnown) {
    std::atomic<std::uint64_t> boxes = 0;
    const auto result = compare([&](std::size_t /*process*/) -> Read {
        return [&](const std::uint64_t first, const std::uint64_t count, std::int8_t* elements) {
            ++boxes;
            ones_at_each(1)(first, count, elements);
        };
    });
    ASSERT_EQ(result.places.size(), 1U);
    EXPECT_EQ(result.places[0].index, Shape{0});
    EXPECT_GE(exchange_.stops, 1);
    // One for each thread, at most.
    EXPECT_LE(boxes, 2 * GetParam());
}

TEST_P(Processes, ReportTheFirstBoxThatNoneOfThemCanRead) {
    const auto fails = [](std::size_t /*process*/) { return true; };
    leader_waits_ = true;
    // In the words of the one that leads, whoever took the box.
    EXPECT_EQ(thrown_message([&] { compare(broken_in(fails, 7)); }), "a: cannot be read by 0");
    EXPECT_EQ(exchange_.abandoned, 1);
}

TEST_P(Processes, ReportABoxThatTheOneThatLeadsCouldRead) {
    std::atomic<std::size_t> failed = 0;
    const auto fails = [&](const std::size_t process) {
        failed = process == 0 ? failed.load() : process;
        return process != 0;
    };
    leader_waits_ = true;
    const std::string message = thrown_message([&] { compare(broken_in(fails, 7)); });
    if (GetParam() == 1) {
        EXPECT_EQ(message, "none");
    } else {
        EXPECT_EQ(message, "a: cannot be read by " + std::to_string(failed));
    }
}

TEST_P(Processes, LeaveToOneWhatCannotBeDivided) {
    std::atomic<std::uint64_t> read_elsewhere = 0;
    const auto result = compare(
        [&](const std::size_t process) -> Read {
            return [&, process](const std::uint64_t first, const std::uint64_t count,
                                std::int8_t* elements) {
                read_elsewhere += process == 0 ? 0 : count;
                ones_at_each(length - 1)(first, count, elements);
            };
        },
        Access::once);
    ASSERT_EQ(result.places.size(), 1U);
    EXPECT_EQ(result.places[0].index, Shape{0});
    EXPECT_EQ(read_elsewhere, 0U);
}

INSTANTIATE_TEST_SUITE_P(Shared, Processes, testing::Values(1, 2, 5));

} // namespace
