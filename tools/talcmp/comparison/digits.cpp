#include "digits.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <functional>
#include <limits>

namespace talcmp {
namespace {

// Shorter stretches are asked about pair by pair.
constexpr std::size_t shortest_stretch = 32;

// Classes of pairs are their groups and, after those, one for each sameness.
using Class = DigitSearch::Class;

constexpr Class class_of(const Sameness sameness) {
    return static_cast<Class>(DigitGroups::count + sameness.from_one() - 1
                              + (sameness.at_zero() ? more_than_all_digits : 0));
}

static_assert(class_of({true, more_than_all_digits}) < DigitSearch::class_count);

bool has_singles(const ElementType& type) {
    return !is_integer(type) && type.part_size == sizeof(float);
}

// Whether the elements are equal and not NaNs, and so the same under every tolerance.
bool all_same(const Pairs& pairs, const std::size_t begin, const std::size_t count) {
    return pairs.same(0, begin, count) && pairs.same(1, begin, count);
}

} // namespace

int all_digits(const ElementType& type1, const ElementType& type2) {
    const bool as_singles = (has_singles(type1) && (has_singles(type2) || is_integer(type2)))
                            || (is_integer(type1) && has_singles(type2));
    return as_singles ? std::numeric_limits<float>::digits : most_digits;
}

talreal tolerance_for(const Question& question, const ElementType& type1,
                      const ElementType& type2) {
    return question.relative ? all_digits(type1, type2) + std::log2(*question.relative)
                             : question.tolerance;
}

// From one whole tolerance to the next, no pair stops being the same. The usual answers come first:
// equal, the same under no tolerance, or the same only under all digits.
Sameness sameness_of(const Pairs& pairs, const std::size_t i) {
    const bool at_zero = pairs.same(0, i);
    if (at_zero && pairs.same(1, i)) {
        return same_under_all;
    }
    if (!pairs.same(most_digits, i)) {
        return {at_zero, more_than_all_digits};
    }
    int lowest = 1;
    int highest = most_digits;
    for (int tolerance = most_digits - 1; lowest < highest; tolerance = (lowest + highest) / 2) {
        if (pairs.same(tolerance, i)) {
            highest = tolerance;
        } else {
            lowest = tolerance + 1;
        }
    }
    return {at_zero, lowest};
}

DigitSearch::DigitSearch() {
    for (int from_one = 1; from_one <= more_than_all_digits; ++from_one) {
        for (const bool at_zero : {false, true}) {
            const Sameness sameness(at_zero, from_one);
            result_.sameness_of[talcmp::class_of(sameness)] = sameness;
        }
    }
}

const DigitSearch::Result& DigitSearch::search(const Pairs& pairs) {
    result_.count.fill(0);
    result_.class_of.resize(pairs.count());
    const bool same = all_same(pairs, 0, pairs.count());
    if (!same && groups_.sort(pairs, result_.class_of.data())) {
        ask_about_groups(pairs);
        return result_;
    }
    constexpr Class all = class_of(same_under_all);
    std::fill(result_.class_of.begin(), result_.class_of.end(), all);
    result_.count[all] = pairs.count();
    if (!same) {
        ask_about_stretch(pairs, 0, pairs.count());
    }
    return result_;
}

// Neighbours are often of one group, and a count is not read again as soon as it is written: each
// of eight neighbours has counts of its own.
void DigitSearch::count_groups() {
    constexpr std::size_t lanes = 8;
    std::array<std::array<std::uint64_t, DigitGroups::count>, lanes> counts = {};
    const Class* const groups = result_.class_of.data();
    const std::size_t size = result_.class_of.size();
    const std::size_t whole = size / lanes * lanes;
    for (std::size_t i = 0; i < whole; i += lanes) {
        for (std::size_t lane = 0; lane < lanes; ++lane) {
            ++counts[lane][groups[i + lane]];
        }
    }
    for (std::size_t i = whole; i < size; ++i) {
        ++counts[0][groups[i]];
    }
    for (const auto& count : counts) {
        std::transform(count.begin(), count.end(), result_.count.begin(), result_.count.begin(),
                       std::plus<>());
    }
}

// Asks about one pair of each group, and about each that is in doubt.
void DigitSearch::ask_about_groups(const Pairs& pairs) {
    count_groups();
    const Class* const groups = result_.class_of.data();
    for (std::size_t group = 0; group < DigitGroups::count; ++group) {
        if (result_.count[group] != 0 && group != DigitGroups::doubtful) {
            const auto* const example = static_cast<const Class*>(
                std::memchr(groups, static_cast<int>(group), pairs.count()));
            result_.sameness_of[group] =
                talcmp::sameness_of(pairs, static_cast<std::size_t>(example - groups));
        }
    }
    for (std::size_t i = 0; result_.count[DigitGroups::doubtful] != 0; ++i) {
        if (result_.class_of[i] == DigitGroups::doubtful) {
            ask_about(pairs, i);
        }
    }
}

// Halves the stretch until all pairs of a part are the same.
void DigitSearch::ask_about_stretch(const Pairs& pairs, const std::size_t begin,
                                    const std::size_t count) {
    if (all_same(pairs, begin, count)) {
        return;
    }
    if (count > shortest_stretch) {
        ask_about_stretch(pairs, begin, count / 2);
        ask_about_stretch(pairs, begin + count / 2, count - count / 2);
        return;
    }
    for (std::size_t i = begin; i < begin + count; ++i) {
        ask_about(pairs, i);
    }
}

void DigitSearch::ask_about(const Pairs& pairs, const std::size_t i) {
    const Class found = talcmp::class_of(talcmp::sameness_of(pairs, i));
    --result_.count[result_.class_of[i]];
    ++result_.count[found];
    result_.class_of[i] = found;
}

} // namespace talcmp
