// Random tolerances and pairs of arrays that are hard to compare: most positions hold the same
// number, and the others are within a few units of the last place of the limit.

#pragma once

#include "draws.h"

#include <array>
#include <cstdint>

namespace oracle {

// Returns to its last tolerances more often than not, so that cached factors are met again.
class RandomTolerances {
  public:
    double next(Draws& draws);

  private:
    std::array<double, 4> recent_{{53, 24, 52.5, 23.5}};
};

double random_tolerance(Draws& draws);

// 1..largest_count, mostly short.
constexpr std::int32_t largest_count = 200;
std::int32_t random_count(Draws& draws);

// Writes an element of each type, 1 to 12. An easy pair is meant to be the same, a hard one may be
// either. The elements may have any alignment.
void draw_elements(Draws& draws, double tolerance, int first_id, int second_id, bool hard,
                   void* first, void* second);

// Writes `count` elements of each type, a few pairs of them hard.
void fill_arrays(Draws& draws, double tolerance, int first_id, int second_id, std::int32_t count,
                 void* first, void* second);

} // namespace oracle
