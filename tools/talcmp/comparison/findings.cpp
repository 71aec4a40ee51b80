#include "findings.h"

#include <algorithm>

namespace talcmp {

std::optional<int> smallest_tolerance(const Totals& totals, const int all_digits) {
    if (totals.digits[0] == totals.pairs) {
        return 0;
    }
    if (totals.needed_from_one >= all_digits) {
        return std::nullopt;
    }
    return totals.needed_from_one;
}

void add(Totals& sum, const Totals& totals) {
    sum.pairs += totals.pairs;
    sum.differing += totals.differing;
    for (std::size_t i = 0; i < sum.digits.size(); ++i) {
        sum.digits[i] += totals.digits[i];
    }
    sum.needed_from_one = std::max(sum.needed_from_one, totals.needed_from_one);
    add(sum.values1, totals.values1);
    add(sum.values2, totals.values2);
    const bool worse = totals.worst_digits > sum.worst_digits;
    const bool as_bad = totals.worst_digits == sum.worst_digits && totals.worst.has_value();
    if (worse || (as_bad && totals.worst->number < sum.worst->number)) {
        sum.worst_digits = totals.worst_digits;
        sum.worst = totals.worst;
    }
}

void add(Findings& sum, const Findings& findings) {
    sum.first.add(findings.first);
    add(sum.totals, findings.totals);
}

} // namespace talcmp
