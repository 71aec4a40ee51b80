// The factor of a tolerance, in integer arithmetic: the same on every platform, whatever its pow.

#pragma once

#include <cmath>
#include <cstdint>
#include <limits>

namespace oracle {

// The upper half of the product.
constexpr std::uint64_t high_product(const std::uint64_t a, const std::uint64_t b) {
    constexpr std::uint64_t low_half = 0xffffffff;
    const std::uint64_t middle =
        (a >> 32) * (b & low_half) + ((a & low_half) * (b & low_half) >> 32);
    const std::uint64_t other_middle = (a & low_half) * (b >> 32) + (middle & low_half);
    return (a >> 32) * (b >> 32) + (middle >> 32) + (other_middle >> 32);
}

// 2^(tolerance - digits), rounded to nearest; one factor in 1000 may be rounded the wrong way. The
// tolerance is between 0 and `digits`.
template <typename Real>
Real rounded_factor(const Real tolerance) {
    constexpr int digits = std::numeric_limits<Real>::digits;
    constexpr std::uint64_t ln2 = 0xb17217f7d1cf79ac; // fractions have 64 binary places
    const Real whole = std::floor(tolerance);
    const auto fraction = static_cast<std::uint64_t>(std::ldexp(tolerance - whole, 64));
    const std::uint64_t x = high_product(fraction, ln2);

    // The power series of e^x - 1, which is below 1.
    std::uint64_t sum = 0;
    for (std::uint64_t n = 20; n > 0; --n) {
        sum = (x + high_product(x, sum)) / n;
    }
    const std::uint64_t places = ((sum >> (64 - digits)) + 1) >> 1;
    const std::uint64_t significand = (std::uint64_t{1} << (digits - 1)) + places;
    return std::ldexp(static_cast<Real>(significand), static_cast<int>(whole) - 2 * digits + 1);
}

} // namespace oracle
