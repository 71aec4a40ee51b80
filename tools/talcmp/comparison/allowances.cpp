#include "allowances.h"

#include "element_parts.h"
#include "two_sum.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstring>

namespace talcmp {
namespace {

// ---- Exact sums (Shewchuk, Adaptive precision floating-point arithmetic, 1997)

// The sign of the exact sum. Grows an expansion whose components do not overlap, in ascending order
// of magnitude: the last one that is not zero has the sign of all.
template <std::size_t count>
int sign_of_sum(const std::array<double, count>& terms) {
    std::array<double, count> expansion = {};
    for (std::size_t i = 0; i < count; ++i) {
        double carry = terms[i];
        for (std::size_t j = 0; j < i; ++j) {
            const TwoSum step = two_sum(carry, expansion[j]);
            carry = step.sum;
            expansion[j] = step.error;
        }
        expansion[i] = carry;
    }
    // From the end: a loop that keeps the last sign is miscompiled by GCC 12 at -O3.
    const auto last = std::find_if(expansion.rbegin(), expansion.rend(),
                                   [](const double component) { return component != 0; });
    return last == expansion.rend() ? 0 : *last > 0 ? 1 : -1;
}

// ---- Flags of pairs

void allow_nans(const double* const x, const double* const y, const std::size_t count,
                std::uint8_t* const allowed) {
    for (std::size_t i = 0; i < count; ++i) {
        allowed[i] = std::isnan(x[i]) && std::isnan(y[i]) ? 1 : 0;
    }
}

// Rounding is monotone and the error a double, so a rounded difference below or above the error
// says so of the exact one. Where it is equal to the error, rounding may have hidden which.
void allow_differences(const double* const x, const double* const y, const std::size_t count,
                       const double error, std::uint8_t* const allowed) {
    unsigned doubtful = 0;
    for (std::size_t i = 0; i < count; ++i) {
        const double difference = std::fabs(x[i] - y[i]);
        allowed[i] = difference < error ? 1 : allowed[i];
        doubtful |= static_cast<unsigned>(difference == error);
    }
    for (std::size_t i = 0; doubtful != 0 && i < count; ++i) {
        if (std::fabs(x[i] - y[i]) == error && is_within(x[i], 0, y[i], 0, error)) {
            allowed[i] = 1;
        }
    }
}

void allow_differences_of_sums(const double* const x, const double* const x_rests,
                               const double* const y, const double* const y_rests,
                               const std::size_t count, const double error,
                               std::uint8_t* const allowed) {
    for (std::size_t i = 0; i < count; ++i) {
        const double x_rest = x_rests == nullptr ? 0 : x_rests[i];
        const double y_rest = y_rests == nullptr ? 0 : y_rests[i];
        if (std::isfinite(x[i]) && std::isfinite(y[i])
            && is_within(x[i], x_rest, y[i], y_rest, error)) {
            allowed[i] = 1;
        }
    }
}

// Makes zeros of the allowed parts; an element that is not complex has the part 0 alone.
void clear_allowed(const std::vector<std::uint8_t>& allowed, const ElementType& type,
                   const int part, void* const elements, const std::size_t count) {
    if (part == 1 && !is_complex(type)) {
        return;
    }
    auto* const first =
        static_cast<unsigned char*>(elements) + static_cast<std::size_t>(part) * type.part_size;
    for (std::size_t i = 0; i < count; ++i) {
        if (allowed[i] != 0) {
            std::memset(first + i * type.size, 0, type.part_size);
        }
    }
}

} // namespace

bool is_within(const double x, const double x_rest, const double y, const double y_rest,
               const double error) {
    const double difference = (x - y) + (x_rest - y_rest);
    // The rests, where there are any, are at most 2^11, and errors of the sum below 2^-50 of it and
    // of them.
    const double margin = std::fabs(x - y) * 0x1p-50 + 0x1p-38;
    if (!(std::fabs(difference) <= error + margin)) {
        return false; // also if it overflows
    }
    if (std::fabs(difference) < error - margin) {
        return true;
    }
    return sign_of_sum<5>({x, -y, x_rest, -y_rest, -error}) <= 0
           && sign_of_sum<5>({x, -y, x_rest, -y_rest, error}) >= 0;
}

void Allowances::apply(const ElementType& type1, void* const elements1, const ElementType& type2,
                       void* const elements2, const std::size_t count) {
    apply_to_part(0, type1, elements1, type2, elements2, count);
    if (is_complex(type1) || is_complex(type2)) {
        apply_to_part(1, type1, elements1, type2, elements2, count);
    }
}

void Allowances::apply_to_part(const int part, const ElementType& type1, void* const elements1,
                               const ElementType& type2, void* const elements2,
                               const std::size_t count) {
    const auto* const x = parts_of<double>(type1, elements1, count, part, parts1_);
    const auto* const y = parts_of<double>(type2, elements2, count, part, parts2_);
    allowed_.assign(count, 0);
    if (equal_nan_) {
        allow_nans(x, y, count, allowed_.data());
    }
    if (absolute_) {
        const bool whole = part == 0;
        const double* const x_rests = whole ? rests_of(type1, elements1, count, rests1_) : nullptr;
        const double* const y_rests = whole ? rests_of(type2, elements2, count, rests2_) : nullptr;
        if (x_rests == nullptr && y_rests == nullptr) {
            allow_differences(x, y, count, *absolute_, allowed_.data());
        } else {
            allow_differences_of_sums(x, x_rests, y, y_rests, count, *absolute_, allowed_.data());
        }
    }
    clear_allowed(allowed_, type1, part, elements1, count);
    clear_allowed(allowed_, type2, part, elements2, count);
}

} // namespace talcmp
