// Random pairs of elements that are hard to compare: one number in two types, two within a few
// units in the last place of the limit of a tolerance, subnormals, extremes.

#ifndef TALNUMERICARRAY_TESTS_HARD_PAIRS_H
#define TALNUMERICARRAY_TESTS_HARD_PAIRS_H

#include "promotion_rules.h"
#include "random_arrays.h"
#include "to_type.h"

#include <cmath>
#include <complex>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>
#include <utility>

// None or a few steps to a neighbour.
template <typename T>
T nudged(oracle::Random& random, T value) {
    const T infinity = std::numeric_limits<T>::infinity();
    const T towards = random.one_in(2) ? infinity : -infinity;
    for (int steps = random.between(0, 3); steps > 1; --steps) {
        value = std::nextafter(value, towards);
    }
    return value;
}

// Around the numbers from which on singles, doubles and integers are not what they were.
inline std::uint64_t random_integer(oracle::Random& random) {
    static const std::uint64_t marks[] = {0,
                                          std::uint64_t{1} << 7,
                                          std::uint64_t{1} << 8,
                                          std::uint64_t{1} << 15,
                                          std::uint64_t{1} << 16,
                                          std::uint64_t{1} << 24,
                                          std::uint64_t{1} << 25,
                                          std::uint64_t{1} << 31,
                                          std::uint64_t{1} << 32,
                                          std::uint64_t{1} << 53,
                                          std::uint64_t{1} << 54,
                                          std::uint64_t{1} << 63};
    if (random.one_in(2)) {
        const std::uint64_t distance = random.below(5);
        return random.pick(marks) + distance - 2;
    }
    const std::uint64_t magnitude = random.bits() >> random.below(64);
    return random.one_in(2) ? magnitude : std::uint64_t{0} - magnitude;
}

template <typename T>
T random_real(oracle::Random& random) {
    using limits = std::numeric_limits<T>;
    static const T marks[] = {0,
                              limits::denorm_min(),
                              limits::min(),
                              limits::max(),
                              limits::infinity(),
                              limits::quiet_NaN(),
                              1};
    const auto significand = static_cast<T>(1 + random.unit());
    T magnitude = 0;
    switch (random.below(8)) {
    case 0: {
        const std::uint64_t bits = random.bits();
        std::memcpy(&magnitude, &bits, sizeof magnitude);
        break;
    }
    case 1:
        magnitude = std::ldexp(
            T{1}, random.between(limits::min_exponent - limits::digits, limits::max_exponent - 1));
        break;
    case 2:
        magnitude = limits::denorm_min() * static_cast<T>(random.below(100));
        break;
    case 3:
        magnitude = nudged(random, random.pick(marks));
        break;
    case 4:
        magnitude = nudged(random, static_cast<T>(random_integer(random)));
        break;
    case 5:
        magnitude = significand * limits::min();
        break;
    default:
        magnitude = std::ldexp(significand, random.between(-8, 8));
    }
    return random.one_in(2) ? magnitude : -magnitude;
}

template <typename T>
T random_number(oracle::Random& random) {
    if constexpr (std::is_integral_v<T>) {
        return static_cast<T>(random_integer(random));
    } else {
        return random_real<T>(random);
    }
}

// A number to compare with `anchor`, in the type in which they are compared or, for two integers,
// in any. The limit is `share` of the larger of the two.
template <typename T, typename Anchor>
T partner(oracle::Random& random, const Anchor anchor, [[maybe_unused]] const double share) {
    const auto same = static_cast<T>(anchor);
    if constexpr (std::is_integral_v<T>) {
        const std::uint32_t choice = random.below(4);
        return choice == 0   ? random_number<T>(random)
               : choice == 1 ? static_cast<T>(static_cast<std::uint64_t>(same) + 1)
                             : same;
    } else {
        const T limit = nudged(random, same * static_cast<T>(share));
        switch (random.below(8)) {
        case 0:
            return random_number<T>(random);
        case 1:
            return -same;
        case 2:
            return same;
        case 3:
            return nudged(random, same);
        case 4:
            return nudged(random, same / (1 - static_cast<T>(share)));
        case 5:
            return nudged(random, same - limit);
        default:
            return same - limit;
        }
    }
}

template <typename T1, typename T2>
void draw_parts(oracle::Random& random, const double share, T1& part1, T2& part2) {
    if constexpr (std::is_same_v<T2, type_common_t<T1, T2>>) {
        part1 = random_number<T1>(random);
        part2 = partner<T2>(random, part1, share);
    } else {
        part2 = random_number<T2>(random);
        part1 = partner<T1>(random, part2, share);
    }
}

// Beside an element without one: a zero more often than not.
template <typename T>
T lone_imaginary_part(oracle::Random& random) {
    const T magnitude = random.one_in(8)   ? random_real<T>(random)
                        : random.one_in(8) ? std::numeric_limits<T>::denorm_min()
                                           : T{0};
    return random.one_in(2) ? magnitude : -magnitude;
}

template <typename T1, typename T2>
void draw_elements(oracle::Random& random, const double share, void* element1, void* element2) {
    using Part1 = to_real_type_t<T1>;
    using Part2 = to_real_type_t<T2>;
    Part1 parts1[2] = {};
    Part2 parts2[2] = {};
    draw_parts(random, share, parts1[0], parts2[0]);
    if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
        parts1[1] = 1;
        parts2[1] = 1;
        if (random.one_in(2)) {
            std::swap(parts1[0], parts1[1]);
            std::swap(parts2[0], parts2[1]);
        }
    } else if constexpr (is_complex_v<T1>) {
        parts1[1] = lone_imaginary_part<Part1>(random);
    } else if constexpr (is_complex_v<T2>) {
        parts2[1] = lone_imaginary_part<Part2>(random);
    }
    std::memcpy(element1, parts1, sizeof(T1));
    std::memcpy(element2, parts2, sizeof(T2));
}

#endif
