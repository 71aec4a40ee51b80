#include "layout.h"

#include <algorithm>
#include <numeric>
#include <stdexcept>
#include <string>
#include <utility>

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

// How many indices there are up to and including this one.
std::uint64_t clipped_from_above(const std::int64_t number, const std::uint64_t dimension) {
    const std::uint64_t back = std::uint64_t{0} - static_cast<std::uint64_t>(number);
    if (number < 0 && back > dimension) {
        return 0;
    }
    return std::min(clipped(number, dimension), dimension - 1) + 1;
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

// The selected indices of an axis, in ascending order.
struct Indices {
    std::uint64_t begin;
    std::uint64_t count;
    std::uint64_t step;
};

Indices indices_of(const AxisRange& range, const std::uint64_t dimension) {
    if (dimension == 0) {
        return {0, 0, 1};
    }
    const auto count_of = [](const std::uint64_t span, const std::uint64_t step) {
        return span == 0 ? 0 : (span - 1) / step + 1;
    };
    if (range.step > 0) {
        const auto step = static_cast<std::uint64_t>(range.step);
        const std::uint64_t start = clipped(range.start.value_or(0), dimension);
        const std::uint64_t stop = range.stop ? clipped(*range.stop, dimension) : dimension;
        return {start, count_of(std::max(stop, start) - start, step), step};
    }
    const std::uint64_t step = std::uint64_t{0} - static_cast<std::uint64_t>(range.step);
    const std::uint64_t start =
        range.start ? clipped_from_above(*range.start, dimension) : dimension;
    const std::uint64_t stop = range.stop ? clipped_from_above(*range.stop, dimension) : 0;
    const std::uint64_t count = count_of(std::max(start, stop) - stop, step);
    return {count == 0 ? 0 : start - 1 - (count - 1) * step, count, step};
}

// Where blocks of `length` indices of an axis begin among the selected indices.
BlockGrid grid_of(const Indices& indices, const std::uint64_t length) {
    const std::uint64_t next_block = (indices.begin / length + 1) * length;
    const std::uint64_t first = (next_block - indices.begin - 1) / indices.step + 1;
    if (first >= indices.count) {
        return {std::max<std::uint64_t>(indices.count, 1), 0};
    }
    // After so many steps a block's beginning is met at the same distance again.
    const std::uint64_t period = length / std::gcd(length, indices.step);
    return {period, first % period};
}

class Selector {
  public:
    explicit Selector(const ArraySource& source)
        : source_(source), strides_(whole_strides(source.shape(), source.fortran_order())) {}

    // Takes so much of the next axis.
    void take(const AxisRange& range) {
        const std::size_t axis = axis_++;
        const std::uint64_t dimension = source_.shape()[axis];
        if (range.one_index) {
            view_.offset += checked_index(*range.start, dimension, axis) * strides_[axis];
            return;
        }
        const Indices indices = indices_of(range, dimension);
        view_.offset += indices.begin * strides_[axis];
        view_.shape.push_back(indices.count);
        // With fewer than two elements the stride is not used, and the product might not be a
        // position.
        view_.strides.push_back(indices.count > 1 ? indices.step * strides_[axis] : 0);
        if (!source_.block().empty()) {
            view_.blocks.push_back(grid_of(indices, source_.block()[axis]));
        }
    }

    View view() && { return std::move(view_); }

  private:
    const ArraySource& source_;
    std::vector<std::uint64_t> strides_;
    std::size_t axis_ = 0;
    View view_;
};

} // namespace

View select(const ArraySource& source, const Selection& selection) {
    const std::size_t rank = source.shape().size();
    const std::size_t named = selection.first.size() + selection.last.size();
    if (named > rank) {
        throw std::invalid_argument("has fewer dimensions (" + std::to_string(rank)
                                    + ") than --slice (" + std::to_string(named) + ")");
    }
    std::vector<AxisRange> ranges = selection.first;
    ranges.resize(rank - selection.last.size());
    ranges.insert(ranges.end(), selection.last.begin(), selection.last.end());
    Selector selector(source);
    for (const AxisRange& range : ranges) {
        selector.take(range);
    }
    return std::move(selector).view();
}

View squeezed(const View& view) {
    View result;
    result.offset = view.offset;
    for (std::size_t axis = 0; axis < view.shape.size(); ++axis) {
        if (view.shape[axis] != 1) {
            result.shape.push_back(view.shape[axis]);
            result.strides.push_back(view.strides[axis]);
            if (!view.blocks.empty()) {
                result.blocks.push_back(view.blocks[axis]);
            }
        }
    }
    return result;
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

RowMajorNumbers::RowMajorNumbers(const Shape& shape, const bool fortran_order) {
    if (fortran_order) {
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
