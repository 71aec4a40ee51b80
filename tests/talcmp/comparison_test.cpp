// Comparisons of arrays in memory: what comes of them, by how many threads they ever are made, and
// what no file is made to do.

#include "comparison.h"

#include "support/memory_array.h"
#include "trouble.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <memory>
#include <mutex>
#include <ostream>
#include <string>
#include <thread>
#include <utility>
#include <vector>

namespace {

using namespace std::chrono_literals;

constexpr std::uint64_t length = 1000000;

class Bytes : public talcmp::ArraySource {
  public:
    const talcmp::ElementType& type() const override { return talcmp::element_type(BIT8_TYPE); }
    const talcmp::Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return false; }
    bool random_access() const override { return true; }

  private:
    talcmp::Shape shape_ = {length};
};

// Not for ever, as there may be no other thread.
template <typename Event>
void wait_for(const Event& has_come) {
    for (int patience = 200; !has_come() && patience > 0; --patience) {
        std::this_thread::sleep_for(1ms);
    }
}

// Zeros, of which those from `broken` on cannot be read. The first are handed out only after the
// others have failed, if anybody asks for those meanwhile.
class BrokenArray : public Bytes {
  public:
    BrokenArray(const std::uint64_t broken, std::atomic<int>& failures)
        : broken_(broken), failures_(failures) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        wait_for([&] { return first != 0 || failures_ != 0; });
        if (first + count > broken_) {
            failures_ += 1;
            throw talcmp::Trouble("broken.npy",
                                  "cannot be read from " + std::to_string(first) + " on");
        }
        std::fill_n(static_cast<std::int8_t*>(elements), count, std::int8_t{0});
    }

  private:
    std::uint64_t broken_;
    std::atomic<int>& failures_;
};

// Cannot be read, and of what several threads read at once the first elements fail first.
class BrokenInOrder : public Bytes {
  public:
    void read(const std::uint64_t first, std::uint64_t /*count*/, void* /*elements*/) override {
        if (first == 0) {
            wait_for([this] { return others_begun_.load(); });
            first_failed_ = true;
        } else {
            others_begun_ = true;
            wait_for([this] { return first_failed_.load(); });
            std::this_thread::sleep_for(20ms); // until that is known
        }
        throw talcmp::Trouble("broken.npy", "cannot be read from " + std::to_string(first) + " on");
    }

  private:
    std::atomic<bool> others_begun_ = false;
    std::atomic<bool> first_failed_ = false;
};

// Can be read only once, by columns, and fails.
class BrokenPipe : public talcmp::ArraySource {
  public:
    explicit BrokenPipe(std::string name) : name_(std::move(name)) {}

    const talcmp::ElementType& type() const override { return talcmp::element_type(BIT8_TYPE); }
    const talcmp::Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return true; }
    bool random_access() const override { return false; }
    void read(std::uint64_t /*first*/, std::uint64_t /*count*/, void* /*elements*/) override {
        throw talcmp::Trouble(name_, "cannot be read");
    }

  private:
    talcmp::Shape shape_ = {3, 4};
    std::string name_;
};

// A one at the position `one`, zeros elsewhere.
class ZerosAndOne : public Bytes {
  public:
    explicit ZerosAndOne(const std::uint64_t one) : one_(one) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        auto* const values = static_cast<std::int8_t*>(elements);
        std::fill_n(values, count, std::int8_t{0});
        if (first <= one_ && one_ < first + count) {
            values[one_ - first] = 1;
        }
    }

  private:
    std::uint64_t one_;
};

class NoListener : public talcmp::ProgressListener {
  public:
    void begin(std::uint64_t /*total_bytes*/) override {}
    void advance(std::uint64_t /*bytes*/) override {}
};

talcmp::Question question_of(const unsigned threads) {
    talcmp::Question question;
    question.threads = threads;
    return question;
}

class BrokenFiles : public testing::TestWithParam<unsigned> {
  protected:
    static talcmp::Comparison compare(const std::uint64_t broken, const std::uint64_t one,
                                      const bool report = false) {
        talcmp::Question question = question_of(GetParam());
        question.report = report;
        std::atomic<int> failures = 0;
        NoListener listener;
        return talcmp::compare({"broken.npy", std::make_unique<BrokenArray>(broken, failures)},
                               {"other.npy", std::make_unique<ZerosAndOne>(one)}, question,
                               listener);
    }

    template <typename Action>
    static std::string trouble_of(const Action& action) {
        try {
            action();
        } catch (const talcmp::Trouble& trouble) {
            return trouble.what();
        }
        return "none";
    }
};

