#include "largest_differences.h"

#include "element_parts.h"
#include "two_sum.h"
#include "widest_vectors.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>

namespace talcmp {
namespace {

// Neither a NaN nor the quotient of two zeros is larger than anything.
void take(const double x, const double y, const double difference, LargestDifferences& largest) {
    const double larger = std::max(std::fabs(x), std::fabs(y));
    const double quotient =
        larger <= std::numeric_limits<double>::max() ? difference / larger : difference;
    largest.absolute = difference > largest.absolute ? difference : largest.absolute;
    largest.relative = quotient > largest.relative ? quotient : largest.relative;
}

constexpr std::size_t at_once = 512;

// Whether a pair among `at_once` may have a larger difference or quotient than the largest ones so
// far, which is found out without a division: a quotient above `largest.relative` has a difference
// above the product of that and the larger magnitude, and so not below that product rounded.
[[gnu::always_inline]] inline bool may_be_larger(const double* const x, const double* const y,
                                                 const LargestDifferences largest) {
    // Many numbers side by side, so that compilers make a loop of vector instructions.
    constexpr std::size_t lanes = 64;
    std::array<double, lanes> larger_ones = {};
    for (std::size_t i = 0; i < at_once; i += lanes) {
        for (std::size_t lane = 0; lane < lanes; ++lane) {
            const double magnitude1 = std::fabs(x[i + lane]);
            const double magnitude2 = std::fabs(y[i + lane]);
            const double larger = magnitude1 < magnitude2 ? magnitude2 : magnitude1;
            const double difference = std::fabs(x[i + lane] - y[i + lane]);
            const double by_quotient = difference < larger * largest.relative ? 0 : difference;
            const double found = difference > largest.absolute ? difference : by_quotient;
            larger_ones[lane] = found > larger_ones[lane] ? found : larger_ones[lane];
        }
    }
    return *std::max_element(larger_ones.begin(), larger_ones.end()) > 0;
}

struct AddReals {
    [[gnu::always_inline]] void operator()(const double* const x, const double* const y,
                                           const std::size_t count,
                                           LargestDifferences& largest) const {
        for (std::size_t begin = 0; begin < count; begin += at_once) {
            const std::size_t end = std::min(count, begin + at_once);
            if (end < begin + at_once || may_be_larger(x + begin, y + begin, largest)) {
                for (std::size_t i = begin; i < end; ++i) {
                    take(x[i], y[i], std::fabs(x[i] - y[i]), largest);
                }
            }
        }
    }
};

// The exact sum of x, -y and the rests, rounded once. What is left of the larger sum and the rests
// is rounded to an odd number, which keeps the last rounding from taking it for a tie (Boldo and
// Melquiond, Emulation of FMA and correctly rounded sums, 2008).
double difference_of_sums(const double x, const double y, const double rests) {
    const TwoSum whole = two_sum(x, -y);
    if (!std::isfinite(whole.sum)) {
        return whole.sum;
    }
    const TwoSum left = two_sum(whole.error, rests);
    double odd = left.sum;
    if (left.error != 0) {
        std::uint64_t bits = 0;
        std::memcpy(&bits, &odd, sizeof bits);
        if (bits % 2 == 0) {
            odd = std::nextafter(
                odd, std::copysign(std::numeric_limits<double>::infinity(), left.error));
        }
    }
    return whole.sum + odd;
}

void add_sums(const double* const x, const double* const x_rests, const double* const y,
              const double* const y_rests, const std::size_t count, LargestDifferences& largest) {
    for (std::size_t i = 0; i < count; ++i) {
        const double rests =
            (x_rests == nullptr ? 0 : x_rests[i]) - (y_rests == nullptr ? 0 : y_rests[i]);
        take(x[i], y[i], std::fabs(difference_of_sums(x[i], y[i], rests)), largest);
    }
}

} // namespace

void DifferenceMeter::add(const Pairs& pairs, LargestDifferences& largest) {
    add_part(pairs, 0, largest);
    if (is_complex(pairs.type1()) || is_complex(pairs.type2())) {
        add_part(pairs, 1, largest);
    }
}

void DifferenceMeter::add_part(const Pairs& pairs, const int part, LargestDifferences& largest) {
    const void* const elements1 = pairs.element1(0);
    const void* const elements2 = pairs.element2(0);
    const std::size_t count = pairs.count();
    const auto* const x = parts_of<double>(pairs.type1(), elements1, count, part, parts1_);
    const auto* const y = parts_of<double>(pairs.type2(), elements2, count, part, parts2_);
    const bool whole = part == 0;
    const double* const x_rests =
        whole ? rests_of(pairs.type1(), elements1, count, rests1_) : nullptr;
    const double* const y_rests =
        whole ? rests_of(pairs.type2(), elements2, count, rests2_) : nullptr;
    if (x_rests == nullptr && y_rests == nullptr) {
        in_widest_vectors(AddReals(), x, y, count, largest);
    } else {
        add_sums(x, x_rests, y, y_rests, count, largest);
    }
}

} // namespace talcmp
