// How often, and how far, arrays are read until the answer is known.

#include "byte_stream.h"
#include "comparison.h"
#include "npy_array.h"
#include "trouble.h"

#include "support/memory_bytes.h"
#include "support/npy_bytes.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstdint>
#include <limits>
#include <memory>
#include <optional>
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
class CountedArray : public talcmp::ArraySource {
  public:
    CountedArray(talcmp::Shape shape, const bool fortran_order, Reads& reads,
                 const std::uint64_t one = nowhere, const std::uint64_t broken = nowhere)
        : shape_(std::move(shape)), fortran_order_(fortran_order), reads_(reads), one_(one),
          broken_(broken) {}

    const talcmp::ElementType& type() const override {
        return talcmp::element_type(COMPLEX_REAL64_TYPE);
    }
    const talcmp::Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return fortran_order_; }
    bool random_access() const override { return true; }

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        if (first + count > broken_) {
            throw talcmp::Trouble("array", "is broken");
        }
        auto* const values = static_cast<std::complex<double>*>(elements);
        std::fill_n(values, count, 0.0);
        if (first <= one_ && one_ < first + count) {
            values[one_ - first] = 1;
        }
        ++reads_.count;
        reads_.elements += count;
    }

  private:
    talcmp::Shape shape_;
    bool fortran_order_;
    Reads& reads_;
    std::uint64_t one_;
    std::uint64_t broken_;
};

class NoListener : public talcmp::ProgressListener {
  public:
    void begin(std::uint64_t /*total_bytes*/) override {}
    void advance(std::uint64_t /*bytes*/) override {}
};

talcmp::Comparison compare(std::unique_ptr<talcmp::ArraySource> first,
                           std::unique_ptr<talcmp::ArraySource> second,
                           const talcmp::Question& question) {
    NoListener listener;
    return talcmp::compare({"first", std::move(first)}, {"second", std::move(second)}, question,
                           listener);
}

// ---- In two orders

struct Axes {
    const char* name;
    talcmp::Shape shape;
};

void PrintTo(const Axes& axes, std::ostream* out) {
    *out << axes.name;
}

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

class TwoOrders : public testing::TestWithParam<Axes> {};

TEST_P(TwoOrders, AreBothReadInLongRuns) {
    constexpr std::uint64_t shortest_mean = 128; // elements, of 16 bytes
    Reads reads1;
    Reads reads2;
    talcmp::Question question;
    question.threads = 1;
    const talcmp::Comparison result =
        compare(std::make_unique<CountedArray>(GetParam().shape, false, reads1),
                std::make_unique<CountedArray>(GetParam().shape, true, reads2), question);
    EXPECT_EQ(result.difference, talcmp::Difference::none);
    for (const Reads* reads : {&reads1, &reads2}) {
        EXPECT_EQ(reads->elements,
                  talcmp::element_count(CountedArray(GetParam().shape, false, reads1)));
        EXPECT_GE(reads->elements / reads->count, shortest_mean);
    }
}

std::string name_of_axes(const testing::TestParamInfo<Axes>& axes_of_test) {
    return axes_of_test.param.name;
}

INSTANTIATE_TEST_SUITE_P(Axes, TwoOrders, testing::ValuesIn(axes), name_of_axes);

// ---- Where only is asked whether there is a difference

class OnlyWhether : public testing::TestWithParam<unsigned> {
  protected:
    static constexpr std::uint64_t length = 1000;
    static constexpr std::uint64_t size = length * length;

    // In Fortran order both.
    static talcmp::Difference difference(const std::uint64_t one, const std::uint64_t broken,
                                         Reads& reads, const bool only_whether = true) {
        talcmp::Question question;
        question.threads = GetParam();
        question.only_whether = only_whether;
        Reads ignored;
        const talcmp::Shape shape = {length, length};
        return compare(std::make_unique<CountedArray>(shape, true, reads, one, broken),
                       std::make_unique<CountedArray>(shape, true, ignored), question)
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

TEST_P(OnlyWhether, DoesNotReachWhatIsBrokenBehindADifference) {
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

// The same bytes, which come but once.
class Stream : public talcmp::ByteStream {
  public:
    explicit Stream(std::string bytes) : bytes_(std::move(bytes)) {}

    std::optional<std::uint64_t> size() const override { return std::nullopt; }

  private:
    std::size_t read_next(void* const bytes, const std::size_t count) override {
        const std::size_t there = bytes_.copy(static_cast<char*>(bytes), count, position_);
        position_ += there;
        return there;
    }

    std::string bytes_;
    std::size_t position_ = 0;
};

std::string trouble_at_the_end(const std::string& bytes, const std::uint64_t read_before) {
    std::vector<double> elements(static_cast<std::size_t>(read_before));
    talcmp::NpyArray array("array", std::make_unique<Stream>(bytes));
    array.read(0, read_before, elements.data());
    try {
        array.check_to_end();
    } catch (const talcmp::Trouble& trouble) {
        return trouble.what();
    }
    return "none";
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
