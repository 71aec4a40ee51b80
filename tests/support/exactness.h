// Where the steps of the tolerant comparison and its meaning disagree on random pairs, and how far
// from the limit they may.

#pragma once

#include "compare.h"
#include "exact_rule.h"
#include "limit_pairs.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <sstream>
#include <string>
#include <type_traits>
#include <utility>

namespace exactness {

// ---- The meaning, quickly

// The exact rule, evaluated exactly only where `Wide` cannot decide.
//
// Where `Wide` holds both numbers and the exponents of all results, the limit is rounded twice and
// the difference once, each by at most half of epsilon: if they are computed to be further apart
// than 16 epsilon, their order is the exact one.
template <typename Wide>
class QuickRule {
  public:
    QuickRule(const double tolerance, const int digits)
        : tolerance_(tolerance), digits_(digits), bounded_(tolerance > 0 && tolerance < digits),
          factor_(bounded_ ? static_cast<Wide>(exact_rule::factor(tolerance, digits)) : 0) {}

    // 0 where the tolerance has none.
    double factor() const { return static_cast<double>(factor_); }

    template <typename X, typename Y>
    bool same(const X x, const Y y) const {
        if constexpr (holds<X> && holds<Y>) {
            const auto wide_x = static_cast<Wide>(x);
            const auto wide_y = static_cast<Wide>(y);
            const Wide larger = std::max(std::fabs(wide_x), std::fabs(wide_y));
            const Wide difference = std::fabs(wide_x - wide_y);
            const Wide limit = larger * factor_;
            const bool has_limit = bounded_ && wide_x != 0 && wide_y != 0
                                   && (wide_x < 0) == (wide_y < 0) && std::isfinite(larger);
            if (has_limit && std::fabs(difference - limit) > limit * margin) {
                return difference < limit;
            }
        }
        return exact_rule::same(tolerance_, digits_, x, y);
    }

  private:
    using wide_limits = std::numeric_limits<Wide>;
    static constexpr Wide margin = 16 * wide_limits::epsilon();

    template <typename X>
    static constexpr bool holds = wide_limits::digits >= std::numeric_limits<X>::digits
                                                             + (std::is_integral_v<X> ? 0 : 11)
                                  && wide_limits::min_exponent
                                         <= std::numeric_limits<X>::min_exponent
                                                - 2 * std::numeric_limits<X>::digits;

    double tolerance_;
    int digits_;
    bool bounded_;
    Wide factor_;
};

// ---- The steps

// Whether the comparing thread remembers the factor of the tolerance. Only a pair that differs in
// its leading digit can show it.
enum class Factor { remembered, forgotten };

// Compares a near pair, which needs the factor, under the tolerance or under another.
template <typename T>
void prepare(const Factor factor, const T tolerance) {
    const T other = tolerance == 1 ? T{2} : T{1};
    nesk::compare(factor == Factor::remembered ? tolerance : other, T{1},
                  T{1} + std::numeric_limits<T>::epsilon());
}

// ---- How far from the limit the two may part

template <typename T>
Kind kind_of(const T tolerance) {
    constexpr int digits = std::numeric_limits<T>::digits;
    return !(tolerance > 0)                     ? Kind::none
           : tolerance >= digits                ? Kind::all
           : tolerance > digits - 1             ? Kind::last_digit
           : std::trunc(tolerance) == tolerance ? Kind::whole
                                                : Kind::fractional;
}

// Shares of the larger magnitude. The steps are stricter than the meaning where they call different
// what it calls the same, and laxer where they do the reverse.
struct Bounds {
    double stricter;
    double laxer;
};

// Let u be 2^-digits, M the larger magnitude, d the difference, L the exact factor and f the
// computed one.
//
// The difference: below M/2 it is exact, by Sterbenz. At M/2 or above it may be rounded, by u d,
// but not to below M/2: M/2 is a number of the type, or else M is subnormal and d exact. Hence the
// early exit decides exactly, and under an f of at most 1/2 no pair that differs by M/2 or more is
// the same, as it should be. A smaller number that vanishes is at most u M, and no limit below M is
// that near to M.
//
// Whole tolerances: f is L, a power of two. A magnitude of at least 1 is multiplied by f, or a
// difference below 1 divided by f; both stay within the range in which such a scaling is exact. The
// steps and the meaning agree.
//
// Fractional tolerances: f is L(1 + e) with e at most 2u, as pow is within 1 ulp of a power between
// 1 and 2, and shifting that power is exact. The product f M, or the quotient d / f, is rounded,
// but never across the number of the type that it is compared with, so rounding can only make a
// pair different. It does so within u of the limit or, as the quotient of a subnormal M is
// subnormal too, within half the smallest number. Together: laxer by at most 2u of L; stricter by
// at most 3u or, for a subnormal M, 2u and half the smallest number as a share of M. From a
// tolerance of `digits` - 1 on, the rounding of d adds u to both.
//
// Rounding the tolerance first moves L. Rounding an integer moves d - L M by no more than it moves
// the integer, which is at most u M.
template <typename T, typename X>
Bounds bounds(const double tolerance, const double limit, const T larger) {
    constexpr double u = std::numeric_limits<T>::epsilon() / 2;
    constexpr double second_order = 1 + 0x1p-20;
    const auto given = static_cast<T>(tolerance);
    const Kind kind = kind_of(given);
    const double rounded_by = limit > 0 ? static_cast<double>(given) - tolerance : 0;
    const double shift = limit * std::fabs(std::expm1(rounded_by * std::log(2.0)));
    const double integer = std::is_integral_v<X> ? u : 0;
    const double common = (shift + integer) * second_order;
    if (kind != Kind::fractional && kind != Kind::last_digit) {
        return {common, common};
    }
    const bool is_subnormal = larger < std::numeric_limits<T>::min();
    const double scaling = is_subnormal ? std::numeric_limits<T>::denorm_min() / (2.0 * larger) : u;
    const double difference = kind == Kind::last_digit ? u : 0;
    return {common + limit * (2 * u + scaling + difference) * second_order,
            common + limit * (2 * u + difference) * second_order};
}

// ---- Pairs, judged both ways

struct Tally {
    std::uint64_t pairs = 0;
    std::uint64_t stricter = 0;
    std::uint64_t laxer = 0;
    // Beyond or within the limit; see `Survey`.
    double furthest_stricter = 0;
    double furthest_laxer = 0;
    // Disagreements that the bounds do not allow, and the first such pair.
    std::uint64_t unexplained = 0;
    std::string first_unexplained;
};

// The pairs of an `X`, which is a `T` or an integer, and a `T`, under one tolerance. How far from
// the limit the steps and the meaning disagree is counted as a share of the limit or, for integers,
// of the larger magnitude: they may disagree under a tolerance of none too, which sets no limit.
template <typename X, typename T>
class Survey {
  public:
    Survey(const double tolerance, const Factor factor)
        : tolerance_(tolerance), given_(static_cast<T>(tolerance)), kind_(kind_of(given_)),
          factor_(factor), meaning_(tolerance, digits), limit_(meaning_.factor()) {}

