#include "pair_counter.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace talcmp {
namespace {

FoundPair found_pair(const Pairs& stored, const std::size_t i, const std::uint64_t number,
                     const Sameness sameness) {
    FoundPair pair = talcmp::found_pair(stored, i, number);
    pair.sameness = sameness;
    return pair;
}

void add_counts(const DigitSearch::Result& found, Totals& totals) {
    for (std::size_t each = 0; each < found.count.size(); ++each) {
        if (found.count[each] != 0) {
            const Sameness sameness = found.sameness_of[each];
            totals.digits[static_cast<std::size_t>(sameness.digits())] += found.count[each];
            totals.needed_from_one = std::max(totals.needed_from_one, sameness.from_one());
        }
    }
}

int worst_digits(const DigitSearch::Result& found) {
    int worst = 0;
    for (std::size_t each = 0; each < found.count.size(); ++each) {
        if (found.count[each] != 0) {
            worst = std::max(worst, found.sameness_of[each].digits());
        }
    }
    return worst;
}

void add_worst(const Pairs& stored, const DigitSearch::Result& found,
               const PairCounter::Numbering& number, const bool in_order, Totals& totals) {
    Totals worst;
    worst.worst_digits = worst_digits(found);
    if (worst.worst_digits == 0 || worst.worst_digits < totals.worst_digits) {
        return;
    }
    if (in_order && worst.worst_digits == totals.worst_digits && totals.worst->number < number(0)) {
        return;
    }
    for (std::size_t i = 0; i < stored.count() && !(in_order && worst.worst); ++i) {
        if (sameness_of(found, i).digits() == worst.worst_digits
            && (!worst.worst || number(i) < worst.worst->number)) {
            worst.worst = found_pair(stored, i, number(i), sameness_of(found, i));
        }
    }
    add(totals, worst);
}

// Whether integers may be rounded where the module compares them with reals, and so be the same as
// others.
bool rounds_integers(const ElementType& type1, const ElementType& type2) {
    constexpr std::size_t bits_of_byte = 8;
    const ElementType& integer = is_integer(type1) ? type1 : type2;
    return is_integer(type1) != is_integer(type2)
           && integer.size * bits_of_byte > static_cast<std::size_t>(all_digits(type1, type2));
}

// Whether a number may differ from the other one of its pair. Where the module is asked about the
// stored pairs and rounds nothing, those that are the same under 0 do not.
bool may_differ(const Pairs& asked, const Pairs& stored, const DigitSearch::Result& found) {
    return asked.element1(0) != stored.element1(0) || worst_digits(found) != 0
           || rounds_integers(stored.type1(), stored.type2());
}

} // namespace

const DigitSearch::Result& PairCounter::add(const Pairs& asked, const Pairs& stored,
                                            const Numbering& number, const bool in_order,
                                            Findings& findings) {
    Totals& totals = findings.totals;
    const std::size_t count = stored.count();
    totals.pairs += count;
    talcmp::add(totals.values1, count_values(stored.type1().id, stored.element1(0), count));
    talcmp::add(totals.values2, count_values(stored.type2().id, stored.element2(0), count));
    const DigitSearch::Result& found = search_.search(asked);
    add_counts(found, totals);
    if (may_differ(asked, stored, found)) {
        meter_.add(stored, totals.largest);
    }
    add_differing(asked, stored, found, number, in_order, findings);
    add_worst(stored, found, number, in_order, totals);
    return found;
}

// Whether pairs of this sameness are the same under the tolerance. A pair that is the same under a
// tolerance of 1 or more is the same under every larger one. A pair that is the same under none of
// these can be the same only under 0.
PairCounter::Answer PairCounter::answer_on(const Sameness sameness) const {
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

void PairCounter::add_differing(const Pairs& asked, const Pairs& stored,
                                const DigitSearch::Result& found, const Numbering& number,
                                const bool in_order, Findings& findings) const {
    std::array<Answer, DigitSearch::class_count> answers = {};
    std::uint64_t to_be_asked = 0;
    std::uint64_t different = 0;
    for (std::size_t each = 0; each < answers.size(); ++each) {
        if (found.count[each] != 0) {
            answers[each] = answer_on(found.sameness_of[each]);
            to_be_asked += answers[each] == Answer::to_be_asked ? found.count[each] : 0;
            different += answers[each] == Answer::different ? found.count[each] : 0;
        }
    }
    if (to_be_asked != 0) {
        remember_factor_of(tolerance_);
    }
    findings.totals.differing += different;
    bool wanted = true;
    for (std::size_t i = 0; to_be_asked + (wanted ? different : 0) != 0; ++i) {
        const Answer answer = answers[found.class_of[i]];
        const bool to_ask = answer == Answer::to_be_asked;
        const bool differs = to_ask ? !asked.same(tolerance_, i) : answer == Answer::different;
        to_be_asked -= to_ask ? 1 : 0;
        different -= answer == Answer::different ? 1 : 0;
        findings.totals.differing += to_ask && differs ? 1 : 0;
        if (differs && wanted) {
            wanted = findings.first.add(found_pair(stored, i, number(i), sameness_of(found, i)))
                     || !in_order;
        }
    }
}

} // namespace talcmp
