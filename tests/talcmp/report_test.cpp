// What is counted of pairs, and which of them are told.

#include "report.h"

#include "taldata_array_element_types.h"

#include "support/type_names.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdint>
#include <limits>
#include <optional>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

namespace {

using talcmp::Report;
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

std::string text_of(const talcmp::Place& place) {
    return std::to_string(place.order) + "@" + std::to_string(place.position);
}

// All that a report says.
std::string text_of(const Report& report) {
    std::string text = std::to_string(report.pairs) + " pairs, " + std::to_string(report.differing)
                       + " differ; digits";
    for (std::size_t digits = 0; digits < report.digits.size(); ++digits) {
        if (report.digits[digits] != 0) {
            text += " " + std::to_string(report.digits[digits]) + "x" + std::to_string(digits);
        }
    }
    text += "; from " + std::to_string(report.needed_from_one) + ", worst "
            + std::to_string(report.worst_digits);
    text += report.worst_place ? " at " + text_of(*report.worst_place) : "";
    return text + "; " + text_of(report.values1) + ", " + text_of(report.values2);
}

std::string text_of(const talcmp::FirstPlaces& places) {
    std::string text;
    for (const talcmp::Place& place : places.in_order()) {
        text += (text.empty() ? "" : " ") + text_of(place);
    }
    return text;
}

talcmp::Pairs pairs_of(const Reals& first, const Reals& second) {
    return {element_type_id<double>, first.data(), element_type_id<double>, second.data(),
            first.size()};
}

// 1 and another number that differ in so many digits.
double with_digits(const int digits) {
    return 1 - std::ldexp(digits == 1 ? 0.5 : 0.75, digits - 53);
}

struct Counted {
    const char* name;
    Reals first;
    Reals second;
    double tolerance;
    std::string report;
    std::string places; // the first three
};

void PrintTo(const Counted& counted, std::ostream* out) {
    *out << counted.name;
}

const Reals ones(6, 1.0);
const Reals others = {1, with_digits(1), with_digits(3), with_digits(53), with_digits(3), -1};
const std::string digits_of_others = "; digits 1x0 1x1 2x3 1x53 1x54; from 54, worst 54 at 5@15; "
                                     "0 0 0, 0 0 0";

const Counted counted[] = {
    {"Nothing", {}, {}, 0, "0 pairs, 0 differ; digits; from 1, worst 0; 0 0 0, 0 0 0", ""},
    {"Equal",
     {1, 2},
     {1, 2},
     0,
     "2 pairs, 0 differ; digits 2x0; from 1, worst 0; 0 0 0, 0 0 0",
     ""},
    {"BitByBit", ones, others, 0, "6 pairs, 5 differ" + digits_of_others, "1@11 2@12 3@13"},
    {"Negative", ones, others, -1, "6 pairs, 5 differ" + digits_of_others, "1@11 2@12 3@13"},
    {"Half", ones, others, 0.5, "6 pairs, 4 differ" + digits_of_others, "2@12 3@13 4@14"},
    {"One", ones, others, 1, "6 pairs, 4 differ" + digits_of_others, "2@12 3@13 4@14"},
    {"Two", ones, others, 2, "6 pairs, 4 differ" + digits_of_others, "2@12 3@13 4@14"},
    {"TwoAndALittle", ones, others, 2.25, "6 pairs, 4 differ" + digits_of_others, "2@12 3@13 4@14"},
    {"AlmostThree", ones, others, 2.75, "6 pairs, 2 differ" + digits_of_others, "3@13 5@15"},
    {"Three", ones, others, 3, "6 pairs, 2 differ" + digits_of_others, "3@13 5@15"},
    {"AlmostAll", ones, others, 52.5, "6 pairs, 2 differ" + digits_of_others, "3@13 5@15"},
    {"FarAsTheFactorIsRemembered",
     {1},
     {2.5},
     52.5,
     "1 pairs, 0 differ; digits 1x53; from 53, worst 53 at 0@10; 0 0 0, 0 0 0",
     ""},
    {"All", ones, others, 53, "6 pairs, 1 differ" + digits_of_others, "5@15"},
    {"MoreThanAll", ones, others, 1e300, "6 pairs, 1 differ" + digits_of_others, "5@15"},
    {"Zeros",
     {-0.0, 0},
     {0, 0},
     0,
     "2 pairs, 1 differ; digits 1x0 1x1; from 1, worst 1 at 0@10; 0 0 1, 0 0 0",
     "0@10"},
    {"ZerosNegative",
     {-0.0, 0},
     {0, 0},
     -1,
     "2 pairs, 0 differ; digits 1x0 1x1; from 1, worst 1 at 0@10; 0 0 1, 0 0 0",
     ""},
    {"EqualNaNs",
     {1, nan},
     {1, nan},
     0,
     "2 pairs, 0 differ; digits 2x0; from 53, worst 0; 1 0 0, 1 0 0",
     ""},
    {"EqualNaNsUnderOne",
     {1, nan},
     {1, nan},
     1,
     "2 pairs, 1 differ; digits 2x0; from 53, worst 0; 1 0 0, 1 0 0",
     "1@11"},
    {"Infinities",
     {infinity, 1},
     {-infinity, infinity},
     0,
     "2 pairs, 2 differ; digits 1x53 1x54; from 54, worst 54 at 0@10; 0 1 0, 0 2 0",
     "0@10 1@11"},
};

talcmp::Place place_at(const std::size_t i, const std::uint64_t begin) {
    talcmp::Place place;
    place.order = begin + i;
    place.position = begin + i + 10;
    return place;
}

class Reports : public testing::TestWithParam<Counted> {};

TEST_P(Reports, CountAllPairsAndTellTheFirst) {
    for (const bool in_order : {true, false}) {
        SCOPED_TRACE(in_order);
        talcmp::Reporter reporter(GetParam().tolerance);
        talcmp::FirstPlaces first(3);
        reporter.add(
            pairs_of(GetParam().first, GetParam().second),
            [](const std::size_t i) { return place_at(i, 0); }, in_order, first);
        EXPECT_EQ(text_of(reporter.report()), GetParam().report);
        EXPECT_EQ(text_of(first), GetParam().places);
    }
}

INSTANTIATE_TEST_SUITE_P(Tolerance, Reports, testing::ValuesIn(counted),
                         [](const auto& of) { return std::string(of.param.name); });

// Stretches come in any order, and those of arrays in column-major order with any places in them.
TEST(Report, TellsTheFirstOfTheWorstPlacesInWhateverOrderTheyCome) {
    const struct {
        const char* name;
        std::vector<std::uint64_t> begins;
        bool in_order;
        const char* worst;
        const char* first;
    } cases[] = {{"Forwards", {0, 100, 200}, true, "2@12", "1@11 2@12 101@111"},
                 {"Backwards", {200, 100, 0}, true, "2@12", "1@11 2@12 101@111"},
                 {"Mixed", {100, 200, 0}, true, "2@12", "1@11 2@12 101@111"},
                 {"Descending", {200, 0, 100}, false, "0@10", "0@10 1@11 100@110"}};
    const Reals first = {1, 1, 1};
    const Reals second = {1, with_digits(4), with_digits(30)};
    const Reals reversed = {with_digits(30), with_digits(4), 1};
    for (const auto& each : cases) {
        SCOPED_TRACE(each.name);
        talcmp::Reporter reporter(0);
        talcmp::FirstPlaces places(3);
        for (const std::uint64_t begin : each.begins) {
            const auto place = [&](const std::size_t i) {
                return place_at(each.in_order ? i : 2 - i, begin);
            };
            // The worst pair is the last one either way.
            reporter.add(pairs_of(first, second), place, each.in_order, places);
        }
        EXPECT_EQ(text_of(*reporter.report().worst_place), each.worst);
        EXPECT_EQ(text_of(places), each.first);
        EXPECT_EQ(reporter.report().differing, 6U);
    }
}

Report report_of(const Reals& second, const std::uint64_t begin) {
    talcmp::Reporter reporter(0);
    talcmp::FirstPlaces places(1);
    const Reals first(second.size(), 1.0);
    reporter.add(
        pairs_of(first, second), [begin](const std::size_t i) { return place_at(i, begin); }, true,
        places);
    return reporter.report();
}

TEST(Report, IsTheSameInWhateverOrderItIsAddedUp) {
    const Report reports[] = {report_of({1, with_digits(5)}, 0), report_of({with_digits(9)}, 2),
                              report_of({nan, -0.0, infinity, with_digits(9)}, 3),
                              report_of({1, 1}, 7), report_of({}, 9)};
    std::vector<std::size_t> order = {0, 1, 2, 3, 4};
    do {
        Report sum;
        for (const std::size_t i : order) {
            add(sum, reports[i]);
        }
        EXPECT_EQ(text_of(sum), "9 pairs, 6 differ; digits 3x0 1x5 2x9 2x53 1x54; from 54, "
                                "worst 54 at 4@14; 0 0 0, 1 1 1");
    } while (std::next_permutation(order.begin(), order.end()));
}

TEST(Report, TellsTheFirstOfEquallyBadPlaces) {
    Report sum = report_of({with_digits(7)}, 5);
    add(sum, report_of({with_digits(7)}, 3));
    add(sum, report_of({with_digits(7)}, 4));
    EXPECT_EQ(text_of(sum), "3 pairs, 3 differ; digits 3x7; from 7, worst 7 at 3@13; 0 0 0, 0 0 0");
}

TEST(Report, KnowsTheSmallestToleranceForAll) {
    EXPECT_EQ(smallest_tolerance(report_of({}, 0), 53), 0);
    EXPECT_EQ(smallest_tolerance(report_of({1, 1}, 0), 53), 0);
    EXPECT_EQ(smallest_tolerance(report_of({1, with_digits(7)}, 0), 53), 7);
    EXPECT_EQ(smallest_tolerance(report_of({with_digits(52), with_digits(7)}, 0), 53), 52);
    EXPECT_EQ(smallest_tolerance(report_of({1, -1}, 0), 53), std::nullopt);
}

// That of all digits is one that says nothing.
TEST(Report, KnowsNoSmallestToleranceWhereNoDigitIsInCommon) {
    EXPECT_EQ(smallest_tolerance(report_of({with_digits(53), with_digits(7)}, 0), 53),
              std::nullopt);
    EXPECT_EQ(smallest_tolerance(report_of({with_digits(24)}, 0), 24), std::nullopt);
    EXPECT_EQ(smallest_tolerance(report_of({with_digits(23)}, 0), 24), 23);
}

// ---- First places

TEST(FirstPlaces, AreTheFirstOfThoseThatAreShown) {
    const std::vector<std::uint64_t> shown = {50, 20, 70, 10, 60, 30, 40};
    const char* const expected[] = {"", "10@20", "10@20 20@30", "10@20 20@30 30@40"};
    for (std::size_t limit = 0; limit < 4; ++limit) {
        talcmp::FirstPlaces one(limit);
        talcmp::FirstPlaces other(limit);
        for (const std::uint64_t order : shown) {
            const std::uint64_t bound = one.bound();
            EXPECT_EQ(one.add(place_at(0, order)), order < bound);
            other.add(place_at(0, order + 5));
        }
        other.add(one);
        EXPECT_EQ(text_of(one), expected[limit]);
        EXPECT_EQ(one.bound(), 10 * limit);
    }
}

TEST(FirstPlaces, OfTwoListsAreTheFirstOfBoth) {
    talcmp::FirstPlaces one(3);
    talcmp::FirstPlaces other(3);
    EXPECT_EQ(one.bound(), std::numeric_limits<std::uint64_t>::max());
    for (const std::uint64_t order : {1U, 9U, 5U}) {
        one.add(place_at(0, order));
        other.add(place_at(0, order + 1));
    }
    one.add(other);
    EXPECT_EQ(text_of(one), "1@11 2@12 5@15");
}

} // namespace
