// The digits in which talcmp finds that pairs differ, against the module's answers about each pair.

#include "digits.h"

#include "support/element_types.h"
#include "support/random_arrays.h"

#include <gtest/gtest.h>

#include <array>
#include <cstddef>
#include <vector>

namespace {

using talcmp::DigitSearch;
using talcmp::Sameness;

// Pairs near the limits of random whole tolerances.
class DrawnPairs {
  public:
    DrawnPairs(const ElementType& type1, const ElementType& type2, const std::size_t count)
        : type1_(type1), type2_(type2), count_(count), elements1_(count * type1.size),
          elements2_(count * type2.size) {}

    void draw(oracle::Random& random) {
        for (std::size_t i = 0; i < count_; ++i) {
            const int digits = random.one_in(2) ? 24 : 53;
            oracle::draw_elements(random, random.between(0, digits), type1_.id, type2_.id, true,
                                  &elements1_[i * type1_.size], &elements2_[i * type2_.size]);
        }
    }

    talcmp::Pairs pairs() const {
        return {talcmp::element_type(type1_.id), elements1_.data(), talcmp::element_type(type2_.id),
                elements2_.data(), count_};
    }

  private:
    const ElementType& type1_;
    const ElementType& type2_;
    std::size_t count_;
    std::vector<unsigned char> elements1_;
    std::vector<unsigned char> elements2_;
};

// A pair that is the same under one whole tolerance stays so under the next.
bool is_sameness_of(const talcmp::Pairs& pairs, const std::size_t i, const Sameness sameness) {
    const int from_one = sameness.from_one();
    return pairs.same(0, i) == sameness.at_zero() && (from_one == 1 || !pairs.same(from_one - 1, i))
           && (from_one == talcmp::more_than_all_digits || pairs.same(from_one, i));
}

void expect_samenesses(const DigitSearch::Result& result, const talcmp::Pairs& pairs) {
    std::array<std::uint64_t, DigitSearch::class_count> count = {};
    for (std::size_t i = 0; i < pairs.count(); ++i) {
        ++count.at(result.class_of[i]);
        const Sameness found = talcmp::sameness_of(result, i);
        ASSERT_TRUE(is_sameness_of(pairs, i, found))
            << "pair " << i << ": " << pairs.type1().text(pairs.element1(i), false) << " and "
            << pairs.type2().text(pairs.element2(i), false) << " not from " << found.from_one()
            << " on; or bit by bit not " << found.at_zero();
        ASSERT_TRUE(is_sameness_of(pairs, i, talcmp::sameness_of(pairs, i))) << "pair " << i;
    }
    EXPECT_EQ(result.count, count);
}

TEST(DigitSearch, FindsTheSmallestToleranceOfEachPair) {
    constexpr std::size_t count = 1000;
    constexpr int rounds = 10;
    oracle::Random random(1);
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        DrawnPairs drawn(type1, type2, count);
        DigitSearch search;
        for (int round = 0; round < rounds && !testing::Test::HasFatalFailure(); ++round) {
            drawn.draw(random);
            expect_samenesses(search.search(drawn.pairs()), drawn.pairs());
        }
    });
}

} // namespace
