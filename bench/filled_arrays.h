// Pairs of arrays to be compared, of every pair of element types, in the caller's memory.

#pragma once

#include "promotion_rules.h"
#include "to_type.h"
#include "type_pairs.h"
#include "type_properties.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <limits>
#include <random>
#include <string>
#include <type_traits>

// ---- The pairs of element types

// NumPy's name.
template <typename T>
std::string type_name() {
    const std::string bits = std::to_string(8 * sizeof(T));
    if constexpr (is_complex_v<T>) {
        return "complex" + bits;
    } else if constexpr (std::is_floating_point_v<T>) {
        return "float" + bits;
    } else {
        return (std::is_unsigned_v<T> ? "uint" : "int") + bits;
    }
}

template <typename T1, typename T2>
inline constexpr bool compared_under_tolerance =
    std::is_floating_point_v<type_common_t<to_real_type_t<T1>, to_real_type_t<T2>>>;

// ---- What the arrays hold

inline constexpr talreal whole_tolerance = 10;
inline constexpr talreal fractional_tolerance = 10.5;

enum class Contents {
    identical,
    near, // within `whole_tolerance`, but not equal; integers are equal
    first_differs,
    last_differs,
};

// A pair of parts. Identical contents are numbers that both types hold.
template <typename R1, typename R2>
void draw(const Contents contents, std::mt19937_64& random, R1& part1, R2& part2) {
    using R = type_common_t<R1, R2>;
    constexpr int digits =
        std::min(std::numeric_limits<R1>::digits, std::numeric_limits<R2>::digits);
    constexpr UBIT64 largest = std::numeric_limits<UBIT64>::max() >> (64 - digits);
    const UBIT64 number = 1 + random() % largest;
    part1 = static_cast<R1>(number);
    part2 = static_cast<R2>(number);
    if constexpr (std::is_floating_point_v<R1> && std::is_floating_point_v<R2>) {
        // Of both signs, and on both sides of 1, where the rule goes different ways.
        const int sign = random() % 2 == 0 ? 1 : -1;
        part1 = std::ldexp(static_cast<R1>(sign) * part1, 2 - digits);
        part2 = std::ldexp(static_cast<R2>(sign) * part2, 2 - digits);
    }
    if constexpr (std::is_floating_point_v<R>) {
        if (contents == Contents::near) {
            // The tolerance is 512 epsilons times the larger.
            const R epsilons = static_cast<R>(1 + random() % 256);
            const R factor = 1 + epsilons * std::numeric_limits<R>::epsilon();
            if constexpr (std::is_same_v<R2, R>) {
                part2 *= factor;
            } else {
                part1 *= factor;
            }
        }
    }
}

// Fills two arrays of `len` elements, always with the same ones.
template <typename T1, typename T2>
void fill(const Contents contents, void* const memory1, void* const memory2,
          const std::size_t len) {
    // Drawing is slow, and no branch predictor remembers more elements than these.
    constexpr std::size_t most_drawn = 16384;
    constexpr std::mt19937_64::result_type seed = 20240229;

    T1* const data1 = static_cast<T1*>(memory1);
    T2* const data2 = static_cast<T2*>(memory2);
    std::mt19937_64 random(seed);
    const std::size_t drawn = std::min(len, most_drawn);
    for (std::size_t i = 0; i < drawn; ++i) {
        to_real_type_t<T1> parts1[2] = {};
        to_real_type_t<T2> parts2[2] = {};
        draw(contents, random, parts1[0], parts2[0]);
        if constexpr (is_complex_v<T1> && is_complex_v<T2>) {
            draw(contents, random, parts1[1], parts2[1]);
        }
        std::memcpy(data1 + i, parts1, sizeof(T1));
        std::memcpy(data2 + i, parts2, sizeof(T2));
    }
    for (std::size_t i = drawn; i < len; i += drawn) {
        const std::size_t copied = std::min(drawn, len - i);
        std::copy_n(data1, copied, data1 + i);
        std::copy_n(data2, copied, data2 + i);
    }
    if (contents == Contents::first_differs || contents == Contents::last_differs) {
        const std::size_t place = contents == Contents::first_differs ? 0 : len - 1;
        data1[place] = static_cast<T1>(1);
        data2[place] = static_cast<T2>(2);
    }
}

inline int right_answer(const Contents contents) {
    return contents == Contents::identical || contents == Contents::near ? 1 : 0;
}
