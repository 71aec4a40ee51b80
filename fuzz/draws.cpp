#include "draws.h"

#include "oracle.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <type_traits>

namespace fuzz {
namespace {

// ---- Numbers

template <typename Real>
Real moved(Real value, const int ulps) {
    const Real goal = std::copysign(std::numeric_limits<Real>::infinity(), static_cast<Real>(ulps));
    for (int i = std::abs(ulps); i > 0; --i) {
        value = std::nextafter(value, goal);
    }
    return value;
}

template <typename Real>
Real drawn_moved(Draws& draws, const Real value) {
    return moved(value, draws.PickValueInArray({0, 1, -1, 2, -2, 3, -3}));
}

// Of [0, 1).
double drawn_fraction(Draws& draws) {
    return draws.ConsumeIntegral<std::uint16_t>() * 0x1p-16;
}

template <typename Real>
Real drawn_real(Draws& draws) {
    using Limits = std::numeric_limits<Real>;
    using Bits = std::conditional_t<sizeof(Real) == 4, std::uint32_t, std::uint64_t>;
    switch (drawn_index(draws, 5)) {
    case 0:
        return static_cast<Real>(1 + drawn_fraction(draws));
    case 1:
        return draws.ConsumeIntegral<std::int8_t>();
    case 2:
        return drawn_moved(
            draws,
            draws.PickValueInArray({Real{0}, -Real{0}, Real{1}, Limits::denorm_min(), Limits::min(),
                                    Limits::max(), -Limits::max(), Limits::infinity(),
                                    -Limits::infinity(), Limits::epsilon()}));
    case 3: {
        const auto significand = static_cast<Real>(1 + drawn_fraction(draws));
        return std::ldexp(significand, draws.ConsumeIntegralInRange(-40, 70));
    }
    default:
        const Bits bits = draws.ConsumeIntegral<Bits>();
        Real value = 0;
        std::memcpy(&value, &bits, sizeof value);
        return value;
    }
}

// A pattern whose lowest bytes become the integer.
std::uint64_t drawn_integer(Draws& draws) {
    switch (drawn_index(draws, 3)) {
    case 0:
        return static_cast<std::uint64_t>(draws.ConsumeIntegral<std::int8_t>());
    case 1: {
        const std::uint64_t power = std::uint64_t{1} << draws.ConsumeIntegralInRange(0, 63);
        return power + draws.ConsumeIntegral<std::uint8_t>() - 128;
    }
    default:
        return draws.ConsumeIntegral<std::uint64_t>();
    }
}

// ---- How a number is stored; a complex one is two of these

struct Part {
    enum class Kind { signed_integer, unsigned_integer, real };
    Kind kind;
    std::size_t size;
};

bool is_complex(const int id) {
    return id >= 11;
}

Part part_of(const int id) {
    if (id >= 9) {
        return {Part::Kind::real, id % 2 == 1 ? sizeof(float) : sizeof(double)};
    }
    const auto kind = id % 2 == 1 ? Part::Kind::signed_integer : Part::Kind::unsigned_integer;
    return {kind, std::size_t{1} << (static_cast<unsigned>(id - 1) / 2)};
}

bool is_real(const Part part) {
    return part.kind == Part::Kind::real;
}

bool is_double(const Part part) {
    return is_real(part) && part.size == sizeof(double);
}

template <typename T>
void store(void* at, const T value) {
    std::memcpy(at, &value, sizeof value);
}

// Of a number in little-endian memory, where libFuzzer runs.
void store_pattern(void* at, const Part part, const std::uint64_t pattern) {
    std::memcpy(at, &pattern, part.size);
}

template <typename Real>
void store_real(void* at, const Part part, const Real value) {
    if (part.size == sizeof(float)) {
        store(at, static_cast<float>(value));
    } else {
        store(at, static_cast<double>(value));
    }
}

template <typename Real>
Real loaded(const void* at, const Part part) {
    std::uint64_t pattern = 0;
    std::memcpy(&pattern, at, part.size);
    if (!is_real(part)) {
        const auto unused = static_cast<unsigned>(64 - 8 * part.size);
        return part.kind == Part::Kind::unsigned_integer
                   ? static_cast<Real>(pattern)
                   : static_cast<Real>(static_cast<std::int64_t>(pattern << unused) >> unused);
    }
    float single = 0;
    double value = 0;
    std::memcpy(&single, at, sizeof single);
    std::memcpy(&value, &pattern, sizeof value);
    return static_cast<Real>(part.size == sizeof(float) ? single : value);
}

// ---- Pairs of numbers

// The share of the larger of two numbers by which they may differ.
template <typename Real>
Real limit_of(const double tolerance) {
    constexpr int digits = std::numeric_limits<Real>::digits;
    if (!(tolerance > 0 && tolerance < digits)) {
        return Real{0.25};
    }
    if constexpr (sizeof(Real) == sizeof(float)) {
        return oracle::single_factor(static_cast<float>(tolerance));
    } else {
        return oracle::double_factor(tolerance);
    }
}

template <typename Real>
Real drawn_partner(Draws& draws, const Real x, const Real limit) {
    switch (drawn_index(draws, 9)) {
    case 0:
        return x;
    case 1:
        return x - x * (limit * static_cast<Real>(drawn_fraction(draws)));
    case 2:
        return x - drawn_moved(draws, x * limit);
    case 3:
        return drawn_moved(draws, x - x * limit);
    case 4:
        return drawn_moved(draws, x / (1 - limit));
    case 5: // by half of it to the limit: here an answer may depend on what is remembered
        return x - x * (Real{0.5} + (limit - Real{0.5}) * static_cast<Real>(drawn_fraction(draws)));
    case 6:
        return drawn_moved(draws, x / 2);
    case 7:
        return drawn_moved(draws, x);
    default:
        return draws.ConsumeBool() ? -x : drawn_real<Real>(draws);
    }
}

// `at1` gets what the other part, a real, can come near to.
template <typename Real>
void draw_reals(Draws& draws, const double tolerance, void* at1, const Part part1, void* at2,
                const Part part2) {
    if (!is_real(part1)) {
        store_pattern(at1, part1, drawn_integer(draws));
    } else if (part1.size == sizeof(float)) {
        store(at1, drawn_real<float>(draws));
    } else {
        store(at1, drawn_real<double>(draws));
    }
    const auto x = loaded<Real>(at1, part1);
    store_real(at2, part2, drawn_partner(draws, x, limit_of<Real>(tolerance)));
}

void draw_parts(Draws& draws, const double tolerance, void* at1, const Part part1, void* at2,
                const Part part2) {
    // The same bits: of two integers mostly the same number, of two reals a NaN may be.
    const bool same_bits =
        is_real(part1) == is_real(part2) && (!is_real(part1) || one_in(draws, 8));
    if (same_bits) {
        const std::uint64_t pattern = drawn_integer(draws);
        store_pattern(at1, part1, pattern);
        store_pattern(at2, part2, one_in(draws, 4) ? drawn_integer(draws) : pattern);
    } else if (!is_real(part2) || (is_double(part1) && !is_double(part2))) {
        draw_parts(draws, tolerance, at2, part2, at1, part1);
    } else if (is_double(part2)) {
        draw_reals<double>(draws, tolerance, at1, part1, at2, part2);
    } else {
        draw_reals<float>(draws, tolerance, at1, part1, at2, part2);
    }
}

void draw_lone_imaginary(Draws& draws, void* at, const Part part) {
    store_real(at, part,
               draws.PickValueInArray({0.0, -0.0, 0.0, -0.0, 1.0, 2.0, 0x1p-149, -0x1p-1074,
                                       std::numeric_limits<double>::quiet_NaN()}));
}

} // namespace

double drawn_tolerance(Draws& draws) {
    constexpr double infinity = std::numeric_limits<double>::infinity();
    switch (drawn_index(draws, 8)) {
    case 0:
        return draws.ConsumeIntegralInRange(0, 60);
    case 1:
        return draws.PickValueInArray({-0.0, -1.0, 1e-300, 1e-46, 0x1p-150, 0x1.0000001p-150,
                                       0x1p-149, 23.99999999, 1e39, 1e300, infinity, -infinity,
                                       std::numeric_limits<double>::quiet_NaN()});
    case 2:
        return draws.ConsumeIntegralInRange(0, 240) * 0.25;
    case 3:
        return 52 + drawn_fraction(draws);
    case 4:
        return 23 + drawn_fraction(draws);
    case 5: { // several become one single
        const double single = 23 + 0x1p-4 * draws.ConsumeIntegralInRange(0, 15);
        return single + 0x1p-22 * draws.ConsumeIntegralInRange(0, 15);
    }
    case 6:
        return drawn_moved(draws,
                           draws.PickValueInArray({0.0, 1.0, 23.0, 24.0, 52.0, 53.0, 0x1p-150}));
    default:
        return drawn_real<double>(draws);
    }
}

void draw_elements(Draws& draws, const double tolerance, const int first_id, const int second_id,
                   void* first, void* second) {
    const Part part1 = part_of(first_id);
    const Part part2 = part_of(second_id);
    auto* const imaginary1 = static_cast<unsigned char*>(first) + part1.size;
    auto* const imaginary2 = static_cast<unsigned char*>(second) + part2.size;
    draw_parts(draws, tolerance, first, part1, second, part2);
    if (is_complex(first_id) && is_complex(second_id)) {
        draw_parts(draws, tolerance, imaginary1, part1, imaginary2, part2);
    } else if (is_complex(first_id)) {
        draw_lone_imaginary(draws, imaginary1, part1);
    } else if (is_complex(second_id)) {
        draw_lone_imaginary(draws, imaginary2, part2);
    }
}

} // namespace fuzz
