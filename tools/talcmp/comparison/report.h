// How two arrays differ, in numbers.

#ifndef TALCMP_REPORT_H
#define TALCMP_REPORT_H

#include "digits.h"
#include "places.h"
#include "value_counts.h"

#include <cstdint>
#include <functional>
#include <optional>

namespace talcmp {

// Sums over pairs of elements, which can be added up in any order.
struct Report {
    std::uint64_t pairs = 0;
    std::uint64_t differing = 0; // not the same under the tolerance that is asked about
    DigitCounts digits = {};     // how many pairs differ in so many digits
    int needed_from_one = 1;     // the smallest tolerance from 1 on under which all are the same
    int worst_digits = 0;        // of any pair
    std::optional<Place> worst_place; // the first where so many digits differ
    ValueCounts values1, values2;
};

// The smallest whole tolerance, from 0 on, under which the arrays are the same; nothing where they
// are under none below `all_digits`.
std::optional<int> smallest_tolerance(const Report& report, int all_digits);

void add(Report& sum, const Report& report);

// Adds up what is told about a tolerance.
class Reporter {
  public:
    explicit Reporter(const talreal tolerance) : tolerance_(tolerance) {}

    // What makes a place of a pair, by its number.
    using PlaceMaker = std::function<Place(std::size_t)>;

    // `first` is shown pairs that differ, in the order of their numbers, until it wants no more.
    void add(const Pairs& pairs, const PlaceMaker& place, bool in_order, FirstPlaces& first);

    const Report& report() const { return report_; }

  private:
    enum class Answer : std::uint8_t { same, different, to_be_asked };

    void add_counts(const DigitSearch::Result& found);
    void add_differing(const Pairs& pairs, const DigitSearch::Result& found,
                       const PlaceMaker& place, bool in_order, FirstPlaces& first);
    void add_worst(const DigitSearch::Result& found, const PlaceMaker& place, bool in_order);
    Answer answer_of(Sameness sameness) const;

    talreal tolerance_;
    Report report_;
    DigitSearch search_;
};

} // namespace talcmp

#endif
