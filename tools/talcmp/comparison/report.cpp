#include "report.h"

#include <algorithm>
#include <cmath>

namespace talcmp {

std::optional<int> smallest_tolerance(const Report& report, const int all_digits) {
    if (report.digits[0] == report.pairs) {
        return 0;
    }
    if (report.needed_from_one >= all_digits) {
        return std::nullopt;
    }
    return report.needed_from_one;
}

void add(Report& sum, const Report& report) {
    sum.pairs += report.pairs;
    sum.differing += report.differing;
    for (std::size_t i = 0; i < sum.digits.size(); ++i) {
        sum.digits[i] += report.digits[i];
    }
    sum.needed_from_one = std::max(sum.needed_from_one, report.needed_from_one);
    add(sum.values1, report.values1);
    add(sum.values2, report.values2);
    const bool worse = report.worst_digits > sum.worst_digits;
    const bool as_bad = report.worst_digits == sum.worst_digits && report.worst_place.has_value();
    if (worse || (as_bad && report.worst_place->order < sum.worst_place->order)) {
        sum.worst_digits = report.worst_digits;
        sum.worst_place = report.worst_place;
    }
}

void Reporter::add(const Pairs& pairs, const PlaceMaker& place, const bool in_order,
                   FirstPlaces& first) {
    report_.pairs += pairs.count();
    talcmp::add(report_.values1, count_values(pairs.type1().id, pairs.element1(0), pairs.count()));
    talcmp::add(report_.values2, count_values(pairs.type2().id, pairs.element2(0), pairs.count()));
    const DigitSearch::Result& found = search_.search(pairs);
    add_counts(found);
    add_differing(pairs, found, place, in_order, first);
    add_worst(found, place, in_order);
}

void Reporter::add_counts(const DigitSearch::Result& found) {
    for (std::size_t kind = 0; kind < found.count.size(); ++kind) {
        if (found.count[kind] != 0) {
            const Sameness sameness = found.sameness_of[kind];
            report_.digits[static_cast<std::size_t>(sameness.digits())] += found.count[kind];
            report_.needed_from_one = std::max(report_.needed_from_one, sameness.from_one());
        }
    }
}

// Whether pairs of such a sameness are the same under the tolerance. No tolerance from 1 on takes a
// sameness away that a smaller one grants; what is the same under none of them is under no smaller
// one but 0.
Reporter::Answer Reporter::answer_of(const Sameness sameness) const {
    if (tolerance_ == 0) {
        return sameness.at_zero() ? Answer::same : Answer::different;
    }
    if (sameness == same_under_all) {
        return Answer::same;
    }
    const talreal whole =
        tolerance_ < 1 ? 0 : std::floor(std::min<talreal>(tolerance_, most_digits));
    if (sameness.from_one() <= whole) {
        return Answer::same;
    }
    const bool between = tolerance_ < most_digits && tolerance_ != whole;
    return between && sameness.from_one() == whole + 1 ? Answer::to_be_asked : Answer::different;
}

void Reporter::add_differing(const Pairs& pairs, const DigitSearch::Result& found,
                             const PlaceMaker& place, const bool in_order, FirstPlaces& first) {
    std::array<Answer, DigitSearch::kind_count> answers = {};
    std::uint64_t to_be_asked = 0;
    std::uint64_t different = 0;
    for (std::size_t kind = 0; kind < answers.size(); ++kind) {
        if (found.count[kind] != 0) {
            answers[kind] = answer_of(found.sameness_of[kind]);
            to_be_asked += answers[kind] == Answer::to_be_asked ? found.count[kind] : 0;
            different += answers[kind] == Answer::different ? found.count[kind] : 0;
        }
    }
    if (to_be_asked != 0) {
        remember_factor_of(tolerance_);
    }
    report_.differing += different;
    bool wanted = true;
    for (std::size_t i = 0; to_be_asked + (wanted ? different : 0) != 0; ++i) {
        const Answer answer = answers[found.kind_of[i]];
        const bool asked = answer == Answer::to_be_asked;
        const bool differs = asked ? !pairs.same(tolerance_, i) : answer == Answer::different;
        to_be_asked -= asked ? 1 : 0;
        different -= answer == Answer::different ? 1 : 0;
        report_.differing += asked && differs ? 1 : 0;
        if (differs && wanted) {
            wanted = first.add(place(i)) || !in_order;
        }
    }
}

void Reporter::add_worst(const DigitSearch::Result& found, const PlaceMaker& place,
                         const bool in_order) {
    Report worst;
    for (std::size_t kind = 0; kind < found.count.size(); ++kind) {
        if (found.count[kind] != 0) {
            worst.worst_digits = std::max(worst.worst_digits, found.sameness_of[kind].digits());
        }
    }
    if (worst.worst_digits == 0 || worst.worst_digits < report_.worst_digits) {
        return;
    }
    if (in_order && worst.worst_digits == report_.worst_digits
        && report_.worst_place->order < place(0).order) {
        return;
    }
    for (std::size_t i = 0; i < found.kind_of.size() && !(in_order && worst.worst_place); ++i) {
        if (found.sameness_of[found.kind_of[i]].digits() == worst.worst_digits) {
            const Place next = place(i);
            if (!worst.worst_place || next.order < worst.worst_place->order) {
                worst.worst_place = next;
            }
        }
    }
    talcmp::add(report_, worst);
}

} // namespace talcmp
