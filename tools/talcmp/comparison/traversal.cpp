#include "traversal.h"

#include "box_reader.h"

#include <algorithm>
#include <cmath>
#include <numeric>
#include <utility>

namespace talcmp {
namespace {

// So that both sides are in the second-level cache when they are compared.
constexpr std::size_t bytes_of_stretch = std::size_t{256} * 1024;

// So that 512 x 512 doubles are read in stretches of a page.
constexpr std::size_t bytes_of_tile = std::size_t{2} * 1024 * 1024;

// Where the blocks of both views begin, along one axis; only at 0 if they never do so together.
BlockGrid common_grid(const BlockGrid& one, const BlockGrid& other, const std::uint64_t extent) {
    const BlockGrid& longer = one.length < other.length ? other : one;
    const BlockGrid& shorter = one.length < other.length ? one : other;
    std::uint64_t period = 0;
    const bool overflow = __builtin_mul_overflow(
        longer.length / std::gcd(longer.length, shorter.length), shorter.length, &period);
    if (!overflow && period < extent) {
        for (std::uint64_t begin = longer.first; begin < period; begin += longer.length) {
            if (begin % shorter.length == shorter.first) {
                return {period, begin};
            }
        }
    }
    return {extent, 0};
}

// Along one axis, wherever views that are not in blocks are cut.
BlockGrid grid_of(const View& first, const View& second, const std::size_t axis) {
    constexpr BlockGrid anywhere = {1, 0};
    return common_grid(first.blocks.empty() ? anywhere : first.blocks[axis],
                       second.blocks.empty() ? anywhere : second.blocks[axis], first.shape[axis]);
}

} // namespace

std::uint64_t smallest_box(const View& first, const View& second) {
    std::uint64_t count = 1;
    for (std::size_t axis = 0; axis < first.shape.size(); ++axis) {
        count *= grid_of(first, second, axis).length;
    }
    return count;
}

Traversal::Traversal(const View& first, const View& second, const bool column_major,
                     const std::size_t element_size, const View* const mask)
    : in_blocks_(!first.blocks.empty() || !second.blocks.empty()
                 || (mask != nullptr && !mask->blocks.empty())) {
    const Views views = {&first, &second, mask == nullptr ? &first : mask};
    for (std::size_t side = 0; side < views.size(); ++side) {
        offset_[side] = views[side]->offset;
    }
    choose_axes(views, column_major);
    choose_boxes(element_size);
}

void Traversal::choose_axes(const Views& views, const bool column_major) {
    const Shape& shape = views[0]->shape;
    const std::size_t rank = shape.size();
    for (std::size_t i = 0; i < rank; ++i) {
        const std::size_t axis = column_major ? rank - 1 - i : i;
        Axis next = {shape[axis],
                     {views[0]->strides[axis], views[1]->strides[axis], views[2]->strides[axis]},
                     1,
                     1};
        if (next.extent == 1) {
            continue;
        }
        if (in_blocks_) {
            const BlockGrid grid = grid_of(*views[0], *views[1], axis);
            next.tile = grid.length;
            next.first_tile = grid.first == 0 ? grid.length : grid.first;
        }
        const auto follows = [&](const std::size_t side) {
            return axes_.back().stride[side] == next.stride[side] * next.extent;
        };
        if (!in_blocks_ && !axes_.empty() && follows(0) && follows(1) && follows(2)) {
            next.extent *= axes_.back().extent;
            axes_.back() = next;
        } else {
            axes_.push_back(next);
        }
    }
    if (axes_.empty()) {
        axes_.push_back({1, {1, 1, 1}, 1, 1});
    }
}

std::uint64_t Traversal::boxes_along(const Axis& axis) {
    return axis.extent <= axis.first_tile ? 1 : (axis.extent - axis.first_tile - 1) / axis.tile + 2;
}

void Traversal::choose_boxes(const std::size_t element_size) {
    const std::uint64_t room = (is_linear() ? bytes_of_stretch : bytes_of_tile) / element_size;
    if (in_blocks_) {
        add_whole_blocks(room);
    } else {
        // First both sides get runs of similar length; the remaining room goes to longer ones.
        const auto side_room = static_cast<std::uint64_t>(std::sqrt(static_cast<double>(room)));
        for (const std::uint64_t length : {side_room, room}) {
            for (const Side side : {Side::first, Side::second}) {
                lengthen_runs(side, length, room);
            }
        }
    }
    for (const Axis& axis : axes_) {
        pair_count_ *= axis.extent;
        box_count_ *= boxes_along(axis);
    }
}

// Extends boxes along the axes, the innermost first, as long as they have at most `room` pairs.
void Traversal::add_whole_blocks(const std::uint64_t room) {
    for (Axis& axis : axes_) {
        axis.tile = std::min(axis.tile, axis.extent);
        axis.first_tile = std::min(axis.first_tile, axis.tile);
        largest_box_ *= static_cast<std::size_t>(axis.tile);
    }
    for (auto axis = axes_.rbegin(); axis != axes_.rend() && largest_box_ <= room; ++axis) {
        const std::uint64_t others = largest_box_ / axis->tile;
        const std::uint64_t more = (room / others / axis->tile - 1) * axis->tile;
        axis->first_tile = std::min(axis->extent, axis->first_tile + more);
        axis->tile = std::min(axis->extent, axis->tile + more);
        largest_box_ = static_cast<std::size_t>(others * axis->tile);
        if (axis->tile < axis->extent) {
            return;
        }
    }
}

// Extends boxes along the axes in one side's order of storage, the fastest first, until that side
// is read in runs of `length` positions or boxes have `room` pairs.
void Traversal::lengthen_runs(const Side side, const std::uint64_t length,
                              const std::uint64_t room) {
    std::uint64_t run = 1;
    for (const std::size_t i : axes_by_stride(side)) {
        Axis& axis = axes_[i];
        const std::uint64_t others = largest_box_ / axis.tile;
        const std::uint64_t wanted = std::min(length / run, room / others);
        axis.tile = std::min(axis.extent, std::max(axis.tile, wanted));
        axis.first_tile = axis.tile;
        largest_box_ = static_cast<std::size_t>(others * axis.tile);
        run *= axis.tile;
        if (axis.tile < axis.extent) {
            return; // the next positions belong to other boxes
        }
    }
}

bool Traversal::is_linear() const {
    constexpr std::array<std::uint64_t, 3> without_gaps = {1, 1, 1};
    return !in_blocks_ && axes_.size() == 1 && axes_[0].stride == without_gaps;
}

std::vector<std::size_t> Traversal::axes_by_stride(const Side side) const {
    const auto s = static_cast<std::size_t>(side);
    std::vector<std::size_t> order(axes_.size());
    std::iota(order.begin(), order.end(), std::size_t{0});
    std::sort(order.begin(), order.end(),
              [this, s](const std::size_t one, const std::size_t other) {
                  return axes_[one].stride[s] < axes_[other].stride[s];
              });
    return order;
}

Box Traversal::box(std::uint64_t index) const {
    const std::size_t rank = axes_.size();
    Box box{std::vector<std::uint64_t>(rank), std::vector<std::uint64_t>(rank), 1};
    for (std::size_t i = rank; i-- > 0;) {
        const Axis& axis = axes_[i];
        const std::uint64_t number = index % boxes_along(axis);
        box.begin[i] = number == 0 ? 0 : axis.first_tile + (number - 1) * axis.tile;
        box.extent[i] =
            std::min(number == 0 ? axis.first_tile : axis.tile, axis.extent - box.begin[i]);
        box.count *= static_cast<std::size_t>(box.extent[i]);
        index /= boxes_along(axis);
    }
    return box;
}

std::uint64_t Traversal::position(const Side side, const Box& box) const {
    const auto s = static_cast<std::size_t>(side);
    std::uint64_t position = offset_[s];
    for (std::size_t i = 0; i < axes_.size(); ++i) {
        position += box.begin[i] * axes_[i].stride[s];
    }
    return position;
}

std::uint64_t Traversal::number(const Box& box, std::size_t local) const {
    std::uint64_t result = 0;
    std::uint64_t stride = 1;
    for (std::size_t i = axes_.size(); i-- > 0;) {
        result += (box.begin[i] + local % box.extent[i]) * stride;
        local /= static_cast<std::size_t>(box.extent[i]);
        stride *= axes_[i].extent;
    }
    return result;
}

std::uint64_t Traversal::first_position(const Box& box, std::size_t local) const {
    std::uint64_t result = position(Side::first, box);
    for (std::size_t i = axes_.size(); i-- > 0;) {
        result += local % box.extent[i] * axes_[i].stride[0];
        local /= static_cast<std::size_t>(box.extent[i]);
    }
    return result;
}

// Each axis of a box of blocks is one of the array's axes: a stride, as a position, has the index 0
// in all others.
Slab Traversal::slab(const Side side, const Shape& shape, const Box& box) const {
    const auto s = static_cast<std::size_t>(side);
    Slab slab;
    for (const std::uint64_t begin : index_of(shape, false, position(side, box))) {
        slab.axes.push_back({begin, 1, 1});
    }
    for (std::size_t i = 0; i < axes_.size(); ++i) {
        const Shape step = index_of(shape, false, axes_[i].stride[s]);
        for (std::size_t axis = 0; axis < step.size(); ++axis) {
            if (step[axis] != 0 && axes_[i].extent > 1) {
                slab.axes[axis].extent = box.extent[i];
                slab.axes[axis].step = step[axis];
            }
        }
    }
    return slab;
}

const void* Traversal::in_memory(const Side side, const ArraySource& source, const Box& box) const {
    const auto* const elements = static_cast<const unsigned char*>(source.in_memory());
    return elements == nullptr || !is_linear()
               ? nullptr
               : elements + position(side, box) * source.type().size;
}

void Traversal::read(const Side side, ArraySource& source, const Box& box,
                     void* const elements) const {
    if (!source.block().empty()) {
        source.read_slab(slab(side, source.shape(), box), elements);
        return;
    }
    const std::uint64_t origin = position(side, box);
    if (is_linear()) {
        source.read(origin, box.count, elements);
        return;
    }
    const auto s = static_cast<std::size_t>(side);
    std::vector<BoxAxis> axes(axes_.size());
    std::size_t slot_stride = 1;
    for (std::size_t i = axes_.size(); i-- > 0;) {
        const auto extent = static_cast<std::size_t>(box.extent[i]);
        axes[i] = {extent, axes_[i].stride[s], slot_stride};
        slot_stride *= extent;
    }
    read_box(source, origin, std::move(axes), elements);
}

} // namespace talcmp
