// Comparisons of arrays in memory: their results, whatever the number of threads, and failures that
// no file can be made to have.

#include "comparison.h"

#include "support/compare_arrays.h"
#include "support/memory_array.h"
#include "support/sanitizers.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <tuple>
#include <utility>
#include <vector>

namespace {

using namespace std::chrono_literals;
using talcmp::Shape;

constexpr std::uint64_t length = 1000000;

using Bytes = FunctionArray<std::int8_t>;

Source bytes(Bytes::Read read) {
    return std::make_unique<Bytes>(Shape{length}, std::move(read));
}

Source zeros_and_one(const std::uint64_t one) {
    return bytes([one](const std::uint64_t first, const std::uint64_t count,
                       std::int8_t* elements) { read_zeros_and_one(one, first, count, elements); });
}

// Gives up in the end, as there may be no other thread.
template <typename Event>
void wait_for(const Event& has_come) {
    for (int patience = 200; !has_come() && patience > 0; --patience) {
        std::this_thread::sleep_for(1ms);
    }
}

[[noreturn]] void fail_from(const std::uint64_t first) {
    throw talcmp::Trouble("broken.npy", "cannot be read from " + std::to_string(first) + " on");
}

// Zeros that cannot be read from `broken` on. The first are handed out only after others have
// failed, if any are read meanwhile.
Source broken_array(const std::uint64_t broken, std::atomic<int>& failures) {
    return bytes([broken, &failures](const std::uint64_t first, const std::uint64_t count,
                                     std::int8_t* elements) {
        wait_for([&] { return first != 0 || failures != 0; });
        if (first + count > broken) {
            failures += 1;
            fail_from(first);
        }
        std::fill_n(elements, count, std::int8_t{0});
    });
}

// A source that can be read only once, by columns, and fails.
Source broken_pipe(const std::string& name) {
    const auto fail = [name](std::uint64_t /*first*/, std::uint64_t /*count*/,
                             std::int8_t* /*elements*/) {
        throw talcmp::Trouble(name, "cannot be read");
    };
    return std::make_unique<Bytes>(Shape{3, 4}, fail, Order::fortran, Access::once);
}

class BrokenFiles : public testing::TestWithParam<unsigned> {
  protected:
    talcmp::Question question_ = question_of(GetParam());
    std::atomic<int> failures_ = 0;

    talcmp::Comparison compare(const std::uint64_t broken, const std::uint64_t one) {
        failures_ = 0;
        return compare_arrays(broken_array(broken, failures_), zeros_and_one(one), question_);
    }
};

TEST_P(BrokenFiles, DifferWhereTheyAreReadBeforeTheyFail) {
    const talcmp::Comparison result = compare(length / 2, 5);
    EXPECT_EQ(result.difference, talcmp::Difference::elements);
    ASSERT_EQ(result.places.size(), 1U);
    EXPECT_EQ(result.places[0].index, Shape{5});
}

TEST_P(BrokenFiles, AreTroubleWhereTheyFailBeforeTheyDiffer) {
    const std::string first = thrown_message([&] { compare(length / 2, length - 1); });
    EXPECT_NE(first.find("broken.npy: cannot be read from "), std::string::npos) << first;
    question_.report = true; // which needs all of the arrays
    EXPECT_EQ(thrown_message([&] { compare(length / 2, 5); }), first);
}

TEST_P(BrokenFiles, AreTroubleAtTheFirstPlaceThatFails) {
    EXPECT_EQ(thrown_message([&] { compare(1, length - 1); }),
              "broken.npy: cannot be read from 0 on");
}

// Several threads read at once, and the first elements fail first.
TEST_P(BrokenFiles, AreTroubleAtTheFirstPlaceWhateverFailsLater) {
    std::atomic<bool> others_begun = false;
    std::atomic<bool> first_failed = false;
    const auto fail_in_order = [&](const std::uint64_t first, std::uint64_t /*count*/,
                                   std::int8_t* /*elements*/) {
        if (first == 0) {
            wait_for([&] { return others_begun.load(); });
            first_failed = true;
        } else {
            others_begun = true;
            wait_for([&] { return first_failed.load(); });
            std::this_thread::sleep_for(20ms); // until the failure is known
        }
        fail_from(first);
    };
    EXPECT_EQ(thrown_message(
                  [&] { compare_arrays(bytes(fail_in_order), zeros_and_one(length), question_); }),
              "broken.npy: cannot be read from 0 on");
}

TEST(BrokenFile, IsReadNoFurtherThanToWhereItFails) {
    std::atomic<int> failures = 0;
    EXPECT_THROW(compare_arrays(broken_array(0, failures), zeros_and_one(length), question_of(1)),
                 talcmp::Trouble);
    EXPECT_EQ(failures, 1);
}

// However they are read, also where they have to be copied first.
TEST_P(BrokenFiles, AreTroubleOfTheFirstOfTwo) {
    for (const char* const slice : {":", ":,::2"}) {
        question_.selection = talcmp::read_selection(slice);
        EXPECT_EQ(thrown_message([&] {
                      compare_arrays(broken_pipe("first"), broken_pipe("second"), question_);
                  }),
                  "first: cannot be read");
    }
}

TEST_P(BrokenFiles, AreTroubleAsTheSecondOperand) {
    EXPECT_EQ(thrown_message([&] {
                  compare_arrays(zeros_and_one(length), broken_array(0, failures_), question_);
              }),
              "broken.npy: cannot be read from 0 on");
}

INSTANTIATE_TEST_SUITE_P(Threads, BrokenFiles, testing::Values(1U, 2U, 8U));

// ---- Arrays that can be read

using Bytes8 = std::vector<std::int8_t>;
using talcmp::Difference;

// Adds up what it is called with.
struct Listener : talcmp::ProgressListener {
    int begun = 0;
    std::uint64_t total = 0;
    std::atomic<std::uint64_t> done = 0;