TEST_P(BrokenFiles, DifferWhereTheyAreReadBeforeTheyFail) {
    const talcmp::Comparison result = compare(length / 2, 5);
    EXPECT_EQ(result.difference, talcmp::Difference::elements);
    ASSERT_EQ(result.places.size(), 1U);
    EXPECT_EQ(result.places[0].index, talcmp::Shape{5});
}

TEST_P(BrokenFiles, AreTroubleWhereTheyFailBeforeTheyDiffer) {
    const std::string first = trouble_of([] { compare(length / 2, length - 1); });
    EXPECT_NE(first.find("broken.npy: cannot be read from "), std::string::npos) << first;
    // A report needs all of the arrays.
    EXPECT_EQ(trouble_of([] { compare(length / 2, 5, true); }), first);
}

TEST_P(BrokenFiles, AreTroubleAtTheFirstPlaceThatFails) {
    EXPECT_EQ(trouble_of([] { compare(1, length - 1); }), "broken.npy: cannot be read from 0 on");
}

TEST_P(BrokenFiles, AreTroubleAtTheFirstPlaceWhateverFailsLater) {
    EXPECT_EQ(trouble_of([] {
                  NoListener listener;
                  talcmp::compare({"broken.npy", std::make_unique<BrokenInOrder>()},
                                  {"other.npy", std::make_unique<ZerosAndOne>(length)},
                                  question_of(GetParam()), listener);
              }),
              "broken.npy: cannot be read from 0 on");
}

TEST(BrokenFile, IsReadNoFurtherThanToWhereItFails) {
    std::atomic<int> failures = 0;
    NoListener listener;
    EXPECT_THROW(talcmp::compare({"broken.npy", std::make_unique<BrokenArray>(0, failures)},
                                 {"other.npy", std::make_unique<ZerosAndOne>(length)},
                                 question_of(1), listener),
                 talcmp::Trouble);
    EXPECT_EQ(failures, 1);
}

// However they are read, also where they have to be copied first.
TEST_P(BrokenFiles, AreTroubleOfTheFirstOfTwo) {
    for (const char* const slice : {":", ":,::2"}) {
        talcmp::Question question = question_of(GetParam());
        question.selection = talcmp::read_selection(slice);
        NoListener listener;
        EXPECT_EQ(trouble_of([&] {
                      talcmp::compare({"a", std::make_unique<BrokenPipe>("a")},
                                      {"b", std::make_unique<BrokenPipe>("b")}, question, listener);
                  }),
                  "a: cannot be read");
    }
}

TEST_P(BrokenFiles, AreTroubleAsTheSecondOperand) {
    std::atomic<int> failures = 0;
    NoListener listener;
    EXPECT_EQ(trouble_of([&] {
                  talcmp::compare({"whole.npy", std::make_unique<ZerosAndOne>(length)},
                                  {"broken.npy", std::make_unique<BrokenArray>(0, failures)},
                                  question_of(GetParam()), listener);
              }),
              "broken.npy: cannot be read from 0 on");
}

INSTANTIATE_TEST_SUITE_P(Threads, BrokenFiles, testing::Values(1U, 2U, 8U));

// ---- Arrays that can be read

using Bytes8 = std::vector<std::int8_t>;
using talcmp::Difference;
using talcmp::Shape;

// Adds up what it is called with.
class Listener : public talcmp::ProgressListener {
  public:
    void begin(const std::uint64_t total_bytes) override {
        begun_ += 1;
        total_ += total_bytes;
    }
    void advance(const std::uint64_t bytes) override { done_ += bytes; }

    int begun() const { return begun_; }
    std::uint64_t total() const { return total_; }
    std::uint64_t done() const { return done_; }

  private:
    int begun_ = 0;
    std::uint64_t total_ = 0;
    std::atomic<std::uint64_t> done_ = 0;
};

using Source = std::unique_ptr<talcmp::ArraySource>;

template <typename T>
Source array(Shape shape, std::vector<T> elements, const Order order = Order::c,
             const Access access = Access::random) {
    return std::make_unique<MemoryArray<T>>(std::move(shape), std::move(elements), order, access);
}

// What is listed of a place of bytes.
struct Listed {
    Shape index;
    int first;
    int second;

    bool operator==(const Listed& other) const {
        return index == other.index && first == other.first && second == other.second;
    }
};

std::ostream& operator<<(std::ostream& out, const Listed& listed) {
    return out << testing::PrintToString(listed.index) << ": " << listed.first << " and "
               << listed.second;
}

