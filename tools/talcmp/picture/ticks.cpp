#include "ticks.h"

namespace talcmp {
namespace {

// The first of 1, 2, 5, 10, 20, 50, ... that is not below `least`.
std::uint64_t round_step(const std::uint64_t least) {
    std::uint64_t power = 1;
    while (power < least && power * 10 <= least) {
        power *= 10;
    }
    for (const std::uint64_t factor : {1U, 2U, 5U}) {
        if (factor * power >= least) {
            return factor * power;
        }
    }
    return 10 * power;
}

} // namespace

std::vector<Tick> round_ticks(const std::uint64_t extent, const std::uint64_t bin,
                              const std::uint64_t cells_apart) {
    std::vector<Tick> ticks;
    const std::uint64_t step = round_step(cells_apart * bin);
    for (std::uint64_t index = 0; index < extent; index += step) {
        ticks.push_back({index, index / bin});
        if (extent - index <= step) {
            break; // the next one might be too large a number
        }
    }
    return ticks;
}

} // namespace talcmp