    void begin(const std::uint64_t total_bytes) override {
        begun += 1;
        total += total_bytes;
    }
    void advance(const std::uint64_t bytes) override { done += bytes; }
};

template <typename T>
Source array(Shape shape, std::vector<T> elements, const Order order = Order::c,
             const Access access = Access::random) {
    return std::make_unique<MemoryArray<T>>(std::move(shape), std::move(elements), order, access);
}

Source row(const Bytes8& elements) {
    return array({elements.size()}, elements);
}

// The index of a place of bytes, and the bytes there.
using Listed = std::tuple<Shape, int, int>;

std::vector<Listed> listed(const std::vector<talcmp::Place>& places) {
    std::vector<Listed> all;
    all.reserve(places.size());
    for (const talcmp::Place& place : places) {
        all.emplace_back(place.index, static_cast<std::int8_t>(place.element1[0]),
                         static_cast<std::int8_t>(place.element2[0]));
    }
    return all;
}

class Comparisons : public testing::TestWithParam<unsigned> {
  protected:
    talcmp::Question question_ = question_of(GetParam());
    Listener listener_;

    talcmp::Comparison compare(Source first, Source second) {
        return compare_arrays(std::move(first), std::move(second), question_, listener_);
    }
};

TEST_P(Comparisons, FindTheFirstPlacesOfMany) {
    Bytes8 ones(length);
    const std::vector<std::uint64_t> positions = {5, 9, 300000, 300001, 600000, 999990, 999999};
    std::vector<Listed> expected;
    for (const std::uint64_t position : positions) {
        ones[static_cast<std::size_t>(position)] = 1;
        expected.emplace_back(Shape{position}, 0, 1);
    }
    while (!expected.empty()) {
        SCOPED_TRACE(expected.size());
        question_.differences = expected.size();
        const auto result = compare(row(Bytes8(length)), row(ones));
        EXPECT_EQ(result.difference, Difference::elements);
        EXPECT_EQ(listed(result.places), expected);
        expected.pop_back();
    }
}

using Indices = std::vector<std::pair<std::size_t, std::size_t>>;

constexpr Order orders[] = {Order::c, Order::fortran};

// Zeros, except 1, 2 and so on, times `sign`, at the indices.
Source numbered(const std::size_t rows, const std::size_t columns, const Indices& indices,
                const int sign, const Order order) {
    Bytes8 elements(rows * columns);
    int number = 0;
    for (const auto& [row, column] : indices) {
        elements[order == Order::c ? row * columns + column : column * rows + row] =
            static_cast<std::int8_t>(sign * ++number);
    }
    return array({rows, columns}, elements, order);
}

// However they are stored, arrays that differ at the indices, which are in row-major order.
void expect_first_places(const talcmp::Question& question, const std::size_t rows,
                         const std::size_t columns, const Indices& indices) {
    std::vector<Listed> expected;
    for (const auto& [row, column] : indices) {
        const int number = static_cast<int>(expected.size()) + 1;
        expected.emplace_back(Shape{row, column}, number, -number);
    }
    expected.resize(std::min(expected.size(), question.differences));
    for (const Order order1 : orders) {
        for (const Order order2 : orders) {
            const auto result =
                compare_arrays(numbered(rows, columns, indices, 1, order1),
                               numbered(rows, columns, indices, -1, order2), question);
            EXPECT_EQ(listed(result.places), expected);
        }
    }
}

// At these sizes boxes are cut off at the edges.
TEST_P(Comparisons, ListPlacesInRowMajorOrderHoweverArraysAreStored) {
    const Indices indices = {{2, 1499},    {3, 3},    {1447, 1448}, {1448, 2},
                             {1448, 1447}, {1499, 0}, {1499, 1499}};
    question_.differences = 100;
    expect_first_places(question_, 1500, 1500, indices);
}

// Also where a place is met before one that comes earlier.
TEST_P(Comparisons, FindTheFirstOfPlacesThatAreMetInAnotherOrder) {
    const Indices indices = {{0, 40}, {0, 49}, {1, 1}, {2, 0}, {3, 30}, {39, 0}, {39, 2}};
    for (question_.differences = 1; question_.differences <= 8; ++question_.differences) {
        expect_first_places(question_, 40, 50, indices);
    }
}

TEST_P(Comparisons, CountAllPairsOfArraysOfTwoTypesInAStrictReport) {
    question_.strict_type = true;
    question_.report = true;
    const auto result = compare(row({1, 2, 3}), array<double>({3}, {1, 2, 3.5}));
    EXPECT_EQ(result.difference, Difference::type);
    EXPECT_EQ(listed(result.places).size(), 1U);
    ASSERT_TRUE(result.report.has_value());
    EXPECT_EQ(result.report->totals.pairs, 3U);
    EXPECT_EQ(result.report->totals.differing, 1U);
}

TEST_P(Comparisons, ReadNothingWhereTheTypesDifferAlready) {
    question_.strict_type = true;
    const auto result = compare(row({1, 2}), array<double>({2}, {1, 3}));
    EXPECT_EQ(result.difference, Difference::type);
    EXPECT_TRUE(result.places.empty());
    EXPECT_FALSE(result.report.has_value());
    EXPECT_EQ(listener_.begun, 0);
}

TEST_P(Comparisons, KnowTheArrays) {
    question_.selection = talcmp::read_selection("1:");
    const auto result =
        compare(array({3, 2}, Bytes8(6), Order::fortran), array({4, 2}, std::vector<double>(8)));
    EXPECT_EQ(result.difference, Difference::shape);
    EXPECT_EQ(result.array1.name, "a");
    EXPECT_EQ(result.array1.type->id, element_type_id<std::int8_t>);
    EXPECT_EQ(result.array1.shape, (Shape{3, 2}));
    EXPECT_EQ(result.array1.selected_shape, (Shape{2, 2}));
    EXPECT_TRUE(result.array1.fortran_order);
    EXPECT_EQ(result.array2.name, "b");
    EXPECT_EQ(result.array2.type->id, element_type_id<double>);
    EXPECT_EQ(result.array2.shape, (Shape{4, 2}));
    EXPECT_EQ(result.array2.selected_shape, (Shape{3, 2}));
    EXPECT_FALSE(result.array2.fortran_order);
    EXPECT_EQ(listener_.begun, 0);
}

TEST_P(Comparisons, KnowWhetherThereIsAnyElement) {
    EXPECT_TRUE(compare(row({1}), row({1})).has_elements);
    EXPECT_FALSE(compare(array({2, 0}, Bytes8()), array({2, 0}, Bytes8())).has_elements);
}

TEST_P(Comparisons, NeedTheSelectedPart) {
    question_.selection = talcmp::read_selection("3");
    const auto message = [&](const std::size_t length1, const std::size_t length2) {
        return thrown_message([&] { compare(row(Bytes8(length1)), row(Bytes8(length2))); });
    };
    EXPECT_EQ(message(4, 3), "b: has no index 3 in axis 0, whose length is 3");
    EXPECT_EQ(message(3, 4), "a: has no index 3 in axis 0, whose length is 3");
}

// Also where elements can be read only once, and have to be copied to be read in another order.
TEST_P(Comparisons, AnnounceAllThatTheyRead) {
    constexpr std::uint64_t rows = 500;
    constexpr std::uint64_t columns = 800;
    constexpr std::uint64_t pairs = rows * columns;
    const Shape shape = {rows, columns};
    for (const Access access1 : {Access::random, Access::once}) {
        for (const Access access2 : {Access::random, Access::once}) {
            for (const Order order : orders) {
                Listener listener;
                const auto result = compare_arrays(
                    array(shape, Bytes8(pairs), order, access1),
                    array(shape, std::vector<std::int32_t>(pairs), Order::c, access2), question_,
                    listener);
                EXPECT_EQ(result.difference, Difference::none);
                const bool copied = order == Order::fortran;
                EXPECT_EQ(listener.begun, 1);
                EXPECT_EQ(listener.total,
                          pairs * 5 + (copied && access1 == Access::once ? pairs : 0)
                              + (copied && access2 == Access::once ? 4 * pairs : 0));
                EXPECT_EQ(listener.done, listener.total);
            }
        }
    }
}

TEST_P(Comparisons, ReadNoFurtherThanToThePlacesThatAreListed) {
    compare(row(Bytes8(length)), row(Bytes8(length, 1)));
    EXPECT_EQ(listener_.total, 2 * length);
    if (GetParam() == 1) {
        EXPECT_LT(listener_.done, length);
    }
    EXPECT_GT(listener_.done, 0U);
}

// ---- Memory

// Has to be read in blocks that no memory holds.
class HugeBlocks : public FunctionArray<std::int8_t> {
  public:
    HugeBlocks() : FunctionArray({block_size}, {}) {}
    const Shape& block() const override { return shape(); }

