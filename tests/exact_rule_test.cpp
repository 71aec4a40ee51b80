// The steps of the tolerant comparison against its meaning in exact arithmetic: worked examples of
// the meaning, and how far from the limit the two may disagree.

#include "compare.h"

#include "support/arrays.h"
#include "support/checked_calls.h"
#include "support/exact_rule.h"
#include "support/surveys.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <utility>
#include <vector>

namespace {

using exact_rule::Number;
using exactness::Extent;
using exactness::Factor;
using exactness::factors;
using exactness::first_rounded_up;
using exactness::Kind;
using exactness::kinds;
using exactness::Place;
using exactness::places;
using exactness::Tallies;
using exactness::Tally;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// ---- The exact rule itself

struct Case {
    const char* name;
    double tolerance;
    int digits;
    Number x;
    Number y;
    bool same;
};

const Case cases[] = {
    {"the limit is 2^-43 of 1", 10, 53, 1.0, 1 - 0x1p-43, false},
    {"one digit inside it", 10, 53, 1.0, 1 - 0x1p-43 + 0x1p-53, true},
    {"2^-43 of a larger number", 10, 53, 1.0, 1 + 0x1p-43, true},
    {"one digit beyond that", 10, 53, 1.0, 1 + 0x1p-43 + 0x1p-52, false},
    {"both negative", 10, 53, -1.0, -1 - 0x1p-43, true},
    {"2^-14 of 1 with 24 digits", 10, 24, 1.0, 1 - 0x1p-14, false},
    {"inside it", 10, 24, 1.0, 1 - 0x1p-14 + 0x1p-24, true},
    {"half of the larger", 52, 53, 1.0, 2.0, false},
    {"less than half", 52, 53, 1.0, 2 - 0x1p-52, true},
    {"a limit of 2^-1.5 * 3, just above 1", 51.5, 53, 0x2p-1074, 0x3p-1074, true},
    {"a limit of 2^-1.6 * 3, just below 1", 51.4, 53, 0x2p-1074, 0x3p-1074, false},
    {"the smallest tolerance is above none", 0x1p-1074, 53, 1.0, 1 - 0x1p-53, true},
    {"none", 0, 53, 1.0, 1 - 0x1p-53, false},
    {"less than none", -3, 53, 1.0, 1 - 0x1p-53, false},
    {"not a number", nan, 53, 1.0, 1 - 0x1p-53, false},
    {"equal under none", -infinity, 53, 1.5, 1.5, true},
    // 1 - 2^-(2^-47) is ln 2 * 2^-47, give or take 2^-95, and ln 2 is between 1/2 and 1.
    {"nearly all digits", 53 - 0x1p-47, 53, 1.0, 0x1p-47, true},
    {"nearly all digits, too small", 53 - 0x1p-47, 53, 1.0, 0x1p-48, false},
    {"all digits", 53, 53, 1.0, 1e300, true},
    {"all digits, infinity", 53, 53, 1.0, infinity, true},
    {"infinity beside a number", 52.9, 53, 1.0, infinity, false},
    {"infinities", 52.9, 53, infinity, infinity, true},
    {"opposite infinities", 60, 53, infinity, -infinity, false},
    {"zero", 60, 53, 0.0, 0x1p-1074, false},
    {"zeros", 10, 53, 0.0, -0.0, true},
    {"opposite signs", 60, 53, 1.0, -1.0, false},
    {"an integer is not rounded", 0, 53, std::int64_t{9007199254740993}, 0x1p53, false},
    {"it differs by 1, the limit is above 2", 1, 53, std::int64_t{9007199254740993}, 0x1p53, true},
    {"nor is it for 24 digits", 0, 24, std::int64_t{16777217}, 0x1p24, false},
    {"1 is less than 2^-23.5 * 16777217", 0.5, 24, std::int64_t{16777217}, 0x1p24, true},
    {"signs of integers", 60, 53, std::int64_t{-1}, ~std::uint64_t{0}, false},
    {"the largest integer", 0, 53, ~std::uint64_t{0}, 0x1p64, false},
    {"is 1 below 2^64", 0x1p-1074, 53, ~std::uint64_t{0}, 0x1p64, true},
};

TEST(ExactRule, HasTheWorkedAnswers) {
    for (const Case& c : cases) {
        EXPECT_EQ(exact_rule::same(c.tolerance, c.digits, c.x, c.y), c.same) << c.name;
        EXPECT_EQ(exact_rule::same(c.tolerance, c.digits, c.y, c.x), c.same) << c.name;
    }
}

// The fractions p/q that begin 1/1, 2/3, 5/7, 12/17 come as near to 1/sqrt(2) as fractions of their
// size can, from above and from below in turn: q^2 - 2 p^2 is -1, 1, -1, 1. Under half a digit less
// than all, numbers that differ by p/q of the larger are thus the same every other time.
TEST(ExactRule, TellsTheBestFractionsFromTheSquareRoot) {
    std::int64_t p = 1;
    std::int64_t q = 1;
    int fractions = 0;
    for (bool below = false; q < std::int64_t{1} << 61; below = !below) {
        EXPECT_EQ(exact_rule::same(52.5, 53, q, q - p), below) << p << "/" << q;
        EXPECT_EQ(exact_rule::same(23.5, 24, q, q - p), below) << p << "/" << q;
        const std::int64_t next = p + q;
        q = next + p;
        p = next;
        ++fractions;
    }
    EXPECT_EQ(fractions, 48);
}

TEST(ExactRule, MeasuresHowFarAPairIsBeyondTheLimit) {
    EXPECT_EQ(exact_rule::beyond_limit(10, 53, 1.0, 1 - 0x1p-43), 0);
    EXPECT_EQ(exact_rule::beyond_limit(10, 53, 1 - 0x1p-43 + 0x1p-53, 1.0), -0x1p-53);
    EXPECT_EQ(exact_rule::beyond_limit(52, 53, -4.0, -1.0), 0.25);
    EXPECT_EQ(exact_rule::beyond_limit(0, 24, std::int64_t{4}, 3.0), 0.25);
    EXPECT_EQ(exact_rule::beyond_limit(51.5, 53, 1.0, 1.0), -std::sqrt(0.125));
}

TEST(ExactRule, GivesTheFactor) {
    EXPECT_EQ(exact_rule::factor(10, 53), 0x1p-43L);
    EXPECT_EQ(exact_rule::factor(23, 24), 0.5L);
    EXPECT_EQ(exact_rule::factor(23.5, 24), std::sqrt(0.5L));
}

// ---- The steps against the meaning, in examples

template <typename T>
struct Parting {
    const char* name;
    T tolerance;
    T x;
    T y;
    bool meant;
    bool while_remembered;
    bool while_forgotten;
};

const Parting<double> partings_of_doubles[] = {
    {"the product is rounded down", 50.5, 768398401, 632563471, true, false, false},
    {"the factor is too large", 51.5, 5729058702, 3703530573, false, true, true},
    {"the quotient is rounded to a whole number", 51.5, 0x3p-1074, 0x2p-1074, true, false, false},
    {"the power of the fraction is rounded to 1", 1e-30, 1, 1 - 0x1p-53, true, false, false},
    {"half the larger or more", 52.5, 2.5, 1, true, true, false},
    {"less than half", 52.5, 2.5, 1.5, true, true, true},
    {"more than the limit", 52.5, 4, 1, false, false, false},
};

const Parting<float> partings_of_singles[] = {
    {"the product is rounded down", 22.125F, 906, 659, true, false, false},
    {"the factor is too large", 20.375F, 3202555, 2942980, false, true, true},
    {"the quotient is rounded to a whole number", 22.5F, 0x3p-149F, 0x2p-149F, true, false, false},
    {"half the larger or more", 23.5F, 2.5F, 1, true, true, false},
};

template <typename T, std::size_t count>
void expect_to_part(const Parting<T> (&partings)[count]) {
    for (const Parting<T>& parting : partings) {
        const auto& [name, tolerance, x, y, meant, while_remembered, while_forgotten] = parting;
        constexpr int digits = std::numeric_limits<T>::digits;
        EXPECT_EQ(exact_rule::same(tolerance, digits, x, y), meant) << name;
        exactness::prepare(Factor::remembered, tolerance);
        EXPECT_EQ(nesk::compare(tolerance, x, y) == 0, while_remembered) << name;
        exactness::prepare(Factor::forgotten, tolerance);
        EXPECT_EQ(nesk::compare(tolerance, x, y) == 0, while_forgotten) << name;
    }
}

TEST(StepsAndMeaning, PartInTheseExamples) {
    expect_to_part(partings_of_doubles);
    expect_to_part(partings_of_singles);
}

// The tolerance or a number is rounded before the comparison.
TEST(StepsAndMeaning, PartWhereASingleIsTheCommonType) {
    EXPECT_FALSE(exact_rule::same(23.99999999, 24, 1.0, 1e30));
    EXPECT_EQ(sameQ_of(23.99999999, 1.0F, 1e30F), 1);
    EXPECT_FALSE(exact_rule::same(20.1, 24, 23184.0, 21631.0));
    EXPECT_TRUE(exact_rule::same(static_cast<double>(20.1F), 24, 23184.0, 21631.0));
    EXPECT_EQ(sameQ_of(20.1, 23184.0F, 21631.0F), 1);
    EXPECT_TRUE(exact_rule::same(1e-46, 24, 1.0, 1 - 0x1p-24));
    EXPECT_EQ(sameQ_of(1e-46, 1.0F, 1 - 0x1p-24F), 0);
    EXPECT_FALSE(exact_rule::same(0, 24, std::int64_t{16777217}, 16777216.0));
    EXPECT_EQ(sameQ_of(0, std::int32_t{16777217}, 16777216.0F), 1);
}

// ---- The steps against the meaning, at random

constexpr std::uint64_t random_pairs = 20000;
constexpr std::uint64_t pairs_at_limit = 10000;

// Every pair is judged by the exact rule too.
constexpr Extent extent(const Place place) {
    return {place == Place::random ? random_pairs : pairs_at_limit, 1};
}

void expect_explained(const Tally& tally) {
    EXPECT_GT(tally.pairs, 0U);
    EXPECT_EQ(tally.unexplained, 0U) << tally.first_unexplained;
}

// Calls `check(tallies, place)` for doubles and for singles, at random and at the limit.
template <typename Check>
void survey_reals(oracle::Random& random, const Kind kind, const Factor factor,
                  const Check& check) {
    for (const Place place : places) {
        const Extent all = extent(place);
        for (const Tallies& tallies :
             {exactness::survey_reals<double>(random, kind, factor, place, all),
              exactness::survey_reals<float>(random, kind, factor, place, all)}) {
            expect_explained(tallies.normal);
            expect_explained(tallies.subnormal);
            check(tallies, place);
        }
    }
}

void expect_agreement(const Tallies& tallies, const Place /*place*/) {
    for (const Tally& tally : {tallies.normal, tallies.subnormal}) {
        EXPECT_EQ(tally.stricter + tally.laxer, 0U);
    }
}

TEST(StepsAndMeaning, AgreeUnderWholeTolerances) {
    oracle::Random random(oracle::printed_seed());
    for (const Factor factor : factors) {
        survey_reals(random, Kind::whole, factor, expect_agreement);
    }
}

TEST(StepsAndMeaning, AgreeWhereNoFactorIsNeeded) {
    oracle::Random random(oracle::printed_seed());
    for (const Kind kind : {Kind::none, Kind::all}) {
        for (const Factor factor : factors) {
            survey_reals(random, kind, factor, expect_agreement);
        }
    }
}

void expect_differences_at_limit(const Tallies& tallies, const Place place) {
    if (place == Place::at_limit) {
        EXPECT_GT(tallies.normal.stricter, 0U);
        EXPECT_GT(tallies.subnormal.stricter, 0U);
    }
}

TEST(StepsAndMeaning, DifferAtTheLimitOfAFractionalTolerance) {
    oracle::Random random(oracle::printed_seed());
    for (const Factor factor : factors) {
        survey_reals(random, Kind::fractional, factor, expect_differences_at_limit);
    }
}

TEST(StepsAndMeaning, DifferAtTheLimitOfTheLastDigitOnceItsFactorIsRemembered) {
    oracle::Random random(oracle::printed_seed());
    survey_reals(random, Kind::last_digit, Factor::remembered, expect_differences_at_limit);
}

void expect_early_exits(const Tallies& tallies, const Place /*place*/) {
    for (const Tally& tally : {tallies.normal, tallies.subnormal}) {
        EXPECT_GT(tally.stricter, 0U);
        EXPECT_EQ(tally.laxer, 0U);
    }
}

TEST(StepsAndMeaning, DifferFromHalfTheLargerOnBeforeTheFactorOfTheLastDigitIsRemembered) {
    oracle::Random random(oracle::printed_seed());
    survey_reals(random, Kind::last_digit, Factor::forgotten, expect_early_exits);
}

// ---- Whole arrays, some of them long enough for blocks

template <typename T>
struct Columns {
    std::vector<T> first;
    std::vector<T> second;
};

template <typename T>
void set(Columns<T>& columns, const std::size_t index, const std::pair<T, T> pair) {
    columns.first[index] = pair.first;
    columns.second[index] = pair.second;
}

template <typename T>
int sameQ(const double tolerance, const Columns<T>& columns) {
    const auto count = static_cast<talint>(columns.first.size());
    return sameQ(tolerance, Array<T>({count}, columns.first), Array<T>({count}, columns.second));
}

// A pair that by its meaning is the same under the tolerance, or one that is not.
template <typename T>
std::pair<T, T> pair_that_means(oracle::Random& random, const bool same, const double tolerance) {
    constexpr int digits = std::numeric_limits<T>::digits;
    const auto share = static_cast<T>(exact_rule::factor(tolerance, digits));
    for (;;) {
        const auto pair = exactness::random_pair(random, Place::at_limit, share);
        if (exact_rule::same(tolerance, digits, pair.first, pair.second) == same) {
            return pair;
        }
    }
}

template <typename T>
void expect_agreement_over_arrays(oracle::Random& random) {
    for (int i = 0; i < 200; ++i) {
        const double tolerance = random.between(1, std::numeric_limits<T>::digits - 1);
        const std::uint32_t count = 1 + random.below(400);
        Columns<T> columns{std::vector<T>(count), std::vector<T>(count)};
        for (std::uint32_t index = 0; index < count; ++index) {
            set(columns, index, pair_that_means<T>(random, true, tolerance));
        }
        EXPECT_EQ(sameQ(tolerance, columns), 1) << tolerance;
        set(columns, random.below(count), pair_that_means<T>(random, false, tolerance));
        EXPECT_EQ(sameQ(tolerance, columns), 0) << tolerance;
    }
}

TEST(StepsAndMeaning, AgreeOverArraysUnderWholeTolerances) {
    oracle::Random random(oracle::printed_seed());
    expect_agreement_over_arrays<double>(random);
    expect_agreement_over_arrays<float>(random);
}

// So that what holds for scalars under every tolerance holds for the predicate.
template <typename T>
void expect_arrays_to_follow_the_steps(oracle::Random& random, const Kind kind) {
    for (int i = 0; i < 5000; ++i) {
        const Place place = random.pick(places);
        const T tolerance = exactness::random_tolerance<T>(random, kind, place);
        const auto limit = exact_rule::factor(tolerance, std::numeric_limits<T>::digits);
        const auto [x, y] = exactness::random_pair(random, place, static_cast<T>(limit));
        const Factor factor = random.pick(factors);
        exactness::prepare(factor, tolerance);
        const int steps = nesk::compare(tolerance, x, y) == 0 ? 1 : 0;
        exactness::prepare(factor, tolerance);
        EXPECT_EQ(sameQ_of(tolerance, x, y), steps) << tolerance << ", " << x << ", " << y;
    }
}

TEST(StepsAndMeaning, StepsAreThoseOfThePredicate) {
    oracle::Random random(oracle::printed_seed());
    for (const Kind kind : {Kind::whole, Kind::fractional, Kind::last_digit}) {
        expect_arrays_to_follow_the_steps<double>(random, kind);
        expect_arrays_to_follow_the_steps<float>(random, kind);
    }
}

// ---- What is rounded before it is compared

TEST(StepsAndMeaning, DifferAsFarAsTheToleranceOfSinglesIsRounded) {
    oracle::Random random(oracle::printed_seed());
    const auto examine = [&](const double low, const double high, const Place place) {
        Tally tally = exactness::survey_rounded_tolerances(random, low, high, place, {20000, 1});
        expect_explained(tally);
        return tally;
    };
    examine(0, 24, Place::random);
    const Tally fractional = examine(16, first_rounded_up, Place::at_limit);
    EXPECT_GT(fractional.stricter, 0U);
    EXPECT_GT(fractional.laxer, 0U);
    const Tally rounded_up = examine(first_rounded_up, 24, Place::at_limit);
    EXPECT_EQ(rounded_up.stricter, 0U);
    EXPECT_GT(rounded_up.laxer, 0U);
}

// An integer that equals a real still does once it is rounded; one that does not may become equal.
template <typename X, typename T>
void expect_the_rounding_of_integers(oracle::Random& random) {
    for (const Kind kind : kinds) {
        for (const Factor factor : factors) {
            for (const Place place : places) {
                expect_explained(
                    exactness::survey_integers<X, T>(random, kind, factor, place, {2000, 1}));
            }
        }
    }
    const auto at_limit = [&](const Kind kind) {
        return exactness::survey_integers<X, T>(random, kind, Factor::remembered, Place::at_limit,
                                                {2000, 1});
    };
    const Tally equality = at_limit(Kind::none);
    EXPECT_EQ(equality.stricter, 0U);
    EXPECT_GT(equality.laxer, 0U);
    for (const Kind kind : {Kind::whole, Kind::fractional, Kind::last_digit}) {
        const Tally tally = at_limit(kind);
        EXPECT_GT(tally.stricter, 0U);
        EXPECT_GT(tally.laxer, 0U);
    }
    const Tally all_digits = at_limit(Kind::all);
    EXPECT_EQ(all_digits.stricter + all_digits.laxer, 0U);
}

TEST(StepsAndMeaning, DifferAsFarAsAnIntegerIsRounded) {
    oracle::Random random(oracle::printed_seed());
    expect_the_rounding_of_integers<std::int64_t, double>(random);
    expect_the_rounding_of_integers<std::uint64_t, double>(random);
    expect_the_rounding_of_integers<std::int64_t, float>(random);
    expect_the_rounding_of_integers<std::uint64_t, float>(random);
}

} // namespace
