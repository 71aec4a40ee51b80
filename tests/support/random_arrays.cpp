#include "random_arrays.h"

#include "rounded_factor.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>

namespace oracle {
namespace {

// ---- Reals

// Returns bits, as a register may change those of a signalling NaN. Few random patterns give an
// infinity.
template <typename Real>
BitsOf<Real> nan_bits(const std::uint64_t pattern) {
    constexpr int stored_digits = std::numeric_limits<Real>::digits - 1;
    constexpr auto ones = std::numeric_limits<BitsOf<Real>>::max();
    constexpr auto exponent = static_cast<BitsOf<Real>>((ones >> 1) << stored_digits) & (ones >> 1);
    return exponent | static_cast<BitsOf<Real>>(pattern >> (64 - 8 * sizeof(Real)));
}

// ---- Integers

struct Integer {
    bool negative;
    std::uint64_t magnitude;
};

std::uint64_t low_bits(Integer value) {
    return value.negative ? 0 - value.magnitude : value.magnitude;
}

// How a number is stored; a complex number is stored as two of these.
struct Part {
    bool is_real;
    bool is_signed;
    std::size_t size;
};

bool is_complex(const int type_id) {
    return type_id >= 11;
}

Part part_of(const int type_id) {
    if (type_id >= 9) {
        return {true, true, type_id % 2 == 1 ? sizeof(float) : sizeof(double)};
    }
    return {false, type_id % 2 == 1, std::size_t{1} << (static_cast<unsigned>(type_id - 1) / 2)};
}

Integer fitted(Integer value, Part part) {
    const bool negative = value.negative && part.is_signed;
    std::uint64_t limit = ~std::uint64_t{0} >> (64 - 8 * part.size);
    if (part.is_signed) {
        limit = limit / 2 + (negative ? 1 : 0);
    }
    while (value.magnitude > limit) {
        value.magnitude >>= 1;
    }
    return {negative, value.magnitude};
}

// Midway between two reals of `digits` digits.
std::uint64_t random_tie(Draws& draws, int digits) {
    const std::uint64_t leading = std::uint64_t{1} << digits;
    const std::uint64_t tie = (draws.bits() >> (63 - digits)) | leading | 1;
    return tie << draws.between(0, 63 - digits);
}

std::uint64_t random_integer_magnitude(Draws& draws) {
    static const int powers[] = {7, 8, 15, 16, 24, 31, 32, 53, 63};
    const auto step = static_cast<std::uint64_t>(draws.between(-2, 2));
    switch (draws.below(8)) {
    case 0:
        return draws.below(3);
    case 1:
        return draws.below(20);
    case 2:
        return draws.below(300);
    case 3:
        return ~std::uint64_t{0};
    case 4:
        return (std::uint64_t{1} << draws.pick(powers)) + step;
    case 5:
        return random_tie(draws, 24) + step;
    case 6:
        return random_tie(draws, 53) + step;
    default:
        return draws.bits() >> draws.below(64);
    }
}

Integer random_integer(Draws& draws, Part part) {
    return fitted({draws.one_in(2), random_integer_magnitude(draws)}, part);
}

// A pattern that is near the first, or looks like it.
std::uint64_t hard_pattern(Draws& draws, std::uint64_t first, std::uint32_t first_bits) {
    switch (draws.below(6)) {
    case 0:
        return first;
    case 1:
        return first + 1;
    case 2:
        return first - 1;
    case 3:
        return 0 - first;
    case 4:
        return first ^ (std::uint64_t{1} << draws.below(64));
    default:
        return first ^ (std::uint64_t{1} << draws.below(first_bits));
    }
}

// ---- Pairs of elements

template <typename T>
void store(void* at, const T value) {
    std::memcpy(at, &value, sizeof value);
}

void store_integer(void* at, const Part part, const std::uint64_t pattern) {
    constexpr bool little_endian = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;
    const std::size_t unused = little_endian ? 0 : sizeof pattern - part.size;
    std::memcpy(at, reinterpret_cast<const unsigned char*>(&pattern) + unused, part.size);
}

// Calls `action` with a value of the part's type, which is a real one.
template <typename Action>
auto with_real_type(const Part part, const Action& action) {
    return part.size == sizeof(float) ? action(float{}) : action(double{});
}

class PairWriter {
  public:
    PairWriter(Draws& draws, const double tolerance, const int first_id, const int second_id)
        : draws_(draws), tolerance_(tolerance), first_(part_of(first_id)),
          second_(part_of(second_id)), first_is_complex_(is_complex(first_id)),
          second_is_complex_(is_complex(second_id)), nan_pattern_(draws.bits()) {}

