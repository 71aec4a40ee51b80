#include "memory_array.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <numeric>
#include <utility>

namespace talcmp {
namespace {

// ---- The order of elements

bool is_aligned(const void* const data, const std::size_t alignment) {
    return reinterpret_cast<std::uintptr_t>(data) % alignment == 0;
}

// Whether the elements are one after another, the last index varying fastest or the first one. An
// axis of length 1 may have any stride.
bool is_packed(const MemoryLayout& layout, const std::size_t size, const bool first_fastest) {
    const std::size_t rank = layout.shape.size();
    auto stride = static_cast<std::int64_t>(size);
    for (std::size_t i = 0; i < rank; ++i) {
        const std::size_t axis = first_fastest ? i : rank - 1 - i;
        if (layout.shape[axis] != 1 && layout.strides[axis] != stride) {
            return false;
        }
        stride *= static_cast<std::int64_t>(layout.shape[axis]);
    }
    return true;
}

// Some cache lines along the axes that vary fastest in memory, so that few lines are read for each
// element that a slab wants of them. Along the last axis slabs are long anyway.
Shape block_of(const MemoryLayout& layout) {
    const Shape& shape = layout.shape;
    Shape block(shape.size(), 1);
    std::vector<std::size_t> axes(shape.size());
    std::iota(axes.begin(), axes.end(), std::size_t{0});
    std::stable_sort(axes.begin(), axes.end(), [&](const std::size_t one, const std::size_t other) {
        return std::abs(layout.strides[one]) < std::abs(layout.strides[other]);
    });
    std::uint64_t room = 64;
    for (const std::size_t axis : axes) {
        if (axis + 1 == axes.size()) {
            break;
        }
        if (layout.strides[axis] != 0) {
            block[axis] = std::min(room, shape[axis]);
            room /= block[axis];
        }
    }
    return block;
}

// ---- Slabs

struct Axis {
    std::size_t extent;
    std::ptrdiff_t stride;      // bytes in the array
    std::ptrdiff_t slot_stride; // bytes in the buffer
};

template <std::size_t size>
void copy_run(unsigned char* to, const unsigned char* from, const Axis& axis) {
    for (std::size_t i = 0; i < axis.extent; ++i) {
        std::memcpy(to, from, size);
        from += axis.stride;
        to += axis.slot_stride;
    }
}

void copy_run(const std::size_t size, unsigned char* const to, const unsigned char* const from,
              const Axis& axis) {
    static_assert(largest_element_size == 16, "there is a case for each size");
    if (axis.stride == axis.slot_stride && axis.stride == static_cast<std::ptrdiff_t>(size)) {
        std::memcpy(to, from, axis.extent * size);
        return;
    }
    switch (size) {
    case 1:
        return copy_run<1>(to, from, axis);
    case 2:
        return copy_run<2>(to, from, axis);
    case 4:
        return copy_run<4>(to, from, axis);
    case 8:
        return copy_run<8>(to, from, axis);
    default:
        return copy_run<16>(to, from, axis);
    }
}

// Copies along `inner` for each step of `outer`. Where the elements of `outer` are closer together
// than those of `inner`, a few of `inner` at a time, so that lines of the cache are still there
// when the next step wants them.
void copy_plane(const std::size_t size, unsigned char* const to, const unsigned char* const from,
                const Axis& outer, const Axis& inner) {
    const bool across = std::abs(outer.stride) < std::abs(inner.stride);
    const std::size_t at_once = across ? 64 / size : std::max<std::size_t>(inner.extent, 1);
    for (std::size_t begin = 0; begin < inner.extent; begin += at_once) {
        Axis part = inner;
        part.extent = std::min(at_once, inner.extent - begin);
        const auto first = static_cast<std::ptrdiff_t>(begin);
        for (std::size_t i = 0; i < outer.extent; ++i) {
            const auto step = static_cast<std::ptrdiff_t>(i);
            copy_run(size, to + first * inner.slot_stride + step * outer.slot_stride,
                     from + first * inner.stride + step * outer.stride, part);
        }
    }
}

// The innermost axis comes last, and the one before it is the plane's other one.
void copy_axes(const std::size_t size, unsigned char* to, const unsigned char* from,
               const Axis* const begin, const Axis* const end) {
    if (end - begin == 2) {
        copy_plane(size, to, from, begin[0], begin[1]);
        return;
    }
    for (std::size_t i = 0; i < begin->extent; ++i) {
        copy_axes(size, to, from, begin + 1, end);
        to += begin->slot_stride;
        from += begin->stride;
    }
}

} // namespace

bool is_in_fortran_order(const MemoryLayout& layout, const std::size_t size) {
    return has_elements(layout.shape) && !is_packed(layout, size, false)
           && is_packed(layout, size, true);
}

MemoryArray::MemoryArray(StoredType stored, MemoryLayout layout, const bool by_fortran_positions)
    : stored_(std::move(stored)), layout_(std::move(layout)),
      fortran_order_(by_fortran_positions && is_in_fortran_order(layout_, stored_.size)) {
    const bool c_order = !has_elements(layout_.shape) || is_packed(layout_, stored_.size, false);
    if (!c_order && !fortran_order_) {
        block_ = block_of(layout_);
    }
}

const void* MemoryArray::in_memory() const {
    const bool as_compared = block_.empty() && stored_.widen == nullptr && !stored_.bytes_swapped;
    return as_compared && is_aligned(layout_.data, type().alignment) ? layout_.data : nullptr;
}

void MemoryArray::read(const std::uint64_t first, const std::uint64_t count, void* const elements) {
    const auto in_memory = static_cast<std::size_t>(count);
    std::memcpy(room_for_stored(stored_, elements, in_memory),
                layout_.data + static_cast<std::size_t>(first) * stored_.size,
                in_memory * stored_.size);
    decode(stored_, elements, in_memory);
}

void MemoryArray::read_slab(const Slab& slab, void* const elements) {
    const auto size = static_cast<std::ptrdiff_t>(stored_.size);
    const unsigned char* from = layout_.data;
    std::vector<Axis> axes(slab.axes.size());
    std::ptrdiff_t slot_stride = size;
    std::size_t count = 1;
    for (std::size_t i = axes.size(); i-- > 0;) {
        const Slab::Axis& axis = slab.axes[i];
        const auto stride = static_cast<std::ptrdiff_t>(layout_.strides[i]);
        from += static_cast<std::ptrdiff_t>(axis.begin) * stride;
        axes[i] = {static_cast<std::size_t>(axis.extent),
                   static_cast<std::ptrdiff_t>(axis.step) * stride, slot_stride};
        slot_stride *= static_cast<std::ptrdiff_t>(axis.extent);
        count *= static_cast<std::size_t>(axis.extent);
    }
    // The plane is of the axis along which elements are closest together and of the last one.
    while (axes.size() < 2) {
        axes.insert(axes.begin(), {1, 0, 0});
    }
    const auto closest =
        std::min_element(axes.begin(), axes.end() - 1, [](const Axis& one, const Axis& other) {
            const auto distance = [](const Axis& axis) {
                return axis.extent > 1 && axis.stride != 0 ? std::abs(axis.stride) : PTRDIFF_MAX;
            };
            return distance(one) < distance(other);
        });
    std::iter_swap(closest, axes.end() - 2);
    auto* const room = static_cast<unsigned char*>(room_for_stored(stored_, elements, count));
    copy_axes(stored_.size, room, from, axes.data(), axes.data() + axes.size());
    decode(stored_, elements, count);
}

} // namespace talcmp
