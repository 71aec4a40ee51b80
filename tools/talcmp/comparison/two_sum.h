// The sum of two doubles without rounding.

#pragma once

namespace talcmp {

struct TwoSum {
    double sum;
    double error; // what rounding took from the sum; exact unless the sum overflows
};

inline TwoSum two_sum(const double a, const double b) {
    const double sum = a + b;
    const double b_part = sum - a;
    const double a_part = sum - b_part;
    return {sum, (a - a_part) + (b - b_part)};
}

} // namespace talcmp