  private:
    static constexpr std::uint64_t block_size = std::uint64_t{1} << 46U;
};

TEST(Memory, ThatIsNotThereIsTrouble) {
    if (address_sanitizer || thread_sanitizer || sizeof(void*) < sizeof(std::uint64_t)) {
        GTEST_SKIP() << "sanitizers end the process, and 32-bit systems cannot name the size";
    }
    EXPECT_EQ(thrown_message([] {
                  compare_arrays(std::make_unique<HugeBlocks>(), std::make_unique<HugeBlocks>(),
                                 question_of(1));
              }),
              "a: there is not enough memory to compare it with b: 140737488355328 bytes for "
              "pieces of both, up to "
                  + std::to_string(sizeof(talcmp::FoundPair))
                  + " for differences; fewer --threads and --max-differences take less");
}

// ---- Threads

// A meeting of threads that read at once.
class Meeting {
  public:
    explicit Meeting(const unsigned expected) : expected_(expected) {}

    // Waits until all that are expected are there, or gives up.
    void attend() {
        std::unique_lock<std::mutex> lock(mutex_);
        most_ = std::max(most_, ++present_);
        changed_.notify_all();
        changed_.wait_for(lock, 10s, [this] { return most_ >= expected_; });
        --present_;
    }

    unsigned most() const { return most_; }

  private:
    unsigned expected_;
    unsigned present_ = 0;
    unsigned most_ = 0;
    std::mutex mutex_;
    std::condition_variable changed_;
};

TEST(Threads, AreAsManyAsAreAskedForAndOfUse) {
    const unsigned usual = std::clamp(std::thread::hardware_concurrency(), 1U, 4U);
    const std::pair<unsigned, unsigned> threads[] = {{1, 1}, {2, 2}, {3, 3}, {8, 4}, {0, usual}};
    for (const auto& [asked, expected] : threads) {
        Meeting meeting(expected);
        const auto read = [&meeting](const std::uint64_t /*first*/, const std::uint64_t count,
                                     std::int8_t* elements) {
            meeting.attend();
            std::fill_n(elements, count, std::int8_t{0});
        };
        const auto result = compare_arrays(bytes(read), zeros_and_one(length), question_of(asked));
        EXPECT_EQ(result.difference, Difference::none);
        EXPECT_EQ(meeting.most(), expected) << asked;
    }
}

INSTANTIATE_TEST_SUITE_P(Threads, Comparisons, testing::Values(1U, 2U, 8U));

} // namespace