    void write_element(unsigned char* first, unsigned char* second, const bool hard) {
        const bool any_complex = first_is_complex_ || second_is_complex_;
        const std::uint32_t hard_parts = !hard ? 0 : any_complex ? 1 + draws_.below(3) : 1;
        write_parts(first, second, (hard_parts & 1) != 0);
        const bool hard_imaginary = (hard_parts & 2) != 0;
        if (first_is_complex_ && second_is_complex_) {
            write_parts(first + first_.size, second + second_.size, hard_imaginary);
        } else if (first_is_complex_) {
            write_lone_imaginary(first + first_.size, first_, hard_imaginary);
        } else if (second_is_complex_) {
            write_lone_imaginary(second + second_.size, second_, hard_imaginary);
        }
    }

  private:
    void write_parts(void* first, void* second, const bool hard) {
        if (!first_.is_real && !second_.is_real) {
            write_integers(first, second, hard);
        } else if (holds<double>(first_) || holds<double>(second_)) {
            write_reals<double>(first, second, hard);
        } else {
            write_reals<float>(first, second, hard);
        }
    }

    void write_integers(void* first, void* second, const bool hard) {
        const Integer value = random_integer(draws_, first_);
        std::uint64_t pattern1 = low_bits(value);
        std::uint64_t pattern2 = pattern1;
        if (hard) {
            pattern2 = hard_pattern(draws_, pattern1, static_cast<std::uint32_t>(8 * first_.size));
        } else {
            pattern1 = pattern2 = low_bits(fitted(fitted(value, second_), first_));
        }
        store_integer(first, first_, pattern1);
        store_integer(second, second_, pattern2);
    }

    // The anchor goes to the narrower side, so that its partner can be any real of the width.
    template <typename Real>
    void write_reals(void* first, void* second, const bool hard) {
        const bool either = holds<Real>(first_) && holds<Real>(second_);
        const bool second_has_anchor = either ? draws_.one_in(2) : holds<Real>(first_);
        const Real anchor = second_has_anchor ? write_anchor<Real>(second, second_, hard)
                                              : write_anchor<Real>(first, first_, hard);
        const Real partner = hard ? hard_partner(anchor) : easy_partner(anchor);
        store_real(second_has_anchor ? first : second, partner, hard);
    }

    template <typename Real>
    Real write_anchor(void* at, const Part part, const bool hard) {
        if (part.is_real) {
            return with_real_type(part, [&](auto value) {
                // A NaN is the same as its copy only where bytes are compared.
                do {
                    value = random_real<decltype(value)>(draws_);
                } while (!hard && tolerance_ != 0 && std::isnan(value));
                store_real(at, value, hard);
                return static_cast<Real>(value);
            });
        }
        const Integer value = random_integer(draws_, part);
        store_integer(at, part, low_bits(value));
        const auto magnitude = static_cast<Real>(value.magnitude);
        return value.negative ? -magnitude : magnitude;
    }

    // Platforms differ in what arithmetic makes of a NaN's bits, so these are drawn. The NaNs of an
    // easy pair have the same bits.
    template <typename Real>
    void store_real(void* at, const Real value, const bool hard) {
        if (!std::isnan(value)) {
            return store(at, value);
        }
        if (hard) {
            nan_pattern_ ^= std::uint64_t{1} << draws_.below(64);
        }
        store(at, nan_bits<Real>(nan_pattern_));
    }

    template <typename Real>
    Real easy_partner(const Real anchor) {
        if (!std::isfinite(anchor) || draws_.one_in(2)) {
            return anchor;
        }
        return anchor - anchor * (share<Real>() * static_cast<Real>(draws_.unit() / 2));
    }

    template <typename Real>
    Real hard_partner(const Real anchor) {
        switch (draws_.below(12)) {
        case 0:
        case 1:
        case 2:
        case 3:
        case 4:
            return limit_partner(anchor);
        case 5:
            return nudged(draws_, anchor * (draws_.one_in(2) ? Real{2} : Real{0.5}), 1);
        case 6:
        case 7:
            return scaled(anchor, between_half_and_share<Real>());
        case 8:
            return nudged(draws_, anchor, 3);
        case 9:
            return draws_.one_in(2) ? -anchor : std::copysign(Real{0}, anchor);
        case 10:
            return random_real<Real>(draws_);
        default:
            return anchor;
        }
    }

    // With a large difference the partner is small and its last place is too fine to matter, so the
    // difference is nudged as well.
    template <typename Real>
    Real limit_partner(const Real anchor) {
        if (draws_.one_in(2)) {
            return anchor - nudged(draws_, anchor * share<Real>(), 2);
        }
        return nudged(draws_, scaled(anchor, share<Real>()), 3);
    }

    // A number that differs by `share` of the larger of the two.
    template <typename Real>
    Real scaled(const Real anchor, const Real share) {
        return draws_.one_in(3) ? anchor / (1 - share) : anchor - anchor * share;
    }

