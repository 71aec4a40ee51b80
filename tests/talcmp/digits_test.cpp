// How talcmp finds the digits that many pairs differ in, against asking the module about each pair
// alone.

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
        return {type1_.id, elements1_.data(), type2_.id, elements2_.data(), count_};
    }

  private:
    const ElementType& type1_;
    const ElementType& type2_;
    std::size_t count_;
    std::vector<unsigned char> elements1_;
    std::vector<unsigned char> elements2_;
};

void expect_as_one_by_one(const DigitSearch::Result& result, const talcmp::Pairs& pairs) {
    std::array<std::uint64_t, DigitSearch::kind_count> count = {};
    for (std::size_t i = 0; i < pairs.count(); ++i) {
        const DigitSearch::Kind kind = result.kind_of[i];
        ++count.at(kind);
        const Sameness expected = talcmp::sameness_of(pairs, i);
        const Sameness found = result.sameness_of.at(kind);
        ASSERT_TRUE(found == expected)
            << "pair " << i << ": " << pairs.type1().text(pairs.element1(i), false) << " and "
            << pairs.type2().text(pairs.element2(i), false) << " from " << found.from_one()
            << " on, not from " << expected.from_one() << " on; bit by bit " << found.at_zero()
            << ", not " << expected.at_zero();
    }
    EXPECT_EQ(result.count, count);
}

TEST(DigitSearch, FindsWhatAskingOneByOneFinds) {
    constexpr std::size_t count = 1000;
    constexpr int rounds = 10;
    oracle::Random random(1);
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        DrawnPairs drawn(type1, type2, count);
        DigitSearch search;
        for (int round = 0; round < rounds && !testing::Test::HasFatalFailure(); ++round) {
            drawn.draw(random);
            expect_as_one_by_one(search.search(drawn.pairs()), drawn.pairs());
        }
    });
}

} // namespace
