// The digits that talcmp finds pairs to differ in, against the answers of the module on each.

#include "digits.h"

#include "support/element_types.h"
#include "support/hard_pairs.h"
#include "support/random_arrays.h"
#include "taldata_array_element_types.h"

#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <cstddef>
#include <vector>

namespace {

using talcmp::DigitSearch;
using talcmp::Sameness;

using Draw = void (*)(oracle::Random&, double share, void*, void*);

template <typename T1, typename... T2>
constexpr std::array<Draw, sizeof...(T2)> draws_with(type_list<T2...> /*types*/) {
    return {draw_elements<T1, T2>...};
}

template <typename... T1>
constexpr auto all_draws(const type_list<T1...> types) {
    return std::array{draws_with<T1>(types)...};
}

Draw draw_of(const ElementType& type1, const ElementType& type2) {
    static constexpr auto draws = all_draws(element_type_list{});
    return draws.at(static_cast<std::size_t>(type1.id - 1))
        .at(static_cast<std::size_t>(type2.id - 1));
}

// Of which the limits of all whole tolerances are as likely.
class DrawnPairs {
  public:
    DrawnPairs(const ElementType& type1, const ElementType& type2, const std::size_t count)
        : type1_(type1), type2_(type2), count_(count), elements1_(count * type1.size),
          elements2_(count * type2.size) {}

    void draw(oracle::Random& random) {
        for (std::size_t i = 0; i < count_; ++i) {
            const double share = std::ldexp(1, random.between(-54, 0));
            draw_of(type1_, type2_)(random, share, &elements1_[i * type1_.size],
                                    &elements2_[i * type2_.size]);
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

// From one whole tolerance to the next no pair that is the same stops being so.
bool is_sameness_of(const talcmp::Pairs& pairs, const std::size_t i, const Sameness sameness) {
    const int from_one = sameness.from_one();
    return pairs.same(0, i) == sameness.at_zero() && (from_one == 1 || !pairs.same(from_one - 1, i))
           && (from_one == talcmp::more_than_all_digits || pairs.same(from_one, i));
}

void expect_samenesses(const DigitSearch::Result& result, const talcmp::Pairs& pairs) {
    std::array<std::uint64_t, DigitSearch::class_count> count = {};
    for (std::size_t i = 0; i < pairs.count(); ++i) {
        ++count.at(result.class_of[i]);
        const Sameness found = result.sameness(i);
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
