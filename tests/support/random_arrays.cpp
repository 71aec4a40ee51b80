#include "random_arrays.h"

#include "rounded_factor.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <type_traits>

namespace oracle {
namespace {

// ---- Reals

template <typename Real>
using BitsOf = std::conditional_t<sizeof(Real) == 4, std::uint32_t, std::uint64_t>;

template <typename Real>
Real from_bits(BitsOf<Real> bits) {
    Real value;
    std::memcpy(&value, &bits, sizeof value);
    return value;
}

template <typename Real>
constexpr int stored_digits = std::numeric_limits<Real>::digits - 1;

template <typename Real>
BitsOf<Real> random_significand(Random& random) {
    return static_cast<BitsOf<Real>>(random.bits() >> (64 - stored_digits<Real>));
}

template <typename Real>
Real random_subnormal(Random& random) {
    const int shift = random.between(0, stored_digits<Real> - 1);
    return from_bits<Real>(random_significand<Real>(random) >> shift);
}

// Bits, as a register may change those of a signalling NaN. Of random ones few are an infinity.
template <typename Real>
BitsOf<Real> nan_bits(std::uint64_t pattern) {
    constexpr auto ones = std::numeric_limits<BitsOf<Real>>::max();
    constexpr auto exponent =
        static_cast<BitsOf<Real>>((ones >> 1) << stored_digits<Real>) & (ones >> 1);
    return exponent | static_cast<BitsOf<Real>>(pattern >> (64 - 8 * sizeof(Real)));
}

template <typename Real>
Real moved(Real value, int ulps) {
    const Real goal = std::copysign(std::numeric_limits<Real>::infinity(), static_cast<Real>(ulps));
    for (int i = std::abs(ulps); i > 0; --i) {
        value = std::nextafter(value, goal);
    }
    return value;
}

// Draws after its argument, so that a seed means the same to every compiler.
template <typename Real>
Real nudged(Random& random, Real value, int most_ulps) {
    return moved(value, random.between(-most_ulps, most_ulps));
}

template <typename Real>
Real random_magnitude(Random& random) {
    using Limits = std::numeric_limits<Real>;
    static const Real marks[] = {Limits::denorm_min(), Limits::min(), Limits::max(),
                                 Limits::epsilon(), 1};
    static const int powers[] = {7, 8, 15, 16, 24, 31, 32, 53, 63, 64};
    const Real fraction = static_cast<Real>(random.unit());
    switch (random.below(16)) {
    case 0:
        return 0;
    case 1:
        return static_cast<Real>(random.between(0, 20));
    case 2:
        return nudged(random, std::ldexp(Real{1}, random.pick(powers)), 3);
    case 3:
        return random_subnormal<Real>(random);
    case 4:
        return nudged(random, random.pick(marks), 3);
    case 5:
        return Limits::max() * (1 - fraction / 2);
    case 6:
        return Limits::infinity();
    case 7:
        return Limits::quiet_NaN();
    case 8:
        return from_bits<Real>(static_cast<BitsOf<Real>>(random.bits()));
    case 9:
        return std::ldexp(1 + fraction, Limits::min_exponent + random.between(-20, 60));
    case 10:
        return nudged(random, Real{1}, 3);
    case 11:
    case 12:
        return (1 + fraction) / 2;
    case 13:
        return 1 + fraction;
    case 14:
        return fraction * 1000;
    default:
        return std::ldexp(1 + fraction, random.between(-40, 70));
    }
}

template <typename Real>
Real random_real(Random& random) {
    const Real magnitude = random_magnitude<Real>(random);
    return random.one_in(3) ? -magnitude : magnitude;
}

// ---- Integers

struct Integer {
    bool negative;
    std::uint64_t magnitude;
};

std::uint64_t low_bits(Integer value) {
    return value.negative ? 0 - value.magnitude : value.magnitude;
}

// A complex type is told by its part.
struct Part {
    bool is_real;
    bool is_signed;
    std::size_t size;
};

bool is_complex(int type_id) {
    return type_id >= 11;
}

Part part_of(int type_id) {
    static const Part parts[] = {
        {false, true, 1}, {false, false, 1}, {false, true, 2}, {false, false, 2},
        {false, true, 4}, {false, false, 4}, {false, true, 8}, {false, false, 8},
        {true, true, 4},  {true, true, 8},   {true, true, 4},  {true, true, 8},
    };
    return parts[type_id - 1];
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

// Lies midway between two reals of that many digits.
std::uint64_t random_tie(Random& random, int digits) {
    const std::uint64_t leading = std::uint64_t{1} << digits;
    const std::uint64_t tie = (random.bits() >> (63 - digits)) | leading | 1;
    return tie << random.between(0, 63 - digits);
}

std::uint64_t random_integer_magnitude(Random& random) {
    static const int powers[] = {7, 8, 15, 16, 24, 31, 32, 53, 63};
    const auto step = static_cast<std::uint64_t>(random.between(-2, 2));
    switch (random.below(8)) {
    case 0:
        return random.below(3);
    case 1:
        return random.below(20);
    case 2:
        return random.below(300);
    case 3:
        return ~std::uint64_t{0};
    case 4:
        return (std::uint64_t{1} << random.pick(powers)) + step;
    case 5:
        return random_tie(random, 24) + step;
    case 6:
        return random_tie(random, 53) + step;
    default:
        return random.bits() >> random.below(64);
    }
}

Integer random_integer(Random& random, Part part) {
    return fitted({random.one_in(2), random_integer_magnitude(random)}, part);
}

// A pattern that is near to the first, or looks like it.
std::uint64_t hard_pattern(Random& random, std::uint64_t first, std::uint32_t first_bits) {
    switch (random.below(6)) {
    case 0:
        return first;
    case 1:
        return first + 1;
    case 2:
        return first - 1;
    case 3:
        return 0 - first;
    case 4:
        return first ^ (std::uint64_t{1} << random.below(64));
    default:
        return first ^ (std::uint64_t{1} << random.below(first_bits));
    }
}

// ---- Memory

template <typename T>
void store(void* at, T value) {
    std::memcpy(at, &value, sizeof value);
}

void store_integer(void* at, Part part, std::uint64_t pattern) {
    switch (part.size) {
    case 1:
        return store(at, static_cast<std::uint8_t>(pattern));
    case 2:
        return store(at, static_cast<std::uint16_t>(pattern));
    case 4:
        return store(at, static_cast<std::uint32_t>(pattern));
    default:
        return store(at, pattern);
    }
}

// The share of the larger magnitude that two numbers may differ by: 0 asks for equality.
template <typename Real>
Real allowed_share(double tolerance) {
    constexpr int digits = std::numeric_limits<Real>::digits;
    const auto narrowed = static_cast<Real>(tolerance);
    if (!(narrowed > 0)) {
        return 0;
    }
    return narrowed >= digits ? Real{1} : rounded_factor(narrowed);
}

// Writes pairs of elements. An easy pair is meant to be the same, a hard one may be either.
class PairWriter {
  public:
    PairWriter(Random& random, double tolerance, int first_id, int second_id)
        : random_(random), tolerance_(tolerance), single_share_(allowed_share<float>(tolerance)),
          double_share_(allowed_share<double>(tolerance)), first_(part_of(first_id)),
          second_(part_of(second_id)), first_is_complex_(is_complex(first_id)),
          second_is_complex_(is_complex(second_id)), nan_pattern_(random.bits()) {}

    void write_element(unsigned char* first, unsigned char* second, bool hard) {
        const bool any_complex = first_is_complex_ || second_is_complex_;
        const std::uint32_t hard_parts = !hard ? 0 : any_complex ? 1 + random_.below(3) : 1;
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
    void write_parts(void* first, void* second, bool hard) {
        if (!first_.is_real && !second_.is_real) {
            write_integers(first, second, hard);
        } else if (is_wide(first_) || is_wide(second_)) {
            write_reals<double>(first, second, hard);
        } else {
            write_reals<float>(first, second, hard);
        }
    }

    void write_integers(void* first, void* second, bool hard) {
        const Integer value = random_integer(random_, first_);
        if (hard) {
            store_integer(first, first_, low_bits(value));
            const auto first_bits = static_cast<std::uint32_t>(8 * first_.size);
            store_integer(second, second_, hard_pattern(random_, low_bits(value), first_bits));
        } else {
            const std::uint64_t shared = low_bits(fitted(fitted(value, second_), first_));
            store_integer(first, first_, shared);
            store_integer(second, second_, shared);
        }
    }

    // The anchor goes to the narrower side, so that its partner can be any real of the width.
    template <typename Real>
    void write_reals(void* first, void* second, bool hard) {
        const bool either = holds<Real>(first_) && holds<Real>(second_);
        const bool second_has_anchor = either ? random_.one_in(2) : holds<Real>(first_);
        const Real anchor = second_has_anchor ? write_anchor<Real>(second, second_, hard)
                                              : write_anchor<Real>(first, first_, hard);
        const Real partner = hard ? hard_partner(anchor) : easy_partner(anchor);
        store_real(second_has_anchor ? first : second, partner, hard);
    }

    template <typename Real>
    Real write_anchor(void* at, Part part, bool hard) {
        if (part.is_real) {
            return part.size == 4 ? write_real_anchor<Real, float>(at, hard)
                                  : write_real_anchor<Real, double>(at, hard);
        }
        const Integer value = random_integer(random_, part);
        store_integer(at, part, low_bits(value));
        const auto magnitude = static_cast<Real>(value.magnitude);
        return value.negative ? -magnitude : magnitude;
    }

    // A NaN is the same as its copy only where bytes are compared.
    template <typename Real, typename Stored>
    Real write_real_anchor(void* at, bool hard) {
        auto value = random_real<Stored>(random_);
        while (!hard && tolerance_ != 0 && std::isnan(value)) {
            value = random_real<Stored>(random_);
        }
        store_real(at, value, hard);
        return static_cast<Real>(value);
    }

    // What arithmetic makes of a NaN's bits differs between platforms, so they are drawn. NaNs of
    // an easy pair have the same.
    template <typename Real>
    void store_real(void* at, Real value, bool hard) {
        if (!std::isnan(value)) {
            return store(at, value);
        }
        if (hard) {
            nan_pattern_ ^= std::uint64_t{1} << random_.below(64);
        }
        store(at, nan_bits<Real>(nan_pattern_));
    }

    template <typename Real>
    Real easy_partner(Real anchor) {
        if (!std::isfinite(anchor) || random_.one_in(2)) {
            return anchor;
        }
        return anchor - anchor * (share<Real>() * static_cast<Real>(random_.unit() / 2));
    }

    template <typename Real>
    Real hard_partner(Real anchor) {
        switch (random_.below(12)) {
        case 0:
        case 1:
        case 2:
        case 3:
        case 4:
            return limit_partner(anchor);
        case 5:
            return nudged(random_, anchor * (random_.one_in(2) ? Real{2} : Real{0.5}), 1);
        case 6:
        case 7:
            return scaled(anchor, between_half_and_share<Real>());
        case 8:
            return nudged(random_, anchor, 3);
        case 9:
            return random_.one_in(2) ? -anchor : std::copysign(Real{0}, anchor);
        case 10:
            return random_real<Real>(random_);
        default:
            return anchor;
        }
    }

    // Beside a large difference the partner is small and its last place is too fine to matter, so
    // that the difference is nudged as well.
    template <typename Real>
    Real limit_partner(Real anchor) {
        if (random_.one_in(2)) {
            return anchor - nudged(random_, anchor * share<Real>(), 2);
        }
        return nudged(random_, scaled(anchor, share<Real>()), 3);
    }

    // A number that differs by that share of the larger of the two.
    template <typename Real>
    Real scaled(Real anchor, Real share) {
        return random_.one_in(3) ? anchor / (1 - share) : anchor - anchor * share;
    }

    // Here the answer depends on the cache.
    template <typename Real>
    Real between_half_and_share() {
        return Real{0.5} + (share<Real>() - Real{0.5}) * static_cast<Real>(random_.unit());
    }

    void write_lone_imaginary(void* at, Part part, bool hard) {
        if (part.size == 4) {
            store_real(at, lone_imaginary<float>(hard), hard);
        } else {
            store_real(at, lone_imaginary<double>(hard), hard);
        }
    }

    template <typename Real>
    Real lone_imaginary(bool hard) {
        static const Real marks[] = {0, std::numeric_limits<Real>::denorm_min(),
                                     std::numeric_limits<Real>::min()};
        const Real magnitude = !hard               ? Real{0}
                               : random_.one_in(2) ? random_.pick(marks)
                                                   : random_magnitude<Real>(random_);
        return random_.one_in(2) ? -magnitude : magnitude;
    }

    template <typename Real>
    Real share() const {
        return sizeof(Real) == 4 ? static_cast<Real>(single_share_)
                                 : static_cast<Real>(double_share_);
    }

    template <typename Real>
    static bool holds(Part part) {
        return part.is_real && part.size == sizeof(Real);
    }

    static bool is_wide(Part part) { return holds<double>(part); }

    Random& random_;
    double tolerance_;
    float single_share_;
    double double_share_;
    Part first_;
    Part second_;
    bool first_is_complex_;
    bool second_is_complex_;
    std::uint64_t nan_pattern_;
};

} // namespace

double RandomTolerances::next(Random& random) {
    if (random.one_in(2)) {
        return recent_[0];
    }
    const double tolerance = random.one_in(3) ? recent_[random.below(4)] : random_tolerance(random);
    std::rotate(recent_.begin(), recent_.end() - 1, recent_.end());
    recent_[0] = tolerance;
    return tolerance;
}

double random_tolerance(Random& random) {
    constexpr double infinity = std::numeric_limits<double>::infinity();
    static const double marks[] = {-0.25,    -10,    -1e300, infinity,    -infinity,
                                   1e300,    1e-300, 1e-46,  0x1p-150,    0x1.0000001p-150,
                                   0x1p-149, 0.5,    1e39,   std::nan("")};
    static const double limits[] = {0, 1, 23, 23.99999999, 24, 52, 53, 0x1p-150};
    const double fraction = random.unit();
    switch (random.below(16)) {
    case 0:
        return random.one_in(2) ? 0.0 : -0.0;
    case 1:
        return random.pick(marks);
    case 2:
        return nudged(random, random.pick(limits), 2);
    case 3:
        return static_cast<double>(static_cast<float>(24 - fraction * 0x1p-18));
    case 4:
    case 5:
        return random.between(1, 60);
    case 6:
        return random.between(1, 240) * 0.25;
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

std::int32_t random_count(Random& random) {
    switch (random.below(32)) {
    case 0:
        return random.between(1, largest_count);
    case 1:
    case 2:
    case 3:
        return random.between(1, 24);
    default:
        return random.one_in(4) ? 1 : random.between(1, 6);
    }
}

void fill_arrays(Random& random, double tolerance, int first_id, int second_id, std::int32_t count,
                 void* first, void* second) {
    PairWriter writer(random, tolerance, first_id, second_id);
    const std::size_t first_size = part_of(first_id).size * (is_complex(first_id) ? 2 : 1);
    const std::size_t second_size = part_of(second_id).size * (is_complex(second_id) ? 2 : 1);
    const bool all_easy = random.one_in(6);
    const std::int32_t hard_position = random.between(0, count - 1);
    for (std::int32_t i = 0; i < count; ++i) {
        const auto index = static_cast<std::size_t>(i);
        const bool hard = !all_easy && (i == hard_position || random.one_in(24));
        writer.write_element(static_cast<unsigned char*>(first) + index * first_size,
                             static_cast<unsigned char*>(second) + index * second_size, hard);
    }
}

} // namespace oracle
