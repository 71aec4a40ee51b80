#include "largest_differences.h"

#include "element_parts.h"

#include <array>
#include <cmath>
#include <cstddef>
#include <limits>

namespace talcmp {
namespace {

// Without branches; neither a NaN nor the quotient of two zeros is larger than anything.
[[gnu::always_inline]] inline void take(const double x, const double y, const double difference,
                                        double& absolute, double& relative) {
    const double magnitude1 = std::fabs(x);
    const double magnitude2 = std::fabs(y);
    const double larger = magnitude1 < magnitude2 ? magnitude2 : magnitude1;
    const double quotient =
        larger <= std::numeric_limits<double>::max() ? difference / larger : difference;
    absolute = difference > absolute ? difference : absolute;
    relative = quotient > relative ? quotient : relative;
}

[[gnu::always_inline]] inline LargestDifferences
measure_here(const double* const x, const double* const y, const std::size_t count) {
    // Numbers side by side, so that compilers make vector instructions of them.
    constexpr std::size_t lanes = 8;
    std::array<double, lanes> absolute = {};
    std::array<double, lanes> relative = {};
    std::size_t i = 0;
    for (; i + lanes <= count; i += lanes) {
        for (std::size_t lane = 0; lane < lanes; ++lane) {
            const std::size_t each = i + lane;
            take(x[each], y[each], std::fabs(x[each] - y[each]), absolute[lane], relative[lane]);
        }
    }
    for (; i < count; ++i) {
        take(x[i], y[i], std::fabs(x[i] - y[i]), absolute[0], relative[0]);
    }
    return {*std::max_element(absolute.begin(), absolute.end()),
            *std::max_element(relative.begin(), relative.end())};
}

#if defined(__x86_64__)

[[gnu::target("avx2")]] LargestDifferences
measure_by_avx2(const double* const x, const double* const y, const std::size_t count) {
    return measure_here(x, y, count);
}

LargestDifferences measure_reals(const double* const x, const double* const y,
                                 const std::size_t count) {
    if (static_cast<bool>(__builtin_cpu_supports("avx2"))) {
        return measure_by_avx2(x, y, count);
    }
    return measure_here(x, y, count);
}

#else

LargestDifferences measure_reals(const double* const x, const double* const y,
                                 const std::size_t count) {
    return measure_here(x, y, count);
}

#endif

LargestDifferences measure_sums(const double* const x, const double* const x_rests,
                                const double* const y, const double* const y_rests,
                                const std::size_t count) {
    LargestDifferences largest;
    for (std::size_t i = 0; i < count; ++i) {
        const double rests =
            (x_rests == nullptr ? 0 : x_rests[i]) - (y_rests == nullptr ? 0 : y_rests[i]);
        take(x[i], y[i], std::fabs((x[i] - y[i]) + rests), largest.absolute, largest.relative);
    }
    return largest;
}

} // namespace

LargestDifferences DifferenceMeter::measure(const Pairs& pairs) {
    LargestDifferences largest = measure_part(pairs, 0);
    if (is_complex(pairs.type1()) || is_complex(pairs.type2())) {
        add(largest, measure_part(pairs, 1));
    }
    return largest;
}

LargestDifferences DifferenceMeter::measure_part(const Pairs& pairs, const int part) {
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
    return x_rests == nullptr && y_rests == nullptr ? measure_reals(x, y, count)
                                                    : measure_sums(x, x_rests, y, y_rests, count);
}

} // namespace talcmp
