// Adds what was found in pairs to maps of where two arrays differ.

#pragma once

#include "chosen_pairs.h"
#include "difference_map.h"
#include "digits.h"
#include "layout.h"
#include "traversal.h"

#include <memory>
#include <vector>

namespace talcmp {

using DifferenceMaps = std::vector<std::shared_ptr<DifferenceMap>>;

class MapFiller {
  public:
    // For maps of the elements of `traversal`, whose boxes may be in column-major order.
    MapFiller(const DifferenceMaps& maps, const Traversal& traversal, bool column_major);

    // `found` is what was found for the chosen pairs of the box.
    void add(const Box& box, const ChosenPairs& chosen, const DigitSearch::Result& found);

  private:
    void add_run(const Box& box, std::size_t first, std::size_t count, Level level);

    const DifferenceMaps& maps_;
    const Traversal& traversal_;
    RowMajorNumbers numbers_; // of elements whose numbers are in column-major order
    bool column_major_;
    std::vector<Level> levels_; // of the chosen pairs
};

} // namespace talcmp