    // A share at which the answer depends on the cache.
    template <typename Real>
    Real between_half_and_share() {
        return Real{0.5} + (share<Real>() - Real{0.5}) * static_cast<Real>(draws_.unit());
    }

    void write_lone_imaginary(void* at, const Part part, const bool hard) {
        with_real_type(part, [&](auto zero) {
            using Real = decltype(zero);
            using Limits = std::numeric_limits<Real>;
            const Real marks[] = {0, Limits::denorm_min(), Limits::min()};
            const Real magnitude = !hard              ? zero
                                   : draws_.one_in(2) ? draws_.pick(marks)
                                                      : random_magnitude<Real>(draws_);
            store_real(at, draws_.one_in(2) ? -magnitude : magnitude, hard);
        });
    }

    // The share of the larger magnitude that two numbers may differ by: 0 asks for equality.
    template <typename Real>
    Real share() const {
        constexpr int digits = std::numeric_limits<Real>::digits;
        const auto narrowed = static_cast<Real>(tolerance_);
        if (!(narrowed > 0)) {
            return 0;
        }
        return narrowed >= digits ? Real{1} : rounded_factor(narrowed);
    }

    template <typename Real>
    static bool holds(const Part part) {
        return part.is_real && part.size == sizeof(Real);
    }

    Draws& draws_;
    double tolerance_;
    Part first_;
    Part second_;
    bool first_is_complex_;
    bool second_is_complex_;
    std::uint64_t nan_pattern_;
};

} // namespace

double RandomTolerances::next(Draws& draws) {
    if (draws.one_in(2)) {
        return recent_[0];
    }
    const double tolerance = draws.one_in(3) ? recent_[draws.below(4)] : random_tolerance(draws);
    std::rotate(recent_.begin(), recent_.end() - 1, recent_.end());
    recent_[0] = tolerance;
    return tolerance;
}

double random_tolerance(Draws& draws) {
    constexpr double infinity = std::numeric_limits<double>::infinity();
    static const double marks[] = {-0.25,    -10,    -1e300, infinity,    -infinity,
                                   1e300,    1e-300, 1e-46,  0x1p-150,    0x1.0000001p-150,
                                   0x1p-149, 0.5,    1e39,   std::nan("")};
    static const double limits[] = {0, 1, 23, 23.99999999, 24, 52, 53, 0x1p-150};
    const double fraction = draws.unit();
    switch (draws.below(16)) {
    case 0:
        return draws.one_in(2) ? 0.0 : -0.0;
    case 1:
        return draws.pick(marks);
    case 2:
        return nudged(draws, draws.pick(limits), 2);
    case 3:
        return static_cast<double>(static_cast<float>(24 - fraction * 0x1p-18));
    case 4:
    case 5:
        return draws.between(1, 60);
    case 6:
        return draws.between(1, 240) * 0.25;
    case 7:
        return fraction * 53;
    case 8:
        return fraction * 24;
    case 9:
        return 48 + fraction * 5;
    case 10:
        return 19 + fraction * 5;
    case 11:
    case 12:
    case 13:
        return 52 + fraction;
    default:
        return 23 + fraction;
    }
}

std::int32_t random_count(Draws& draws) {
    switch (draws.below(32)) {
    case 0:
        return draws.between(1, largest_count);
    case 1:
    case 2:
    case 3:
        return draws.between(1, 24);
    default:
        return draws.one_in(4) ? 1 : draws.between(1, 6);
    }
}

void draw_elements(Draws& draws, const double tolerance, const int first_id, const int second_id,
                   const bool hard, void* first, void* second) {
    PairWriter(draws, tolerance, first_id, second_id)
        .write_element(static_cast<unsigned char*>(first), static_cast<unsigned char*>(second),
                       hard);
}

void fill_arrays(Draws& draws, const double tolerance, const int first_id, const int second_id,
                 const std::int32_t count, void* first, void* second) {
    PairWriter writer(draws, tolerance, first_id, second_id);
    const std::size_t first_size = part_of(first_id).size * (is_complex(first_id) ? 2 : 1);
    const std::size_t second_size = part_of(second_id).size * (is_complex(second_id) ? 2 : 1);
    const bool all_easy = draws.one_in(6);
    const std::int32_t hard_position = draws.between(0, count - 1);
    for (std::int32_t i = 0; i < count; ++i) {
        const auto index = static_cast<std::size_t>(i);
        const bool hard = !all_easy && (i == hard_position || draws.one_in(24));
        writer.write_element(static_cast<unsigned char*>(first) + index * first_size,
                             static_cast<unsigned char*>(second) + index * second_size, hard);
    }
}

} // namespace oracle
