#include "difference_map.h"

#include <algorithm>
#include <utility>

namespace talcmp {
namespace {

// The cells that `count` consecutive indices from `first` on are in.
std::uint64_t cells_touched(const std::uint64_t first, const std::uint64_t count,
                            const std::uint64_t bin) {
    return (first + count - 1) / bin - first / bin + 1;
}

} // namespace

Divider::Divider(const std::uint64_t divisor, const std::uint64_t largest_dividend)
    : divisor_(divisor), reciprocal_(1 / static_cast<double>(divisor)),
      by_reciprocal_(largest_dividend >> 53U == 0) {}

DifferenceMap::DifferenceMap(Shape shape, const MapRoom& room)
    : shape_(std::move(shape)), layout_(choose_layout(shape_, room)),
      cell_columns_(layout_.cell_columns),
      cells_of_image_(layout_.cell_rows * layout_.cell_columns),
      cells_(static_cast<std::size_t>(layout_.images * cells_of_image_)) {
    const std::uint64_t lines = layout_.outer * layout_.rows;
    const auto divider = [](const std::uint64_t divisor, const std::uint64_t extent) {
        return Divider(std::max<std::uint64_t>(divisor, 1), extent);
    };
    by_columns_ = divider(layout_.columns, lines * layout_.columns);
    by_rows_ = divider(layout_.rows, lines);
    by_image_bin_ = divider(layout_.image_bin, layout_.outer);
    by_row_bin_ = divider(layout_.row_bin, layout_.rows);
    by_column_bin_ = divider(layout_.column_bin, layout_.columns);
}

DifferenceMap::Stretch DifferenceMap::stretch(const Place& place, const std::uint64_t count) const {
    const std::uint64_t columns = layout_.columns;
    const std::uint64_t image = layout_.rows * columns;
    if (place.column != 0 || count < columns) {
        const std::uint64_t elements = std::min(count, columns - place.column);
        return {elements, cells_touched(place.column, elements, layout_.column_bin)};
    }
    if (place.row != 0 || count < image) {
        const std::uint64_t rows = std::min(count / columns, layout_.rows - place.row);
        return {rows * columns, cells_touched(place.row, rows, layout_.row_bin) * cell_columns_};
    }
    const std::uint64_t images = count / image;
    return {images * image,
            cells_touched(place.outer, images, layout_.image_bin) * cells_of_image_};
}

void DifferenceMap::add_run(std::uint64_t first, std::uint64_t count, const Level level) {
    while (count > 0) {
        const Place place = place_of(first);
        const Stretch next = stretch(place, count);
        const auto begin = cells_.begin() + static_cast<std::ptrdiff_t>(place.cell);
        std::for_each(begin, begin + static_cast<std::ptrdiff_t>(next.cells),
                      [level](Cell& cell) { raise(cell, level); });
        first += next.elements;
        count -= next.elements;
    }
}

std::vector<Level> DifferenceMap::levels() const {
    return {cells_.begin(), cells_.end()};
}

void DifferenceMap::add_levels(const std::vector<Level>& levels) {
    for (std::size_t i = 0; i < levels.size(); ++i) {
        raise(cells_[i], levels[i]);
    }
}

std::array<std::uint64_t, level_count> DifferenceMap::counts() const {
    std::array<std::uint64_t, level_count> counts = {};
    for (const Cell& cell : cells_) {
        ++counts.at(cell.load(std::memory_order_relaxed));
    }
    return counts;
}

} // namespace talcmp