std::vector<Listed> listed(const std::vector<talcmp::Place>& places) {
    std::vector<Listed> all;
    all.reserve(places.size());
    for (const talcmp::Place& place : places) {
        all.push_back({place.index, static_cast<std::int8_t>(place.element1[0]),
                       static_cast<std::int8_t>(place.element2[0])});
    }
    return all;
}

class Comparisons : public testing::TestWithParam<unsigned> {
  protected:
    talcmp::Question question_ = question_of(GetParam());
    Listener listener_;

    talcmp::Comparison compare(Source first, Source second) {
        return talcmp::compare({"a", std::move(first)}, {"b", std::move(second)}, question_,
                               listener_);
    }
};

TEST_P(Comparisons, TellTheFirstPlacesOfMany) {
    Bytes8 ones(length);
    const std::vector<std::uint64_t> positions = {5, 9, 300000, 300001, 600000, 999990, 999999};
    std::vector<Listed> expected;
    for (const std::uint64_t position : positions) {
        ones[static_cast<std::size_t>(position)] = 1;
        expected.push_back({{position}, 0, 1});
    }
    while (!expected.empty()) {
        SCOPED_TRACE(expected.size());
        question_.differences = expected.size();
        const auto result = compare(array<std::int8_t>({length}, Bytes8(length)),
                                    array<std::int8_t>({length}, ones));
        EXPECT_EQ(result.difference, Difference::elements);
        EXPECT_EQ(listed(result.places), expected);
        expected.pop_back();
    }
}

using Indices = std::vector<std::pair<std::uint64_t, std::uint64_t>>;

// Arrays of `rows` rows that differ at the indices, which are in row-major order.
void expect_first_places(const talcmp::Question& question, const std::uint64_t rows,
                         const std::uint64_t columns, const Indices& indices, const Order order1,
                         const Order order2) {
    Bytes8 first(static_cast<std::size_t>(rows * columns));
    Bytes8 second(first.size());
    std::vector<Listed> expected;
    for (const auto& [row, column] : indices) {
        const std::uint64_t by_rows = row * columns + column;
        const std::uint64_t by_columns = column * rows + row;
        const std::uint64_t position = order1 == Order::c ? by_rows : by_columns;
        const auto value = static_cast<std::int8_t>(expected.size() + 1);
        const std::uint64_t position2 = order2 == Order::c ? by_rows : by_columns;
        first[static_cast<std::size_t>(position)] = value;
        second[static_cast<std::size_t>(position2)] = static_cast<std::int8_t>(-value);
        expected.push_back({{row, column}, value, -value});
    }
    Listener listener;
    const auto result = talcmp::compare({"a", array<std::int8_t>({rows, columns}, first, order1)},
                                        {"b", array<std::int8_t>({rows, columns}, second, order2)},
                                        question, listener);
    expected.resize(std::min(expected.size(), question.differences));
    EXPECT_EQ(listed(result.places), expected);
}

constexpr Order orders[] = {Order::c, Order::fortran};

// Where boxes are cut off at the edges.
TEST_P(Comparisons, ListPlacesInRowMajorOrderHoweverArraysAreStored) {
    const Indices indices = {{2, 1499},    {3, 3},    {1447, 1448}, {1448, 2},
                             {1448, 1447}, {1499, 0}, {1499, 1499}};
    question_.differences = 100;
    for (const Order order1 : orders) {
        for (const Order order2 : orders) {
            expect_first_places(question_, 1500, 1500, indices, order1, order2);
        }
    }
}

// Also where a place is met before one that comes earlier.
TEST_P(Comparisons, TellTheFirstOfPlacesThatAreMetInAnotherOrder) {
    const Indices indices = {{0, 40}, {0, 49}, {1, 1}, {2, 0}, {3, 30}, {39, 0}, {39, 2}};
    for (question_.differences = 1; question_.differences <= 8; ++question_.differences) {
        for (const Order order1 : orders) {
            for (const Order order2 : orders) {
                expect_first_places(question_, 40, 50, indices, order1, order2);
            }
        }
    }
}

TEST_P(Comparisons, CountAllPairsOfArraysOfTwoTypesInAStrictReport) {
    question_.strict_type = true;
    question_.report = true;
    const auto result =
        compare(array<std::int8_t>({3}, {1, 2, 3}), array<double>({3}, {1, 2, 3.5}));
    EXPECT_EQ(result.difference, Difference::type);
    EXPECT_EQ(listed(result.places).size(), 1U);
    ASSERT_TRUE(result.report.has_value());
    EXPECT_EQ(result.report->totals.pairs, 3U);
    EXPECT_EQ(result.report->totals.differing, 1U);
}

