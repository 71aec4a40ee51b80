// Indices to write beside an axis.

#pragma once

#include <cstdint>
#include <vector>

namespace talcmp {

struct Tick {
    std::uint64_t index; // a multiple of 1, 2 or 5 times a power of ten
    std::uint64_t cell;  // that it is in
};

// As many as have at least `cells_apart` cells from one to the next, the first of them at 0, for an
// axis of `extent` indices of which each cell has `bin`.
std::vector<Tick> round_ticks(std::uint64_t extent, std::uint64_t bin, std::uint64_t cells_apart);

} // namespace talcmp
