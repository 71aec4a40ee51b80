#include "layout.h"

#include <algorithm>
#include <stdexcept>
#include <string>

namespace talcmp {
namespace {

// Whole, in the order of the axes.
std::vector<std::uint64_t> whole_strides(const Shape& shape, const bool fortran_order) {
    std::vector<std::uint64_t> strides(shape.size());
    std::uint64_t stride = 1;
    for (std::size_t i = 0; i < shape.size(); ++i) {
        const std::size_t axis = fortran_order ? i : shape.size() - 1 - i;
        strides[axis] = stride;
        stride *= shape[axis];
    }
    return strides;
}

// As in Python: negative numbers count from the end, and what is outside is cut off.
std::uint64_t clipped(const std::int64_t number, const std::uint64_t dimension) {
    if (number >= 0) {
        return std::min(static_cast<std::uint64_t>(number), dimension);
    }
    const std::uint64_t back = std::uint64_t{0} - static_cast<std::uint64_t>(number);
    return dimension - std::min(back, dimension);
}

std::uint64_t checked_index(const std::int64_t number, const std::uint64_t dimension,
                            const std::size_t axis) {
    const std::uint64_t back = std::uint64_t{0} - static_cast<std::uint64_t>(number);
    if (number >= 0 ? static_cast<std::uint64_t>(number) >= dimension : back > dimension) {
        throw std::invalid_argument("has no index " + std::to_string(number) + " in axis "
                                    + std::to_string(axis) + ", whose length is "
                                    + std::to_string(dimension));
    }
    return clipped(number, dimension);
}

void append(View& view, const AxisRange& range, const std::size_t axis,
            const std::uint64_t dimension, const std::uint64_t stride) {
    if (range.one_index) {
        view.offset += checked_index(*range.start, dimension, axis) * stride;
        return;
    }
    const std::uint64_t start = clipped(range.start.value_or(0), dimension);
    const std::uint64_t stop = range.stop ? clipped(*range.stop, dimension) : dimension;
    const auto step = static_cast<std::uint64_t>(range.step);
    const std::uint64_t count = stop > start ? (stop - start - 1) / step + 1 : 0;
    view.offset += start * stride;
    view.shape.push_back(count);
    // With fewer than two elements the stride is not used, and the product might not be a position.
    view.strides.push_back(count > 1 ? step * stride : 0);
}

} // namespace

View select(const ArraySource& source, const Selection& selection) {
    const Shape& shape = source.shape();
    if (selection.size() > shape.size()) {
        throw std::invalid_argument("has fewer dimensions (" + std::to_string(shape.size())
                                    + ") than --slice (" + std::to_string(selection.size()) + ")");
    }
    const auto strides = whole_strides(shape, source.fortran_order());
    View view;
    for (std::size_t axis = 0; axis < shape.size(); ++axis) {
        const AxisRange range = axis < selection.size() ? selection[axis] : AxisRange{};
        append(view, range, axis, shape[axis], strides[axis]);
    }
    return view;
}

Shape index_of(const Shape& shape, const bool fortran_order, std::uint64_t position) {
    Shape index(shape.size());
    for (std::size_t i = 0; i < shape.size(); ++i) {
        const std::size_t axis = fortran_order ? i : shape.size() - 1 - i;
        index[axis] = position % shape[axis];
        position /= shape[axis];
    }
    return index;
}

RowMajorNumbers::RowMajorNumbers(const ArraySource& source) {
    if (source.fortran_order()) {
        const Shape& shape = source.shape();
        const auto strides = whole_strides(shape, false);
        for (std::size_t axis = 0; axis < shape.size(); ++axis) {
            axes_.push_back({shape[axis], strides[axis]});
        }
    }
}

std::uint64_t RowMajorNumbers::of(std::uint64_t position) const {
    if (axes_.empty()) {
        return position;
    }
    std::uint64_t number = 0;
    for (const Axis& axis : axes_) {
        number += position % axis.extent * axis.stride;
        position /= axis.extent;
    }
    return number;
}

} // namespace talcmp
