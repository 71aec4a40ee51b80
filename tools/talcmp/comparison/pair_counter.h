// Finds and counts how pairs of elements differ.

#pragma once

#include "findings.h"

#include <cstdint>
#include <functional>

namespace talcmp {

class PairCounter {
  public:
    explicit PairCounter(const talreal tolerance) : tolerance_(tolerance) {}

    // Finds the number, in row-major order, of a pair.
    using Numbering = std::function<std::uint64_t(std::size_t)>;

    // Adds the totals of all pairs: `asked` as the module is asked about them, `stored` as they are
    // in the arrays. `in_order` says that their numbers ascend, and that those of pairs added later
    // are higher still. Returns what was found for each pair, valid until the next call.
    const DigitSearch::Result& add(const Pairs& asked, const Pairs& stored, const Numbering& number,
                                   bool in_order, Findings& findings);

  private:
    enum class Answer : std::uint8_t { same, different, to_be_asked };

    void add_differing(const Pairs& asked, const Pairs& stored, const DigitSearch::Result& found,
                       const Numbering& number, bool in_order, Findings& findings) const;
    Answer answer_on(Sameness sameness) const;

    talreal tolerance_;
    DigitSearch search_;
    DifferenceMeter meter_;
};

} // namespace talcmp
