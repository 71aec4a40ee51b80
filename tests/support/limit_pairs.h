// Random pairs of reals at and around the limit of a tolerance, and tolerances of each kind.

#pragma once

#include "draws.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <utility>

namespace exactness {

// ---- Tolerances

// The kinds that the rule treats differently. `last_digit` is between `digits` - 1 and `digits`;
// `fractional` is a fraction below that.
enum class Kind { none, whole, fractional, last_digit, all };

// Where pairs and their tolerances are drawn: anywhere, or at the limits of the steps.
enum class Place { random, at_limit };

template <typename T>
T random_between(oracle::Random& random, const T low, const T high) {
    const T value = low + (high - low) * static_cast<T>(random.unit());
    return std::min(std::max(value, std::nextafter(low, high)), std::nextafter(high, low));
}

template <typename T>
T fraction_near_limit(oracle::Random& random, const T whole) {
    switch (random.below(8)) {
    case 0:
        return std::nextafter(whole, T{0});
    case 1:
        return std::nextafter(whole - 1, whole);
    case 2:
        return random.pick({std::numeric_limits<T>::denorm_min(), T(1e-30), T(0.001)});
    case 3:
        return whole - T{0.5};
    default:
        return random_between(random, whole - 1, whole);
    }
}

template <typename T>
T random_fraction(oracle::Random& random, const Place place) {
    constexpr int last = std::numeric_limits<T>::digits - 1;
    for (;;) {
        const T tolerance =
            place == Place::random
                ? random_between(random, T{0}, T{last})
                : fraction_near_limit(random, static_cast<T>(random.between(1, last)));
        if (tolerance != std::trunc(tolerance)) {
            return tolerance;
        }
    }
}

template <typename T>
T random_fraction_of_last_digit(oracle::Random& random, const Place place) {
    constexpr T digits = std::numeric_limits<T>::digits;
    if (place == Place::at_limit && random.one_in(4)) {
        return random.pick({std::nextafter(digits, T{0}), std::nextafter(digits - 1, digits)});
    }
    return random_between(random, digits - 1, digits);
}

template <typename T>
T random_tolerance(oracle::Random& random, const Kind kind, const Place place) {
    using limits = std::numeric_limits<T>;
    constexpr int digits = limits::digits;
    switch (kind) {
    case Kind::none:
        return random.pick({T{0}, T{-0.0}, T{-1}, -limits::denorm_min(), -limits::infinity(),
                            limits::quiet_NaN()});
    case Kind::whole:
        return static_cast<T>(random.between(1, digits - 1));
    case Kind::fractional:
        return random_fraction<T>(random, place);
    case Kind::last_digit:
        return random_fraction_of_last_digit<T>(random, place);
    default:
        return random.pick({T{digits}, T{digits + 0.5}, T(1e30), limits::infinity()});
    }
}

// ---- Pairs

// Finite and above zero: every magnitude from the smallest subnormal number to the largest finite
// one, mostly where the arithmetic changes.
template <typename T>
T random_finite_magnitude(oracle::Random& random) {
    using limits = std::numeric_limits<T>;
    const double fraction = random.unit();
    switch (random.below(8)) {
    case 0:
        return limits::max() * (1 - static_cast<T>(fraction / 2));
    case 1:
        return limits::denorm_min() * static_cast<T>(1 + random.below(100));
    case 2:
        return std::ldexp(static_cast<T>(0.5 + fraction), random.between(-2, 2));
    default: {
        const T magnitude = std::fabs(oracle::random_real<T>(random));
        const bool usable = magnitude > 0 && magnitude <= limits::max();
        return usable ? magnitude : static_cast<T>(1 + fraction);
    }
    }
}

// The two differ by `share` of the larger, give or take some ulps. A difference of few digits is
// drawn first and the larger number after it, as otherwise the ulps of a large difference would be
// too coarse to come near the limit.
template <typename T>
std::pair<T, T> pair_of_difference(oracle::Random& random, const T magnitude, const T share,
                                   const int most_ulps) {
    const T ulp = magnitude - std::nextafter(magnitude, T{0});
    const T difference = ulp * std::max(T{1}, std::floor(magnitude * share / ulp));
    const T larger = oracle::nudged(random, difference / share, most_ulps);
    return {larger, larger - difference};
}

// One of the two is the magnitude, which is not zero, or their difference is made from its ulps.
template <typename T>
std::pair<T, T> pair_at_limit(oracle::Random& random, const T magnitude, const T share,
                              const int most_ulps) {
    switch (random.below(4)) {
    case 0:
        return {magnitude, oracle::nudged(random, magnitude - magnitude * share, most_ulps)};
    case 1:
        return {magnitude, oracle::nudged(random, magnitude / (1 - share), most_ulps)};
    default:
        return pair_of_difference(random, magnitude, share, most_ulps);
    }
}

// Differs from the magnitude by up to twice the limit, or is any other number.
template <typename T>
T random_partner(oracle::Random& random, const T magnitude, const T share) {
    if (random.one_in(8)) {
        const T other = oracle::random_real<T>(random);
        return std::isnan(other) ? T{0} : other;
    }
    const T widest = std::min(T{1}, 2 * share);
    return magnitude - magnitude * (widest * static_cast<T>(random.unit()));
}

template <typename T>
std::pair<T, T> with_random_order_and_sign(oracle::Random& random, std::pair<T, T> pair) {
    if (random.one_in(2)) {
        std::swap(pair.first, pair.second);
    }
    return random.one_in(2) ? std::pair<T, T>{-pair.first, -pair.second} : pair;
}

// Two reals, neither a NaN. One is made from the magnitude; at the limit they are at most
// `most_ulps` off it.
template <typename T>
std::pair<T, T> random_pair(oracle::Random& random, const Place place, const T share,
                            const T magnitude, const int most_ulps) {
    const std::pair<T, T> pair =
        place == Place::at_limit
            ? pair_at_limit(random, magnitude, share, most_ulps)
            : std::pair<T, T>{magnitude, random_partner(random, magnitude, share)};
    return with_random_order_and_sign(random, pair);
}

template <typename T>
std::pair<T, T> random_pair(oracle::Random& random, const Place place, const T share) {
    return random_pair(random, place, share, random_finite_magnitude<T>(random), 3);
}

} // namespace exactness
