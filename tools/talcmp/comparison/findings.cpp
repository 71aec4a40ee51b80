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

void add(Totals& sum, const Totals& part) {
    sum.pairs += part.pairs;
    sum.differing += part.differing;
    for (std::size_t i = 0; i < sum.digits.size(); ++i) {
        sum.digits[i] += part.digits[i];
    }
    sum.needed_from_one = std::max(sum.needed_from_one, part.needed_from_one);
    sum.ignored += part.ignored;
    add(sum.largest, part.largest);
    add(sum.values1, part.values1);
    add(sum.values2, part.values2);
    const bool worse = part.worst_digits > sum.worst_digits;
    const bool as_bad = part.worst_digits == sum.worst_digits && part.worst.has_value();
    if (worse || (as_bad && part.worst->number < sum.worst->number)) {
        sum.worst_digits = part.worst_digits;
        sum.worst = part.worst;
    }
}

void add(Findings& sum, const Findings& findings) {
    sum.first.add(findings.first);
    add(sum.totals, findings.totals);
}

} // namespace talcmp
