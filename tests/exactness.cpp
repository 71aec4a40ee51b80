// Prints tables of where the steps of the tolerant comparison and its meaning disagree. The rows
// share as many random pairs as TALNUMERICARRAY_RANDOM_CALLS says, and a tenth of that at the
// limit; TALNUMERICARRAY_SEED is the seed. Fails where the two disagree further from the limit than
// they may.

#include "support/checked_calls.h"
#include "support/exact_rule.h"
#include "support/surveys.h"
#include "tolerance_shift_factor.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <exception>
#include <iomanip>
#include <iostream>
#include <iterator>
#include <limits>
#include <sstream>
#include <string>
#include <vector>

namespace {

using exactness::Extent;
using exactness::Factor;
using exactness::factors;
using exactness::first_rounded_up;
using exactness::Kind;
using exactness::kinds;
using exactness::Place;
using exactness::places;
using exactness::Tally;

// ---- The extent of the run

// Every row gets an equal part of the pairs. There are rows for two types of reals and, beside
// each, two of integers, under every kind of tolerance with the factor remembered or forgotten; and
// rows for singles under tolerances in ranges.
struct Range {
    const char* name;
    double low;
    double high;
};

constexpr Range ranges[] = {{"0 to 1", 0, 1},
                            {"1 to 2", 1, 2},
                            {"2 to 4", 2, 4},
                            {"4 to 8", 4, 8},
                            {"8 to 16", 8, 16},
                            {"16 to 24 - 2^-20", 16, first_rounded_up},
                            {"24 - 2^-20 to 24", first_rounded_up, 24}};

constexpr std::uint64_t parts = (2 + 4) * std::size(kinds) * std::size(factors) + std::size(ranges);

constexpr Extent part_of(const std::uint64_t random_pairs, const Place place) {
    const std::uint64_t part = std::max<std::uint64_t>(random_pairs / parts, 10);
    return place == Place::random ? Extent{part, 1000} : Extent{part / 10, 10};
}

// ---- Rows

struct Row {
    std::string name;
    int digits = 0;
    Tally random;
    Tally at_limit;
};

Tally& tally_of(Row& row, const Place place) {
    return place == Place::random ? row.random : row.at_limit;
}

void add(Tally& sum, const Tally& tally) {
    sum.pairs += tally.pairs;
    sum.stricter += tally.stricter;
    sum.laxer += tally.laxer;
    sum.furthest_stricter = std::max(sum.furthest_stricter, tally.furthest_stricter);
    sum.furthest_laxer = std::max(sum.furthest_laxer, tally.furthest_laxer);
    if (sum.unexplained == 0) {
        sum.first_unexplained = tally.first_unexplained;
    }
    sum.unexplained += tally.unexplained;
}

std::string name_of(const Kind kind, const int digits) {
    const std::string below = std::to_string(digits - 1);
    switch (kind) {
    case Kind::none:
        return "0 or less, NaN";
    case Kind::whole:
        return "1, 2, ..., " + below;
    case Kind::fractional:
        return "fractional, below " + below;
    case Kind::last_digit:
        return below + " to " + std::to_string(digits);
    default:
        return std::to_string(digits) + " or more";
    }
}

template <typename T>
Row row_of(const Kind kind, const Factor factor) {
    constexpr int digits = std::numeric_limits<T>::digits;
    const std::string type = digits == 24 ? "singles" : "doubles";
    const char* state = factor == Factor::remembered ? "remembered" : "forgotten";
    return {type + " | " + name_of(kind, digits) + " | " + state, digits, {}, {}};
}

// ---- Tables

// In units of 2^-digits if these are few, otherwise as a plain number.
std::string distance(const std::uint64_t differing, const double furthest, const int digits) {
    if (differing == 0) {
        return "-";
    }
    const double units = std::ldexp(furthest, digits);
    std::ostringstream text;
    text << std::fixed;
    if (units < 100) {
        text << std::setprecision(2) << units << " * 2^-" << digits;
    } else {
        text << std::setprecision(4) << furthest;
    }
    return text.str();
}

void print(const Row& row) {
    Tally all = row.random;
    add(all, row.at_limit);
    std::cout << "| " << row.name;
    for (const Tally& tally : {row.random, row.at_limit}) {
        std::cout << " | " << tally.pairs << " | " << tally.stricter << " | " << tally.laxer;
    }
    std::cout << " | " << distance(all.stricter, all.furthest_stricter, row.digits) << " | "
              << distance(all.laxer, all.furthest_laxer, row.digits) << " |\n";
    if (all.unexplained != 0) {
        std::cout << "\nUNEXPLAINED: " << all.unexplained << " pairs; the first, "
                  << all.first_unexplained << "\n\n";
    }
}

// Returns how many pairs are further from the limit than they may be.
std::uint64_t print(const char* title, const char* first_columns, const std::vector<Row>& rows) {
    std::cout << "\n"
              << title << "\n\n| " << first_columns
              << " | random pairs | stricter | laxer | at the limit | stricter | laxer"
                 " | stricter by | laxer by |\n";
    const std::string columns(first_columns);
    for (auto left = 9 + std::count(columns.begin(), columns.end(), '|'); left > 0; --left) {
        std::cout << "|---";
    }
    std::cout << "|\n";
    std::uint64_t unexplained = 0;
    for (const Row& row : rows) {
        print(row);
        unexplained += row.random.unexplained + row.at_limit.unexplained;
    }
    std::cout << std::flush;
    return unexplained;
}

// ---- Surveys

struct RealRows {
    std::vector<Row> normal;
    std::vector<Row> subnormal;
};

template <typename T>
void survey_reals(oracle::Random& random, const std::uint64_t pairs, RealRows& rows) {
    for (const Kind kind : kinds) {
        for (const Factor factor : factors) {
            rows.normal.push_back(row_of<T>(kind, factor));
            rows.subnormal.push_back(row_of<T>(kind, factor));
            for (const Place place : places) {
                const auto tallies =
                    exactness::survey_reals<T>(random, kind, factor, place, part_of(pairs, place));
                tally_of(rows.normal.back(), place) = tallies.normal;
                tally_of(rows.subnormal.back(), place) = tallies.subnormal;
            }
        }
    }
}

template <typename T>
void survey_integers(oracle::Random& random, const std::uint64_t pairs, std::vector<Row>& rows) {
    for (const Kind kind : kinds) {
        for (const Factor factor : factors) {
            rows.push_back(row_of<T>(kind, factor));
            for (const Place place : places) {
                const Extent extent = part_of(pairs, place);
                Tally& tally = tally_of(rows.back(), place);
                add(tally, exactness::survey_integers<std::int64_t, T>(random, kind, factor, place,
                                                                       extent));
                add(tally, exactness::survey_integers<std::uint64_t, T>(random, kind, factor, place,
                                                                        extent));
            }
        }
    }
}

std::vector<Row> survey_rounded_tolerances(oracle::Random& random, const std::uint64_t pairs) {
    std::vector<Row> rows;
    for (const Range& range : ranges) {
        rows.push_back({range.name, 24, {}, {}});
        for (const Place place : places) {
            tally_of(rows.back(), place) = exactness::survey_rounded_tolerances(
                random, range.low, range.high, place, part_of(pairs, place));
        }
    }
    return rows;
}

// The error in units of the factor's last place.
template <typename T>
double error_of_factor(const T tolerance) {
    const long double exact = exact_rule::factor(tolerance, std::numeric_limits<T>::digits);
    const long double error = std::fabs(nesk::ToleranceShiftFactor(tolerance) - exact);
    const long double place = std::ldexp(std::numeric_limits<T>::epsilon(), std::ilogb(exact));
    return static_cast<double>(error / place);
}

template <typename T>
double greatest_error_of_factors(oracle::Random& random, const std::uint64_t count) {
    double greatest = 0;
    for (std::uint64_t i = 0; i < count; ++i) {
        const T tolerance = exactness::random_tolerance<T>(random, Kind::fractional, Place::random);
        greatest = std::max(greatest, error_of_factor(tolerance));
    }
    return greatest;
}

bool run(const std::uint64_t pairs) {
    oracle::Random random(oracle::printed_seed());
    RealRows reals;
    survey_reals<double>(random, pairs, reals);
    survey_reals<float>(random, pairs, reals);
    const char* columns = "compared as | tolerance | factor";
    std::uint64_t unexplained =
        print("Reals; distances as shares of the limit", columns, reals.normal);
    unexplained += print("The same, the larger magnitude subnormal", columns, reals.subnormal);

    std::vector<Row> integers;
    survey_integers<double>(random, pairs, integers);
    survey_integers<float>(random, pairs, integers);
    unexplained +=
        print("Integers of more digits than the reals beside them; distances as shares of "
              "the larger magnitude",
              columns, integers);
    unexplained += print("Singles, the tolerance being no single; distances as shares of the limit",
                         "tolerance", survey_rounded_tolerances(random, pairs));

    const std::uint64_t factors_tried = pairs / 100;
    const double of_doubles = greatest_error_of_factors<double>(random, factors_tried);
    const double of_singles = greatest_error_of_factors<float>(random, factors_tried);
    std::cout << "\nOf " << factors_tried << " factors of doubles, and as many of singles, none is "
              << "off by more than " << std::setprecision(4) << of_doubles << " and " << of_singles
              << " of its last place.\n"
              << unexplained << " pairs are unexplained." << std::endl;
    return unexplained == 0;
}

} // namespace

int main() {
    try {
        return run(oracle::requested_calls()) ? 0 : 1;
    } catch (const std::exception& error) {
        std::cerr << "exactness: " << error.what() << "\n";
        return 2;
    }
}
