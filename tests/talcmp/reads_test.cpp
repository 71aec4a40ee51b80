// How often, and how far, arrays are read until the answer is known.

#include "npy_array.h"

#include "support/compare_arrays.h"
#include "support/memory_array.h"
#include "support/memory_bytes.h"
#include "support/named_cases.h"
#include "support/npy_bytes.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <atomic>
#include <complex>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace {

constexpr std::uint64_t nowhere = std::numeric_limits<std::uint64_t>::max();

struct Reads {
    std::atomic<std::uint64_t> count = 0;
    std::atomic<std::uint64_t> elements = 0;
};

// Complex zeros, except a one at the position `one`; those from `broken` on cannot be read.
Source counted_array(talcmp::Shape shape, const Order order, Reads& reads,
                     const std::uint64_t one = nowhere, const std::uint64_t broken = nowhere) {
    using Complex = std::complex<double>;
    const auto read = [&reads, one, broken](const std::uint64_t first, const std::uint64_t count,
                                            Complex* elements) {
        if (first + count > broken) {
            throw talcmp::Trouble("array", "is broken");
        }
        read_zeros_and_one(one, first, count, elements);
        ++reads.count;
        reads.elements += count;
    };
    return std::make_unique<FunctionArray<Complex>>(std::move(shape), read, order);
}

// ---- In two orders

struct Axes {
    const char* name;
    talcmp::Shape shape;
};

// Several hundred thousand elements each: more than are compared at once.
const Axes axes[] = {
    {"TwosOnly", talcmp::Shape(19, 2)},
    {"FivesOnly", talcmp::Shape(8, 5)},
    {"TwoLong", {700, 650}},
    {"LongBetweenShort", {3, 50000, 3}},
    {"ShortBetweenLong", {400, 3, 400}},
    {"LongFirst", {200000, 2}},
    {"LongLast", {2, 200000}},
};

class TwoOrders : public NamedCaseTest<Axes> {};

TEST_P(TwoOrders, AreBothReadInLongRuns) {
    constexpr std::uint64_t shortest_mean = 128; // elements, of 16 bytes
    Reads reads[2];
    Source first = counted_array(GetParam().shape, Order::c, reads[0]);
    const std::uint64_t count = talcmp::element_count(*first);
    const talcmp::Comparison result =
        compare_arrays(std::move(first), counted_array(GetParam().shape, Order::fortran, reads[1]),
                       question_of(1));
    EXPECT_EQ(result.difference, talcmp::Difference::none);
    for (const Reads& each : reads) {
        EXPECT_EQ(each.elements, count);
        EXPECT_GE(each.elements / each.count, shortest_mean);
    }
}

INSTANTIATE_TEST_SUITE_P(Axes, TwoOrders, named_cases(axes), name_of_case);

// ---- Where the only question is whether there is a difference

class OnlyWhether : public testing::TestWithParam<unsigned> {
  protected:
    static constexpr std::uint64_t length = 1000;
    static constexpr std::uint64_t size = length * length;

    // Compares two arrays in Fortran order.
    static talcmp::Difference difference(const std::uint64_t one, const std::uint64_t broken,
                                         Reads& reads, const bool only_whether = true) {
        talcmp::Question question = question_of(GetParam());
        question.only_whether = only_whether;
        Reads ignored;
        const talcmp::Shape shape = {length, length};
        return compare_arrays(counted_array(shape, Order::fortran, reads, one, broken),
                              counted_array(shape, Order::fortran, ignored), question)
            .difference;
    }
};

TEST_P(OnlyWhether, StopsAtTheFirstDifferenceThatIsMet) {
    Reads all;
    EXPECT_EQ(difference(5, nowhere, all, false), talcmp::Difference::elements);
    EXPECT_EQ(all.elements, size); // another one might come first in row-major order
    Reads few;
    EXPECT_EQ(difference(5, nowhere, few), talcmp::Difference::elements);
    if (GetParam() == 1) {
        EXPECT_EQ(few.count, 1U);
    }
}

TEST_P(OnlyWhether, SeesTheLastDifferenceToo) {
    Reads reads;
    EXPECT_EQ(difference(size - 1, nowhere, reads), talcmp::Difference::elements);
    EXPECT_EQ(reads.elements, size);
}

TEST_P(OnlyWhether, DoesNotReachWhatIsBrokenAfterADifference) {
    Reads reads;
    EXPECT_EQ(difference(5, size / 2, reads), talcmp::Difference::elements);
    EXPECT_THROW(difference(size - 1, size / 2, reads), talcmp::Trouble);
}

INSTANTIATE_TEST_SUITE_P(Threads, OnlyWhether, testing::Values(1U, 2U, 8U),
                         testing::PrintToStringParamName());

// ---- To the end of a file

// The bytes of a file, which counts how many of them are asked for.
class CountedBytes : public MemoryBytes {
  public:
    CountedBytes(const std::string_view bytes, std::uint64_t& asked)
        : MemoryBytes(bytes), asked_(asked) {}

    std::size_t read(const std::uint64_t offset, void* const bytes,
                     const std::size_t count) override {
        asked_ += count;
        return MemoryBytes::read(offset, bytes, count);
    }

  private:
    std::uint64_t& asked_;
};

std::string trouble_at_the_end(const std::string& bytes, const std::uint64_t read_before) {
    std::vector<double> elements(static_cast<std::size_t>(read_before));
    talcmp::NpyArray array("array", std::make_unique<MemoryStream>(bytes));
    array.read(0, read_before, elements.data());
    return thrown_message([&array] { array.check_to_end(); });
}

TEST(End, IsNotReadOfAFileWhoseSizeIsKnown) {
    const std::string bytes = npy::row<double>(std::vector<double>(100000, 1.0));
    std::uint64_t asked = 0;
    talcmp::NpyArray array("array", std::make_unique<CountedBytes>(bytes, asked));
    const std::uint64_t asked_for_header = asked;
    array.check_to_end();
    EXPECT_EQ(asked, asked_for_header);
    EXPECT_LT(asked, 1000U);
}

TEST(End, IsReadOfAStreamFromWhereverReadingStopped) {
    const std::string bytes = npy::row<double>(std::vector<double>(100000, 1.0));
    for (const std::uint64_t read_before : {0U, 1U, 8192U, 99999U, 100000U}) {
        SCOPED_TRACE(read_before);
        EXPECT_EQ(trouble_at_the_end(bytes, read_before), "none");
        EXPECT_EQ(trouble_at_the_end(bytes + "x", read_before),
                  "array: has more data than its shape says; save one array per file");
    }
    EXPECT_EQ(trouble_at_the_end(bytes.substr(0, bytes.size() - 1), 5),
              "array: ends after 99999 of 100000 elements; is it complete, or is it still being "
              "written?");
    EXPECT_EQ(trouble_at_the_end(npy::row<double>({}), 0), "none");
}

} // namespace
