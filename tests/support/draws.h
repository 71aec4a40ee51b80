// Random numbers that are hard to compare, for tests, fuzzers and anything else that draws
// elements.

#pragma once

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <random>
#include <type_traits>

namespace oracle {

// A source of draws, which are the same with every standard library, unlike those of its
// distributions.
class Draws {
  public:
    Draws() = default;
    Draws(const Draws&) = delete;
    Draws& operator=(const Draws&) = delete;
    virtual ~Draws() = default;

    virtual std::uint64_t bits() = 0;
    virtual std::uint32_t below(std::uint32_t bound) = 0;

    bool one_in(const std::uint32_t bound) { return below(bound) == 0; }
    int between(const int low, const int high) {
        return low + static_cast<int>(below(static_cast<std::uint32_t>(high - low + 1)));
    }
    double unit() { return static_cast<double>(bits() >> 11) * 0x1p-53; }

    template <typename T, std::size_t size>
    T pick(const T (&values)[size]) {
        return values[below(static_cast<std::uint32_t>(size))];
    }
};

class Random final : public Draws {
  public:
    explicit Random(const std::uint64_t seed) : engine_(seed) {}

    std::uint64_t bits() override { return engine_(); }
    std::uint32_t below(const std::uint32_t bound) override {
        return static_cast<std::uint32_t>(bits() >> 32) % bound;
    }

  private:
    std::mt19937_64 engine_;
};

// ---- Reals

template <typename Real>
using BitsOf = std::conditional_t<sizeof(Real) == 4, std::uint32_t, std::uint64_t>;

template <typename Real>
Real from_bits(const BitsOf<Real> bits) {
    Real value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

template <typename Real>
Real moved(Real value, const int ulps) {
    const Real goal = std::copysign(std::numeric_limits<Real>::infinity(), static_cast<Real>(ulps));
    for (int i = std::abs(ulps); i > 0; --i) {
        value = std::nextafter(value, goal);
    }
    return value;
}

// Moves a number up or down. Being a function, it draws after its arguments are evaluated, so that
// a seed gives the same numbers with every compiler.
template <typename Real>
Real nudged(Draws& draws, const Real value, const int most_ulps) {
    return moved(value, draws.between(-most_ulps, most_ulps));
}

// Zero, infinity and NaN among others. Where all bits are random, so is the sign.
template <typename Real>
Real random_magnitude(Draws& draws) {
    using Limits = std::numeric_limits<Real>;
    using Bits = BitsOf<Real>;
    static const Real marks[] = {Limits::denorm_min(), Limits::min(), Limits::max(),
                                 Limits::epsilon(), 1};
    static const int powers[] = {7, 8, 15, 16, 24, 31, 32, 53, 63, 64};
    constexpr int stored_digits = Limits::digits - 1;
    const auto significand = [&draws] {
        return static_cast<Bits>(draws.bits() >> (64 - stored_digits));
    };
    const Real fraction = static_cast<Real>(draws.unit());
    switch (draws.below(16)) {
    case 0:
        return 0;
    case 1:
        return static_cast<Real>(draws.between(0, 20));
    case 2:
        return nudged(draws, std::ldexp(Real{1}, draws.pick(powers)), 3);
    case 3: {
        const int shift = draws.between(0, stored_digits - 1);
        return from_bits<Real>(significand() >> shift);
    }
    case 4:
        return nudged(draws, draws.pick(marks), 3);
    case 5:
        return Limits::max() * (1 - fraction / 2);
    case 6:
        return Limits::infinity();
    case 7: {
        constexpr Bits exponent =
            (std::numeric_limits<Bits>::max() >> 1) & ~((Bits{1} << stored_digits) - 1);
        return from_bits<Real>(exponent | std::max<Bits>(significand(), 1));
    }
    case 8:
        return from_bits<Real>(static_cast<Bits>(draws.bits()));
    case 9:
        return std::ldexp(1 + fraction, Limits::min_exponent + draws.between(-20, 60));
    case 10:
        return nudged(draws, Real{1}, 3);
    case 11:
    case 12:
        return (1 + fraction) / 2;
    case 13:
        return 1 + fraction;
    case 14:
        return fraction * 1000;
    default:
        return std::ldexp(1 + fraction, draws.between(-40, 70));
    }
}

template <typename Real>
Real random_real(Draws& draws) {
    const Real magnitude = random_magnitude<Real>(draws);
    return draws.one_in(3) ? -magnitude : magnitude;
}

} // namespace oracle
