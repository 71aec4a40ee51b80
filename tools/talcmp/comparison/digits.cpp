#include "digits.h"

#include <algorithm>
#include <array>
#include <limits>
#include <numeric>

namespace talcmp {
namespace {

// Below it the pairs are asked about one by one.
constexpr std::size_t shortest_stretch = 32;

// Kinds of pairs are those of their groups and, behind them, one for each sameness.
using Kind = DigitSearch::Kind;

constexpr Kind kind_of(const bool at_zero, const int from_one) {
    return static_cast<Kind>(DigitGroups::count + (at_zero ? more_than_all_digits : 0) + from_one
                             - 1);
}

constexpr Kind kind_of_same_under_all = kind_of(true, 1);
static_assert(kind_of(true, more_than_all_digits) < DigitSearch::kind_count);

bool has_singles(const ElementType& type) {
    return !is_integer(type) && type.part_size == sizeof(float);
}

// Whether the elements are equal and no NaNs, and so the same under every tolerance.
bool all_same(const Pairs& pairs, const std::size_t begin, const std::size_t count) {
    return pairs.same(0, begin, count) && pairs.same(1, begin, count);
}

} // namespace

int all_digits(const ElementType& type1, const ElementType& type2) {
    const bool as_singles = (has_singles(type1) && (has_singles(type2) || is_integer(type2)))
                            || (is_integer(type1) && has_singles(type2));
    return as_singles ? std::numeric_limits<float>::digits : most_digits;
}

Sameness sameness_of(const Pairs& pairs, const std::size_t i) {
    int lowest = 1;
    int highest = more_than_all_digits;
    while (lowest < highest) {
        const int middle = (lowest + highest) / 2;
        if (pairs.same(middle, i)) {
            highest = middle;
        } else {
            lowest = middle + 1;
        }
    }
    return {pairs.same(0, i), lowest};
}

DigitSearch::DigitSearch() {
    for (int from_one = 1; from_one <= more_than_all_digits; ++from_one) {
        for (const bool at_zero : {false, true}) {
            result_.sameness_of[kind_of(at_zero, from_one)] = Sameness(at_zero, from_one);
        }
    }
}

const DigitSearch::Result& DigitSearch::search(const Pairs& pairs) {
    open_.clear();
    result_.count.fill(0);
    result_.kind_of.resize(pairs.count());
    const bool same = all_same(pairs, 0, pairs.count());
    if (!same && groups_.sort(pairs, result_.kind_of.data())) {
        answer_groups(pairs);
    } else {
        std::fill(result_.kind_of.begin(), result_.kind_of.end(), kind_of_same_under_all);
        result_.count[kind_of_same_under_all] = pairs.count();
        if (!same) {
            set_aside_same(pairs, 0, pairs.count());
        }
    }
    ask_about_open(pairs);
    return result_;
}

// Asks about one pair of each group; those that are in doubt go to `open_`.
void DigitSearch::answer_groups(const Pairs& pairs) {
    std::array<std::size_t, kind_count> example = {};
    for (std::size_t i = 0; i < pairs.count(); ++i) {
        const Kind group = result_.kind_of[i];
        example[group] = i;
        ++result_.count[group];
    }
    for (std::size_t group = 0; group < DigitGroups::count; ++group) {
        if (result_.count[group] != 0 && group != DigitGroups::doubtful) {
            result_.sameness_of[group] = talcmp::sameness_of(pairs, example[group]);
        }
    }
    for (std::size_t i = 0; open_.size() < result_.count[DigitGroups::doubtful]; ++i) {
        if (result_.kind_of[i] == DigitGroups::doubtful) {
            open_.push_back(static_cast<std::uint32_t>(i));
        }
    }
}

// Moves the pairs that are not the same, and few others, to `open_`.
void DigitSearch::set_aside_same(const Pairs& pairs, const std::size_t begin,
                                 const std::size_t count) {
    if (all_same(pairs, begin, count)) {
        return;
    }
    if (count > shortest_stretch) {
        set_aside_same(pairs, begin, count / 2);
        set_aside_same(pairs, begin + count / 2, count - count / 2);
        return;
    }
    for (std::size_t i = begin; i < begin + count; ++i) {
        open_.push_back(static_cast<std::uint32_t>(i));
    }
}

void DigitSearch::ask_about_open(const Pairs& pairs) {
    rest_.resize(open_.size());
    settle(pairs, open_.data(), open_.data() + open_.size(), 1, more_than_all_digits);
}

// Finds the smallest tolerance of each pair, which is known to be from `lowest` to `highest`. All
// pairs are asked about under one tolerance before the next, so that its factor is made once. From
// one whole tolerance to the next no pair that is the same stops being so.
void DigitSearch::settle(const Pairs& pairs, std::uint32_t* const begin, std::uint32_t* const end,
                         const int lowest, const int highest) {
    if (begin == end || lowest == highest) {
        seen_[static_cast<std::size_t>(lowest)] += static_cast<std::uint64_t>(end - begin);
        std::for_each(begin, end, [&](const std::uint32_t i) {
            const Kind kind = kind_of(pairs.same(0, i), lowest);
            --result_.count[result_.kind_of[i]];
            ++result_.count[kind];
            result_.kind_of[i] = kind;
        });
        return;
    }
    const int tolerance = best_question(lowest, highest);
    std::uint32_t* same = begin;
    std::uint32_t* different = rest_.data();
    for (const std::uint32_t* i = begin; i != end; ++i) {
        const std::uint32_t index = *i;
        const bool is_same = pairs.same(tolerance, index);
        *same = index;
        *different = index;
        same += is_same ? 1 : 0;
        different += is_same ? 0 : 1;
    }
    std::copy(rest_.data(), different, same);
    settle(pairs, begin, same, lowest, tolerance);
    settle(pairs, same, end, tolerance + 1, highest);
}

// The tolerance that halves the pairs, if they are like those seen before: then pairs that differ
// in usual numbers of digits take few questions.
int DigitSearch::best_question(const int lowest, const int highest) const {
    const auto* const first = seen_.data() + lowest;
    const auto* const last = seen_.data() + highest;
    const std::uint64_t options = static_cast<std::uint64_t>(highest - lowest) + 1;
    const std::uint64_t total = std::accumulate(first, last + 1, options);
    std::uint64_t below = 0;
    int tolerance = lowest;
    for (const auto* seen = first; seen != last - 1; ++seen, ++tolerance) {
        below += *seen + 1;
        if (2 * below >= total) {
            break;
        }
    }
    return tolerance;
}

} // namespace talcmp