TEST_P(Comparisons, ReadNothingWhereTheTypesDifferAlready) {
    question_.strict_type = true;
    const auto result = compare(array<std::int8_t>({2}, {1, 2}), array<double>({2}, {1, 3}));
    EXPECT_EQ(result.difference, Difference::type);
    EXPECT_TRUE(result.places.empty());
    EXPECT_FALSE(result.report.has_value());
    EXPECT_EQ(listener_.begun(), 0);
}

TEST_P(Comparisons, KnowTheArrays) {
    question_.selection = talcmp::read_selection("1:");
    const auto result = compare(array<std::int8_t>({3, 2}, Bytes8(6), Order::fortran),
                                array<double>({4, 2}, std::vector<double>(8)));
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
    EXPECT_EQ(listener_.begun(), 0);
}

TEST_P(Comparisons, KnowWhetherThereIsAnyElement) {
    EXPECT_TRUE(compare(array<std::int8_t>({1}, {1}), array<std::int8_t>({1}, {1})).has_elements);
    EXPECT_FALSE(
        compare(array<std::int8_t>({2, 0}, {}), array<std::int8_t>({2, 0}, {})).has_elements);
}

TEST_P(Comparisons, NeedTheSelectedPart) {
    question_.selection = talcmp::read_selection("3");
    try {
        compare(array<std::int8_t>({4}, Bytes8(4)), array<std::int8_t>({3}, Bytes8(3)));
        FAIL() << "no trouble";
    } catch (const talcmp::Trouble& trouble) {
        EXPECT_STREQ(trouble.what(), "b: has no index 3 in axis 0, whose length is 3");
    }
}

// Also where elements can be read only once, and have to be copied to be read in another order.
TEST_P(Comparisons, TellWhatTheyRead) {
    constexpr std::uint64_t rows = 500;
    constexpr std::uint64_t columns = 800;
    constexpr std::uint64_t pairs = rows * columns;
    const Shape shape = {rows, columns};
    for (const Access access1 : {Access::random, Access::once}) {
        for (const Access access2 : {Access::random, Access::once}) {
            for (const Order order : {Order::c, Order::fortran}) {
                Listener listener;
                const auto result = talcmp::compare(
                    {"a", array<std::int8_t>(shape, Bytes8(pairs), order, access1)},
                    {"b", array<std::int32_t>(shape, std::vector<std::int32_t>(pairs), Order::c,
                                              access2)},
                    question_, listener);
                EXPECT_EQ(result.difference, Difference::none);
                const bool copied = order == Order::fortran;
                EXPECT_EQ(listener.begun(), 1);
                EXPECT_EQ(listener.total(),
                          pairs * 5 + (copied && access1 == Access::once ? pairs : 0)
                              + (copied && access2 == Access::once ? 4 * pairs : 0));
                EXPECT_EQ(listener.done(), listener.total());
            }
        }
    }
}

TEST_P(Comparisons, ReadNoFurtherThanToThePlacesThatAreTold) {
    Bytes8 ones(length, 1);
    compare(array<std::int8_t>({length}, Bytes8(length)), array<std::int8_t>({length}, ones));
    EXPECT_EQ(listener_.total(), 2 * length);
    if (GetParam() == 1) {
        EXPECT_LT(listener_.done(), length);
    }
    EXPECT_GT(listener_.done(), 0U);
}

// ---- Threads

// Of threads that read at once.
class Meeting {
  public:
    explicit Meeting(const unsigned expected) : expected_(expected) {}

    // Waits until as many are there as are expected, or in vain.
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

class MeetingPlace : public ZerosAndOne {
  public:
    explicit MeetingPlace(Meeting& meeting) : ZerosAndOne(length), meeting_(meeting) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        meeting_.attend();
        ZerosAndOne::read(first, count, elements);
    }

  private:
    Meeting& meeting_;
};

TEST(Threads, AreAsManyAsAreAskedForAndOfUse) {
    const unsigned usual = std::clamp(std::thread::hardware_concurrency(), 1U, 4U);
    const std::pair<unsigned, unsigned> threads[] = {{1, 1}, {2, 2}, {3, 3}, {8, 4}, {0, usual}};
    for (const auto& [asked, expected] : threads) {
        Meeting meeting(expected);
        NoListener listener;
        const auto result = talcmp::compare({"a", std::make_unique<MeetingPlace>(meeting)},
                                            {"b", std::make_unique<ZerosAndOne>(length)},
                                            question_of(asked), listener);
        EXPECT_EQ(result.difference, Difference::none);
        EXPECT_EQ(meeting.most(), expected) << asked;
    }
}

INSTANTIATE_TEST_SUITE_P(Threads, Comparisons, testing::Values(1U, 2U, 8U));

} // namespace
