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

} // namespace

Traversal::Traversal(const View& first, const View& second, const bool column_major,
                     const std::size_t element_size)
    : offset_{first.offset, second.offset} {
    choose_axes(first, second, column_major);
    choose_boxes(element_size);
}

void Traversal::choose_axes(const View& first, const View& second, const bool column_major) {
    const std::size_t rank = first.shape.size();
    for (std::size_t i = 0; i < rank; ++i) {
        const std::size_t axis = column_major ? rank - 1 - i : i;
        const Axis next = {first.shape[axis], {first.strides[axis], second.strides[axis]}, 1};
        if (next.extent == 1) {
            continue;
        }
        const auto follows = [&](const int side) {
            return axes_.back().stride[side] == next.stride[side] * next.extent;
        };
        if (!axes_.empty() && follows(0) && follows(1)) {
            axes_.back() = {axes_.back().extent * next.extent, {next.stride[0], next.stride[1]}, 1};
        } else {
            axes_.push_back(next);
        }
    }
    if (axes_.empty()) {
        axes_.push_back({1, {1, 1}, 1});
    }
}

void Traversal::choose_boxes(const std::size_t element_size) {
    const std::uint64_t room = (is_linear() ? bytes_of_stretch : bytes_of_tile) / element_size;
    const auto side_room = static_cast<std::uint64_t>(std::sqrt(static_cast<double>(room)));
    // First both sides get runs of similar length; the remaining room goes to longer ones.
    for (const std::uint64_t length : {side_room, room}) {
        for (const Side side : {Side::first, Side::second}) {
            lengthen_runs(side, length, room);
        }
    }
    for (const Axis& axis : axes_) {
        pair_count_ *= axis.extent;
        box_count_ *= (axis.extent - 1) / axis.tile + 1;
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
        largest_box_ = static_cast<std::size_t>(others * axis.tile);
        run *= axis.tile;
        if (axis.tile < axis.extent) {
            return; // the next positions belong to other boxes
        }
    }
}

bool Traversal::is_linear() const {
    return axes_.size() == 1 && axes_[0].stride[0] == 1 && axes_[0].stride[1] == 1;
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
        const std::uint64_t boxes = (axis.extent - 1) / axis.tile + 1;
        box.begin[i] = index % boxes * axis.tile;
        box.extent[i] = std::min(axis.tile, axis.extent - box.begin[i]);
        box.count *= static_cast<std::size_t>(box.extent[i]);
        index /= boxes;
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

std::uint64_t Traversal::first_position(const Box& box, std::size_t local) const {
    std::uint64_t result = position(Side::first, box);
    for (std::size_t i = axes_.size(); i-- > 0;) {
        result += local % box.extent[i] * axes_[i].stride[0];
        local /= static_cast<std::size_t>(box.extent[i]);
    }
    return result;
}

void Traversal::read(const Side side, ArraySource& source, const Box& box,
                     void* const elements) const {
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
