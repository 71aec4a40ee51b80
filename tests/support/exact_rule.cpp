#include "exact_rule.h"

#include <mpfr.h>

#include <cmath>
#include <stdexcept>

namespace exact_rule {
namespace {

// Enough digits for the difference of any two doubles or integers of 64 bits, which lie between
// 2^-1074 and 2^1024, and for that of a double and a small integer.
constexpr mpfr_prec_t all_digits = 2304;

// Enough digits for a value whose first 64 are wanted.
constexpr mpfr_prec_t many_digits = 256;

class Real {
  public:
    explicit Real(mpfr_prec_t precision) { mpfr_init2(value_, precision); }
    explicit Real(const Number& number) : Real(all_digits) {
        std::visit([this](const auto value) { set(value); }, number);
    }
    Real(const Real&) = delete;
    Real& operator=(const Real&) = delete;
    ~Real() { mpfr_clear(value_); }

    int sign() const { return mpfr_sgn(value_); }

    operator mpfr_ptr() { return value_; }
    operator mpfr_srcptr() const { return value_; }

  private:
    void set(std::int64_t value) { mpfr_set_sj(value_, value, MPFR_RNDN); }
    void set(std::uint64_t value) { mpfr_set_uj(value_, value, MPFR_RNDN); }
    void set(double value) { mpfr_set_d(value_, value, MPFR_RNDN); }

    mpfr_t value_ = {};
};

void must_be_exact(int rounding) {
    if (rounding != 0) {
        throw std::logic_error("the exact rule has rounded");
    }
}

// Made from two finite numbers.
struct Pair {
    Real larger = Real(all_digits); // its magnitude
    Real difference = Real(all_digits);
};

void set(Pair& pair, const Number& x, const Number& y) {
    const Real first(x);
    const Real second(y);
    mpfr_abs(pair.larger, mpfr_cmpabs(first, second) > 0 ? first : second, MPFR_RNDN);
    must_be_exact(mpfr_sub(pair.difference, first, second, MPFR_RNDN));
    mpfr_abs(pair.difference, pair.difference, MPFR_RNDN);
}

bool is_whole(double tolerance) {
    return std::trunc(tolerance) == tolerance;
}

bool within_whole(long shift, Pair& pair) {
    must_be_exact(mpfr_mul_2si(pair.larger, pair.larger, shift, MPFR_RNDN));
    return mpfr_less_p(pair.difference, pair.larger) != 0;
}

// 2^exponent is irrational, as the exponent is no whole number, and the quotient of the difference
// and the larger magnitude is rational: they are never equal, and enough digits show which is
// greater.
bool within_fractional(const Real& exponent, const Pair& pair) {
    for (mpfr_prec_t precision = 128;; precision *= 2) {
        Real low(precision);
        Real high(precision);
        mpfr_exp2(low, exponent, MPFR_RNDD);
        mpfr_exp2(high, exponent, MPFR_RNDU);
        mpfr_mul(low, low, pair.larger, MPFR_RNDD);
        mpfr_mul(high, high, pair.larger, MPFR_RNDU);
        if (mpfr_lessequal_p(pair.difference, low) != 0) {
            return true;
        }
        if (mpfr_greaterequal_p(pair.difference, high) != 0) {
            return false;
        }
    }
}

void set_exponent(Real& exponent, double tolerance, int digits) {
    mpfr_set_d(exponent, tolerance, MPFR_RNDN);
    must_be_exact(mpfr_sub_si(exponent, exponent, digits, MPFR_RNDN));
}

} // namespace

bool same(double tolerance, int digits, const Number& x, const Number& y) {
    const Real first(x);
    const Real second(y);
    if (mpfr_equal_p(first, second) != 0) {
        return true;
    }
    if (first.sign() * second.sign() <= 0 || !(tolerance > 0)) {
        return false;
    }
    if (tolerance >= digits) {
        return true;
    }
    if (mpfr_inf_p(first) != 0 || mpfr_inf_p(second) != 0) {
        return false;
    }
    Pair pair;
    set(pair, x, y);
    if (is_whole(tolerance)) {
        return within_whole(static_cast<long>(tolerance) - digits, pair);
    }
    Real exponent(all_digits);
    set_exponent(exponent, tolerance, digits);
    return within_fractional(exponent, pair);
}

double beyond_limit(double tolerance, int digits, const Number& x, const Number& y) {
    Pair pair;
    set(pair, x, y);
    Real share(many_digits);
    mpfr_div(share, pair.difference, pair.larger, MPFR_RNDN);
    if (tolerance > 0) {
        Real exponent(all_digits);
        set_exponent(exponent, tolerance, digits);
        Real limit(many_digits);
        mpfr_exp2(limit, exponent, MPFR_RNDN);
        mpfr_sub(share, share, limit, MPFR_RNDN);
    }
    return mpfr_get_d(share, MPFR_RNDN);
}

long double factor(double tolerance, int digits) {
    Real exponent(all_digits);
    set_exponent(exponent, tolerance, digits);
    Real result(many_digits);
    mpfr_exp2(result, exponent, MPFR_RNDN);
    return mpfr_get_ld(result, MPFR_RNDN);
}

} // namespace exact_rule
