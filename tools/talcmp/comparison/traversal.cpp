#include "traversal.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <numeric>

namespace talcmp {
namespace {

// So that both sides are in the second level of the cache when they are compared.
constexpr std::size_t bytes_of_stretch = std::size_t{256} * 1024;

// So that 512 x 512 doubles are read in stretches of a page.
constexpr std::size_t bytes_of_tile = std::size_t{2} * 1024 * 1024;

// Copies elements from one regular place to another; both strides are in elements.
template <std::size_t size>
void scatter(unsigned char* to, const std::size_t to_stride, const unsigned char* from,
             const std::size_t from_stride, const std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        std::memcpy(to + i * to_stride * size, from + i * from_stride * size, size);
    }
}

void scatter(const std::size_t size, unsigned char* to, const std::size_t to_stride,
             const unsigned char* from, const std::size_t from_stride, const std::size_t count) {
    switch (size) {
    case 1:
        return scatter<1>(to, to_stride, from, from_stride, count);
    case 2:
        return scatter<2>(to, to_stride, from, from_stride, count);
    case 4:
        return scatter<4>(to, to_stride, from, from_stride, count);
    case 8:
        return scatter<8>(to, to_stride, from, from_stride, count);
    default:
        return scatter<16>(to, to_stride, from, from_stride, count);
    }
}

// An axis of a box, as it is gone along in a source and in the buffer that the box is read to.
struct Way {
    std::size_t extent;
    std::uint64_t stride;     // in positions of the source
    std::size_t place_stride; // in elements of the buffer
};

// Calls `action(position, place)` with what it takes to go along all ways, the last one fastest.
template <typename Action>
void for_each_step(const Way* const begin, const Way* const end, const std::uint64_t position,
                   const std::size_t place, const Action& action) {
    if (begin == end) {
        action(position, place);
        return;
    }
    for (std::size_t i = 0; i < begin->extent; ++i) {
        for_each_step(begin + 1, end, position + i * begin->stride, place + i * begin->place_stride,
                      action);
    }
}

// Reads boxes of elements that are stored in another order than they are wanted, or with gaps.
class BoxReader {
  public:
    // Changes the order of `ways`: the longest strides first.
    BoxReader(ArraySource& source, const std::size_t element_size, std::vector<Way>& ways,
              unsigned char* const to)
        : source_(source), element_size_(element_size), to_(to), begin_(ways.data()),
          end_(ways.data() + ways.size()) {
        std::sort(ways.begin(), ways.end(),
                  [](const Way& one, const Way& other) { return one.stride > other.stride; });
    }

    void read(const std::uint64_t first) {
        const Way* const packed = first_packed();
        if (packed == end_) {
            for_each_step(begin_, end_ - 1, first, 0,
                          [this](auto position, auto place) { read_with_gaps(position, place); });
            return;
        }
        for_each_step(begin_, packed, first, 0,
                      [&](auto position, auto place) { read_packed(packed, position, place); });
    }

  private:
    static constexpr std::size_t longest_run = std::size_t{256} * 1024; // bytes with gaps
    static constexpr std::size_t longest_gap = 256;                     // bytes read in vain

    // The first way from which on all elements lie without gaps.
    const Way* first_packed() const {
        const Way* way = end_;
        std::uint64_t length = 1;
        while (way != begin_ && (way[-1].stride == length || way[-1].extent == 1)) {
            --way;
            length *= way->extent;
        }
        return way;
    }

    void read_packed(const Way* const packed, const std::uint64_t position,
                     const std::size_t place) {
        std::size_t count = 1;
        for (const Way* way = packed; way != end_; ++way) {
            count *= way->extent;
        }
        const Way& last = end_[-1];
        if (packed + 1 == end_ && last.place_stride == 1) {
            source_.read(position, count, to_ + place * element_size_);
            return;
        }
        run_.resize(count * element_size_);
        source_.read(position, count, run_.data());
        for_each_step(packed, end_ - 1, 0, place, [&](auto from, auto to) {
            scatter(element_size_, to_ + to * element_size_, last.place_stride,
                    run_.data() + static_cast<std::size_t>(from) * element_size_, 1, last.extent);
        });
    }

    // Along the last way, where something lies between the elements.
    void read_with_gaps(const std::uint64_t position, const std::size_t place) {
        const Way& last = end_[-1];
        const bool one_by_one = last.stride > longest_gap / element_size_;
        const auto stride = static_cast<std::size_t>(one_by_one ? 1 : last.stride);
        const std::size_t at_once =
            one_by_one ? 1 : std::max<std::size_t>(longest_run / (stride * element_size_), 1);
        for (std::size_t done = 0; done < last.extent; done += at_once) {
            const std::size_t count = std::min(at_once, last.extent - done);
            const std::size_t span = (count - 1) * stride + 1;
            run_.resize(span * element_size_);
            source_.read(position + done * last.stride, span, run_.data());
            scatter(element_size_, to_ + (place + done * last.place_stride) * element_size_,
                    last.place_stride, run_.data(), stride, count);
        }
    }

    ArraySource& source_;
    std::size_t element_size_;
    unsigned char* to_;
    const Way* begin_;
    const Way* end_;
    std::vector<unsigned char> run_;
};

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
    // First both sides get runs of a like length; what room is left goes to longer ones.
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

// Lets boxes reach farther along the axes by which one side is stored, the fastest first, until it
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
    std::vector<Way> ways(axes_.size());
    std::size_t place_stride = 1;
    for (std::size_t i = axes_.size(); i-- > 0;) {
        const auto extent = static_cast<std::size_t>(box.extent[i]);
        ways[i] = {extent, axes_[i].stride[s], place_stride};
        place_stride *= extent;
    }
    BoxReader(source, element_size(source), ways, static_cast<unsigned char*>(elements))
        .read(origin);
}

} // namespace talcmp
