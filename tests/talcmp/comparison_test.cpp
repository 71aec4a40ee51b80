// Comparisons of arrays that fail to be read, or are read in an order, such as no file is made to.

#include "comparison.h"

#include "trouble.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <memory>
#include <string>
#include <thread>
#include <utility>

namespace {

using namespace std::chrono_literals;

constexpr std::uint64_t length = 1000000;

class Bytes : public talcmp::ArraySource {
  public:
    type_t element_type() const override { return 1; }
    const talcmp::Shape& shape() const override { return shape_; }
    bool fortran_order() const override { return false; }
    bool random_access() const override { return true; }

  private:
    talcmp::Shape shape_ = {length};
};

// Zeros, of which those from `broken` on cannot be read. The first are handed out only after the
// others have failed, if anybody asks for those meanwhile.
class BrokenArray : public Bytes {
  public:
    explicit BrokenArray(const std::uint64_t broken) : broken_(broken) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        for (int patience = 200; first == 0 && failures_ == 0 && patience > 0; --patience) {
            std::this_thread::sleep_for(1ms);
        }
        if (first + count > broken_) {
            failures_ += 1;
            throw talcmp::Trouble("broken.npy",
                                  "cannot be read from " + std::to_string(first) + " on");
        }
        std::fill_n(static_cast<std::int8_t*>(elements), count, std::int8_t{0});
    }

  private:
    std::uint64_t broken_;
    std::atomic<int> failures_ = 0;
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

class BrokenFiles : public testing::TestWithParam<unsigned> {
  protected:
    static talcmp::Comparison compare(const std::uint64_t broken, const std::uint64_t one,
                                      const bool report = false) {
        talcmp::Question question;
        question.threads = GetParam();
        question.report = report;
        NoListener listener;
        return talcmp::compare({"broken.npy", std::make_unique<BrokenArray>(broken)},
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
    EXPECT_EQ(result.places[0].position, 5U);
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

INSTANTIATE_TEST_SUITE_P(Threads, BrokenFiles, testing::Values(1U, 2U, 8U));

} // namespace
