// What is counted about pairs, and which of them are listed.

#include "pair_counter.h"

#include "taldata_array_element_types.h"

#include "support/named_cases.h"
#include "support/type_names.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <limits>
#include <optional>
#include <string>
#include <utility>
#include <vector>

namespace {

using talcmp::Findings;
using talcmp::Totals;
using Reals = std::vector<double>;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// ---- Values that are special

std::string text_of(const talcmp::ValueCounts& counts) {
    return std::to_string(counts.nans) + " " + std::to_string(counts.infinities) + " "
           + std::to_string(counts.negative_zeros);
}

template <typename T>
std::string counts_of(const std::vector<T>& elements) {
    return text_of(talcmp::count_values(element_type_id<T>, elements.data(), elements.size()));
}

template <typename T>
class SpecialValues : public testing::Test {};

using RealTypes = testing::Types<float, double>;
TYPED_TEST_SUITE(SpecialValues, RealTypes, TypeNames);

TYPED_TEST(SpecialValues, AreCountedWhereverTheyAre) {
    using T = TypeParam;
    using Complex = std::complex<T>;
    constexpr auto infinite = std::numeric_limits<T>::infinity();
    const T ordinary[] = {1, std::numeric_limits<T>::max(), std::numeric_limits<T>::lowest(),
                          std::numeric_limits<T>::denorm_min()};
    std::vector<T> reals(525);
    std::vector<Complex> pairs(reals.size());
    for (std::size_t i = 0; i < reals.size(); ++i) {
        reals[i] = ordinary[i % 4];
        pairs[i] = {ordinary[i % 4], ordinary[(i + 1) % 4]};
    }
    EXPECT_EQ(counts_of(reals), "0 0 0");
    EXPECT_EQ(counts_of(pairs), "0 0 0");
    const struct {
        T value;
        const char* counts;
    } cases[] = {{std::numeric_limits<T>::quiet_NaN(), "1 0 0"},
                 {infinite, "0 1 0"},
                 {-infinite, "0 1 0"},
                 {T(-0.0), "0 0 1"},
                 {T(0), "0 0 0"}};
    for (std::size_t i = 0; i < reals.size(); ++i) {
        for (const auto& [value, counts] : cases) {
            const T before = std::exchange(reals[i], value);
            EXPECT_EQ(counts_of(reals), counts) << i;
            reals[i] = before;
            const Complex pair = std::exchange(pairs[i], {value, 1});
            EXPECT_EQ(counts_of(pairs), counts) << i;
            pairs[i] = {1, value};
            EXPECT_EQ(counts_of(pairs), counts) << i;
            pairs[i] = {value, value};
            EXPECT_EQ(counts_of(pairs), counts) << i;
            pairs[i] = pair;
        }
    }
}

TEST(SpecialValue, OfTwoKindsCountsAsBoth) {
    EXPECT_EQ(counts_of<std::complex<double>>({{nan, infinity}, {-0.0, -infinity}, {1, 1}}),
              "1 2 1");
}

TEST(SpecialValue, IsNoInteger) {
    EXPECT_EQ(counts_of<std::int32_t>({0, -1, INT32_MIN}), "0 0 0");
}

// ---- Reports

// Its number, and how many digits its elements differ in.
std::string text_of(const talcmp::FoundPair& pair) {
    const std::string digits = pair.sameness ? std::to_string(pair.sameness->digits()) : "?";
    return std::to_string(pair.number) + ":" + digits;
}

// All that is counted.
std::string text_of(const Totals& totals) {
    std::string text = std::to_string(totals.pairs) + " pairs, " + std::to_string(totals.differing)
                       + " differ; digits";
    for (std::size_t digits = 0; digits < totals.digits.size(); ++digits) {
        if (totals.digits[digits] != 0) {
            text += " " + std::to_string(totals.digits[digits]) + "x" + std::to_string(digits);
        }
    }
    text += "; from " + std::to_string(totals.needed_from_one) + ", worst "
            + std::to_string(totals.worst_digits);
    text += totals.worst ? " at " + text_of(*totals.worst) : "";
    return text + "; " + text_of(totals.values1) + ", " + text_of(totals.values2);
}

std::string text_of(const talcmp::FirstPairs& pairs) {
    std::string text;
    for (const talcmp::FoundPair& pair : pairs.in_order()) {
        text += (text.empty() ? "" : " ") + text_of(pair);
    }
    return text;
}

talcmp::Pairs pairs_of(const Reals& first, const Reals& second) {
    const talcmp::ElementType& type = talcmp::element_type(REAL64_TYPE);
    return {type, first.data(), type, second.data(), first.size()};
}

// 1 and another number that differ in `digits` digits.
double with_digits(const int digits) {
    return 1 - std::ldexp(digits == 1 ? 0.5 : 0.75, digits - 53);
}

struct Counted {
    const char* name;
    Reals first;
    Reals second;
    double tolerance;
    std::string report;
    std::string listed = {}; // the first three of those that differ
};

const Reals ones(6, 1.0);
const Reals others = {1, with_digits(1), with_digits(3), with_digits(53), with_digits(3), -1};
const std::string digits_of_others = "; digits 1x0 1x1 2x3 1x53 1x54; from 54, worst 54 at 5:54; "
                                     "0 0 0, 0 0 0";
const std::string zero_digits = "; digits 1x0 1x1; from 1, worst 1 at 0:1; 0 0 1, 0 0 0";
const std::string nan_digits = "; digits 2x0; from 53, worst 0; 1 0 0, 1 0 0";
const Reals zeros(2, 0.0);
const Reals negative_zero = {-0.0, 0};
const Reals one_and_nan = {1, nan};

const Counted counted[] = {
    {"Nothing", {}, {}, 0, "0 pairs, 0 differ; digits; from 1, worst 0; 0 0 0, 0 0 0"},
    {"Equal", ones, ones, 0, "6 pairs, 0 differ; digits 6x0; from 1, worst 0; 0 0 0, 0 0 0"},
    {"BitByBit", ones, others, 0, "6 pairs, 5 differ" + digits_of_others, "1:1 2:3 3:53"},
    {"Negative", ones, others, -1, "6 pairs, 5 differ" + digits_of_others, "1:1 2:3 3:53"},
    {"Half", ones, others, 0.5, "6 pairs, 4 differ" + digits_of_others, "2:3 3:53 4:3"},
    {"One", ones, others, 1, "6 pairs, 4 differ" + digits_of_others, "2:3 3:53 4:3"},
    {"Two", ones, others, 2, "6 pairs, 4 differ" + digits_of_others, "2:3 3:53 4:3"},
    {"TwoAndALittle", ones, others, 2.25, "6 pairs, 4 differ" + digits_of_others, "2:3 3:53 4:3"},
    {"AlmostThree", ones, others, 2.75, "6 pairs, 2 differ" + digits_of_others, "3:53 5:54"},
    {"Three", ones, others, 3, "6 pairs, 2 differ" + digits_of_others, "3:53 5:54"},
    {"AlmostAll", ones, others, 52.5, "6 pairs, 2 differ" + digits_of_others, "3:53 5:54"},
    {"FarAsTheFactorIsRemembered", Reals({1}), Reals({2.5}), 52.5,
     "1 pairs, 0 differ; digits 1x53; from 53, worst 53 at 0:53; 0 0 0, 0 0 0"},
    {"All", ones, others, 53, "6 pairs, 1 differ" + digits_of_others, "5:54"},
    {"MoreThanAll", ones, others, 1e300, "6 pairs, 1 differ" + digits_of_others, "5:54"},
    {"Zeros", negative_zero, zeros, 0, "2 pairs, 1 differ" + zero_digits, "0:1"},
    {"ZerosNegative", negative_zero, zeros, -1, "2 pairs, 0 differ" + zero_digits},
    {"EqualNaNs", one_and_nan, one_and_nan, 0, "2 pairs, 0 differ" + nan_digits},
    {"EqualNaNsUnderOne", one_and_nan, one_and_nan, 1, "2 pairs, 1 differ" + nan_digits, "1:0"},
    {"Infinities", Reals({infinity, 1}), Reals({-infinity, infinity}), 0,
     "2 pairs, 2 differ; digits 1x53 1x54; from 54, worst 54 at 0:54; 0 1 0, 0 2 0", "0:54 1:53"},
};

class Reports : public NamedCaseTest<Counted> {};

TEST_P(Reports, CountAllPairsAndListTheFirst) {
    for (const bool in_order : {true, false}) {
        SCOPED_TRACE(in_order);
        Findings findings = {talcmp::FirstPairs(3), {}};
        const talcmp::Pairs pairs = pairs_of(GetParam().first, GetParam().second);
        talcmp::PairCounter(GetParam().tolerance)
            .add(
                pairs, pairs, [](const std::size_t i) { return i; }, in_order, findings);
        EXPECT_EQ(text_of(findings.totals), GetParam().report);
        EXPECT_EQ(text_of(findings.first), GetParam().listed);
    }
}

INSTANTIATE_TEST_SUITE_P(Tolerance, Reports, named_cases(counted), name_of_case);

// Stretches come in any order, and those of arrays in column-major order may have any numbers in
// them.
TEST(Report, HasTheFirstOfTheWorstPairsInWhateverOrderTheyCome) {
    const struct {
        const char* name;
        std::vector<std::uint64_t> begins;
        bool in_order;
        const char* worst;
        const char* first;
    } cases[] = {{"Forwards", {0, 100, 200}, true, "2:30", "1:4 2:30 101:4"},
                 {"Backwards", {200, 100, 0}, true, "2:30", "1:4 2:30 101:4"},
                 {"Mixed", {100, 200, 0}, true, "2:30", "1:4 2:30 101:4"},
                 {"Descending", {200, 0, 100}, false, "0:30", "0:30 1:4 100:30"}};
    const Reals first = {1, 1, 1};
    const Reals second = {1, with_digits(4), with_digits(30)};
    for (const auto& each : cases) {
        SCOPED_TRACE(each.name);
        talcmp::PairCounter counter(0);
        Findings findings = {talcmp::FirstPairs(3), {}};
        for (const std::uint64_t begin : each.begins) {
            const auto number = [&](const std::size_t i) {
                return begin + (each.in_order ? i : 2 - i);
            };
            // The worst pair is the last one either way.
            counter.add(pairs_of(first, second), pairs_of(first, second), number, each.in_order,
                        findings);
        }
        EXPECT_EQ(text_of(*findings.totals.worst), each.worst);
        EXPECT_EQ(text_of(findings.first), each.first);
        EXPECT_EQ(findings.totals.differing, 6U);
    }
}

Totals totals_of(const Reals& second, const std::uint64_t begin) {
    Findings findings = {talcmp::FirstPairs(1), {}};
    const Reals first(second.size(), 1.0);
    const talcmp::Pairs pairs = pairs_of(first, second);
    talcmp::PairCounter(0).add(
        pairs, pairs, [begin](const std::size_t i) { return begin + i; }, true, findings);
    return findings.totals;
}

TEST(Report, IsTheSameInWhateverOrderItIsAddedUp) {
    const Totals parts[] = {totals_of({1, with_digits(5)}, 0), totals_of({with_digits(9)}, 2),
                            totals_of({nan, -0.0, infinity, with_digits(9)}, 3),
                            totals_of({1, 1}, 7), totals_of({}, 9)};
    std::vector<std::size_t> order = {0, 1, 2, 3, 4};
    do {
        Totals sum;
        for (const std::size_t i : order) {
            add(sum, parts[i]);
        }
        EXPECT_EQ(text_of(sum), "9 pairs, 6 differ; digits 3x0 1x5 2x9 2x53 1x54; from 54, "
                                "worst 54 at 4:54; 0 0 0, 1 1 1");
    } while (std::next_permutation(order.begin(), order.end()));
}

TEST(Report, HasTheFirstOfEquallyBadPairs) {
    Totals sum = totals_of({with_digits(7)}, 5);
    add(sum, totals_of({with_digits(7)}, 3));
    add(sum, totals_of({with_digits(7)}, 4));
    EXPECT_EQ(text_of(sum), "3 pairs, 3 differ; digits 3x7; from 7, worst 7 at 3:7; 0 0 0, 0 0 0");
}

TEST(Report, KnowsTheSmallestToleranceForAll) {
    EXPECT_EQ(smallest_tolerance(totals_of({}, 0), 53), 0);
    EXPECT_EQ(smallest_tolerance(totals_of({1, 1}, 0), 53), 0);
    EXPECT_EQ(smallest_tolerance(totals_of({1, with_digits(7)}, 0), 53), 7);
    EXPECT_EQ(smallest_tolerance(totals_of({with_digits(52), with_digits(7)}, 0), 53), 52);
    EXPECT_EQ(smallest_tolerance(totals_of({1, -1}, 0), 53), std::nullopt);
}

// A smallest tolerance of all digits would say nothing.
TEST(Report, KnowsNoSmallestToleranceWhereNoDigitIsInCommon) {
    EXPECT_EQ(smallest_tolerance(totals_of({with_digits(53), with_digits(7)}, 0), 53),
              std::nullopt);
    EXPECT_EQ(smallest_tolerance(totals_of({with_digits(24)}, 0), 24), std::nullopt);
    EXPECT_EQ(smallest_tolerance(totals_of({with_digits(23)}, 0), 24), 23);
}

// ---- First pairs

talcmp::FoundPair pair_at(const std::uint64_t number) {
    talcmp::FoundPair pair;
    pair.number = number;
    return pair;
}

TEST(FirstPairs, AreTheFirstOfThoseThatAreAdded) {
    const std::vector<std::uint64_t> added = {50, 20, 70, 10, 60, 30, 40};
    const char* const expected[] = {"", "10:?", "10:? 20:?", "10:? 20:? 30:?"};
    for (std::size_t limit = 0; limit < 4; ++limit) {
        talcmp::FirstPairs one(limit);
        talcmp::FirstPairs other(limit);
        for (const std::uint64_t number : added) {
            const std::uint64_t bound = one.bound();
            EXPECT_EQ(one.add(pair_at(number)), number < bound);
            other.add(pair_at(number + 5));
        }
        other.add(one);
        EXPECT_EQ(text_of(one), expected[limit]);
        EXPECT_EQ(one.bound(), 10 * limit);
    }
}

TEST(FirstPairs, OfTwoListsAreTheFirstOfBoth) {
    talcmp::FirstPairs one(3);
    talcmp::FirstPairs other(3);
    EXPECT_EQ(one.bound(), std::numeric_limits<std::uint64_t>::max());
    for (const std::uint64_t number : {1U, 9U, 5U}) {
        one.add(pair_at(number));
        other.add(pair_at(number + 1));
    }
    one.add(other);
    EXPECT_EQ(text_of(one), "1:? 2:? 5:?");
}

} // namespace
