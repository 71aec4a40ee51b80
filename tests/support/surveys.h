// Surveys of the pairs of one kind: each draws a tolerance, judges some pairs under it, and draws
// the next.

#pragma once

#include "draws.h"
#include "exactness.h"
#include "limit_pairs.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <utility>

namespace exactness {

// How many pairs are judged, and one in how many of them by the exact rule as well as by the quick
// one.
struct Extent {
    std::uint64_t pairs;
    std::uint32_t verify_one_in;
};

constexpr std::uint64_t pairs_under_one_tolerance = 64;

inline constexpr Kind kinds[] = {Kind::none, Kind::whole, Kind::fractional, Kind::last_digit,
                                 Kind::all};
inline constexpr Factor factors[] = {Factor::remembered, Factor::forgotten};
inline constexpr Place places[] = {Place::random, Place::at_limit};

// From here on, half a unit in the last place below 24, a tolerance is rounded to 24.
inline constexpr double first_rounded_up = 24 - 0x1p-20;

// The share of the larger number by which pairs at the limit differ, or a stand-in where there is
// no limit.
template <typename T>
T share_at_limit(const double tolerance, const double limit) {
    const bool has_limit = limit > 0;
    return has_limit       ? static_cast<T>(limit)
           : tolerance > 0 ? T{0.5}
                           : std::numeric_limits<T>::epsilon() / 2;
}

// Counted apart, as the steps are further from the meaning where the larger magnitude is subnormal.
struct Tallies {
    Tally normal;
    Tally subnormal;
};

// Judges the pairs that `next_pair(share)` returns.
template <typename X, typename T, typename NextTolerance, typename NextPair>
Tallies survey_pairs(oracle::Random& random, const Factor factor, const Extent extent,
                     const NextTolerance& next_tolerance, const NextPair& next_pair) {
    Tallies tallies;
    for (std::uint64_t judged = 0; judged < extent.pairs;) {
        const double tolerance = next_tolerance();
        const Survey<X, T> survey(tolerance, factor);
        const T share = share_at_limit<T>(tolerance, survey.limit());
        const std::uint64_t last = std::min(extent.pairs, judged + pairs_under_one_tolerance);
        for (; judged < last; ++judged) {
            const std::pair<X, T> pair = next_pair(share);
            const T larger =
                std::max(std::fabs(static_cast<T>(pair.first)), std::fabs(pair.second));
            const bool is_subnormal = larger < std::numeric_limits<T>::min();
            Tally& tally = is_subnormal ? tallies.subnormal : tallies.normal;
            survey.judge(pair.first, pair.second, tally);
            if (random.one_in(extent.verify_one_in)) {
                survey.verify(pair.first, pair.second, tally);
            }
        }
    }
    return tallies;
}

// ---- Reals

template <typename T>
Tallies survey_reals(oracle::Random& random, const Kind kind, const Factor factor,
                     const Place place, const Extent extent) {
    return survey_pairs<T, T>(
        random, factor, extent,
        [&] { return static_cast<double>(random_tolerance<T>(random, kind, place)); },
        [&](const T share) { return random_pair(random, place, share); });
}

// ---- Singles under a tolerance that is no single

// The magnitude is one that no rounding of the quotient disturbs. At the limit, pairs are as far
// around it as rounding the tolerance moves it.
inline std::pair<float, float> pair_under_rounded_tolerance(oracle::Random& random,
                                                            const Place place, const float share) {
    const auto significand = static_cast<float>(1 + random.unit());
    const float magnitude = std::ldexp(significand, random.between(-60, 60));
    return random_pair(random, place, share, magnitude, 12);
}

inline Tally survey_rounded_tolerances(oracle::Random& random, const double low, const double high,
                                       const Place place, const Extent extent) {
    return survey_pairs<float, float>(
               random, Factor::remembered, extent,
               [&] { return random_between(random, low, high); },
               [&](const float share) {
                   return pair_under_rounded_tolerance(random, place, share);
               })
        .normal;
}

// ---- Integers

// An integer of more than `digits` digits; half of them are near the midpoint of two reals of
// `digits` digits.
inline std::uint64_t random_long_integer(oracle::Random& random, const int digits,
                                         const int most_digits) {
    const int length = random.between(digits + 1, most_digits);
    const std::uint64_t integer = (random.bits() | (std::uint64_t{1} << 63)) >> (64 - length);
    const std::uint64_t half = std::uint64_t{1} << (length - digits - 1);
    if (random.one_in(2)) {
        return integer;
    }
    const std::uint64_t tie = (integer | half) & ~(half - 1);
    return tie + static_cast<std::uint64_t>(random.between(0, 2)) - 1;
}

template <typename X>
X random_integer_of(oracle::Random& random, const int digits) {
    const std::uint64_t magnitude =
        random_long_integer(random, digits, std::numeric_limits<X>::digits);
    const bool negative = std::is_signed_v<X> && random.one_in(2);
    return static_cast<X>(negative ? 0 - magnitude : magnitude);
}

template <typename T>
T partner_of_integer(oracle::Random& random, const Place place, const T rounded, const T share) {
    const T magnitude = std::fabs(rounded);
    const T partner = place == Place::random ? random_partner(random, magnitude, share)
                      : random.one_in(2)     ? magnitude - magnitude * share
                                             : magnitude / (1 - share);
    return std::copysign(place == Place::random ? partner : oracle::nudged(random, partner, 1),
                         rounded);
}

template <typename X, typename T>
Tally survey_integers(oracle::Random& random, const Kind kind, const Factor factor,
                      const Place place, const Extent extent) {
    return survey_pairs<X, T>(
               random, factor, extent,
               [&] { return static_cast<double>(random_tolerance<T>(random, kind, place)); },
               [&](const T share) {
                   const X integer = random_integer_of<X>(random, std::numeric_limits<T>::digits);
                   return std::pair(
                       integer, partner_of_integer(random, place, static_cast<T>(integer), share));
               })
        .normal;
}

} // namespace exactness
