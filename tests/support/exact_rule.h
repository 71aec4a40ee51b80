// What the tolerant comparison means, decided in exact arithmetic. It shares nothing with the
// module or the oracle, which both follow the steps of the rule and round where those steps round.

#ifndef TALNUMERICARRAY_TESTS_EXACT_RULE_H
#define TALNUMERICARRAY_TESTS_EXACT_RULE_H

#include <cstdint>
#include <variant>

namespace exact_rule {

// The exact value of a number, never a NaN. A single is exact in a double.
using Number = std::variant<std::int64_t, std::uint64_t, double>;

// Two numbers are the same when they are equal, or both nonzero, of one sign and nearer to each
// other than the limit, which is 2^(tolerance - digits) times the larger magnitude. A tolerance of
// 0 or less, or NaN, asks for equality; one of `digits` or more sets no limit. Under a smaller
// tolerance an infinity is the same only as itself.
bool same(double tolerance, int digits, const Number& x, const Number& y);

// (|x - y| - limit) / larger magnitude, to the nearest double: how far two finite numbers of one
// sign, not both zero, are beyond the limit. Negative within it. The tolerance must be below
// `digits`; where it asks for equality, the limit is 0.
double beyond_limit(double tolerance, int digits, const Number& x, const Number& y);

// 2^(tolerance - digits), to the nearest long double; for a finite tolerance.
long double factor(double tolerance, int digits);

} // namespace exact_rule

#endif
