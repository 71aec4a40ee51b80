// The largest differences of pairs, in ordinary numbers.

#pragma once

#include "pairs.h"

#include <algorithm>
#include <vector>

namespace talcmp {

// Over all pairs of parts without a NaN; 0 if all are equal. Rounded to doubles.
struct LargestDifferences {
    double absolute = 0; // |x - y|; infinite if one is, or if it is beyond the largest double
    double relative = 0; // |x - y| / max(|x|, |y|); infinite where the absolute difference is
};

inline void add(LargestDifferences& sum, const LargestDifferences& part) {
    sum.absolute = std::max(sum.absolute, part.absolute);
    sum.relative = std::max(sum.relative, part.relative);
}

class DifferenceMeter {
  public:
    // Adds those of the pairs to the largest ones so far.
    void add(const Pairs& pairs, LargestDifferences& largest);

  private:
    void add_part(const Pairs& pairs, int part, LargestDifferences& largest);

    std::vector<double> parts1_, parts2_, rests1_, rests2_;
};

} // namespace talcmp
