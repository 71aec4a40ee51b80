// A box of elements in two places at once, in different orders or with gaps.

#pragma once

#include <cstddef>
#include <cstdint>

namespace talcmp {

// An axis of a box, both in the source and in the buffer that the box is read into.
struct BoxAxis {
    std::size_t extent;
    std::uint64_t stride;    // in positions of the source
    std::size_t slot_stride; // in elements of the buffer
};

// Calls `action(position, slot)` for each step along the axes, the last one fastest.
template <typename Action>
void for_each_step(const BoxAxis* const begin, const BoxAxis* const end,
                   const std::uint64_t position, const std::size_t slot, const Action& action) {
    if (begin == end) {
        action(position, slot);
        return;
    }
    for (std::size_t i = 0; i < begin->extent; ++i) {
        for_each_step(begin + 1, end, position + i * begin->stride, slot + i * begin->slot_stride,
                      action);
    }
}

} // namespace talcmp