    double limit() const { return limit_; }

    void judge(const X x, const T y, Tally& tally) const {
        ++tally.pairs;
        const bool meant = meaning_.same(x, y);
        prepare(factor_, given_);
        const bool found = nesk::compare(tolerance_, x, y) == 0;
        prepare(factor_, given_);
        const bool swapped = nesk::compare(tolerance_, y, x) == 0;
        if (found != swapped || (found && leaves_early(static_cast<T>(x), y))) {
            report("of the steps", x, y, tally);
        } else if (found != meant) {
            count(found, x, y, tally);
        }
    }

    // The quick rule against the exact one.
    void verify(const X x, const T y, Tally& tally) const {
        if (meaning_.same(x, y) != exact_rule::same(tolerance_, digits, x, y)) {
            report("of the quick rule", x, y, tally);
        }
    }

  private:
    static constexpr int digits = std::numeric_limits<T>::digits;
    using Wide = std::conditional_t<std::is_same_v<X, float>, double, long double>;

    // Doubling the smaller number is exact, or gives infinity.
    bool leaves_early(const T x, const T y) const {
        const T larger = std::max(std::fabs(x), std::fabs(y));
        const T smaller = std::min(std::fabs(x), std::fabs(y));
        return kind_ == Kind::last_digit && factor_ == Factor::forgotten && x != y
               && smaller + smaller <= larger;
    }

    void count(const bool found, const X x, const T y, Tally& tally) const {
        const auto rounded = static_cast<T>(x);
        const T larger = std::max(std::fabs(rounded), std::fabs(y));
        const bool unlimited = found ? kind_ == Kind::all : leaves_early(rounded, y);
        ++(found ? tally.laxer : tally.stricter);
        if (!std::isfinite(larger)) {
            if (!unlimited) {
                report("at infinity", x, y, tally);
            }
            return;
        }
        const double distance = std::fabs(exact_rule::beyond_limit(tolerance_, digits, x, y));
        const Bounds allowed = bounds<T, X>(tolerance_, limit_, larger);
        const bool within = distance <= (found ? allowed.laxer : allowed.stricter);
        if (!unlimited && !within) {
            report("too far from the limit", x, y, tally);
        }
        double& furthest = found ? tally.furthest_laxer : tally.furthest_stricter;
        furthest = std::max(furthest, std::is_integral_v<X> ? distance : distance / limit_);
    }

    void report(const char* what, const X x, const T y, Tally& tally) const {
        if (tally.unexplained++ == 0) {
            std::ostringstream text;
            text << what << ": tolerance " << std::hexfloat << tolerance_ << ", " << x << " and "
                 << y << ", the factor is "
                 << (factor_ == Factor::remembered ? "remembered" : "forgotten");
            tally.first_unexplained = text.str();
        }
    }

    double tolerance_;
    T given_;
    Kind kind_;
    Factor factor_;
    QuickRule<Wide> meaning_;
    double limit_;
};

} // namespace exactness
