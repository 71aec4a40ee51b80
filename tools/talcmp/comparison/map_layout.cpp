#include "map_layout.h"

#include <algorithm>
#include <tuple>
#include <utility>

namespace talcmp {
namespace {

constexpr std::uint64_t greatest_kept_proportion = 8;

Shape outer_shape(const Shape& shape) {
    return {shape.begin(),
            shape.end() - static_cast<std::ptrdiff_t>(std::min(shape.size(), std::size_t{2}))};
}

std::uint64_t bin_count(const std::uint64_t extent, const std::uint64_t bin) {
    return extent / bin + (extent % bin != 0 ? 1 : 0);
}

// How many of `length` cells, and the gaps between them, there is room for; at least one.
std::uint64_t most_images(const std::uint64_t room, const std::uint64_t gap,
                          const std::uint64_t length) {
    return std::max<std::uint64_t>((room + gap) / (length + gap), 1);
}

// The cells that each of `count` images gets; none where the gaps take all.
std::uint64_t room_of_image(const std::uint64_t room, const std::uint64_t gap,
                            const std::uint64_t count) {
    const std::uint64_t gaps = (count - 1) * gap;
    return gaps < room ? (room - gaps) / count : 0;
}

class LayoutChoice {
  public:
    LayoutChoice(const MapLayout& layout, const MapRoom& room) : layout_(layout), room_(room) {}

    // `usual_grid_columns` is 0 where no grid is usual.
    MapLayout choose(const std::uint64_t usual_grid_columns) {
        const std::uint64_t most_down =
            most_images(room_.rows, room_.gap, std::min(layout_.rows, room_.fewest));
        const std::uint64_t most_right =
            most_images(room_.columns, room_.gap, std::min(layout_.columns, room_.fewest));
        layout_.image_bin = bin_count(layout_.outer, most_down * most_right);
        const std::uint64_t images = bin_count(layout_.outer, layout_.image_bin);
        layout_.images = images;
        MapLayout best = with_grid(bin_count(images, most_down));
        for (std::uint64_t right = best.grid_columns + 1; right <= std::min(images, most_right);
             ++right) {
            const MapLayout other = with_grid(right);
            best = rank(other) <= rank(best) ? other : best;
        }
        const bool usual_fits = usual_grid_columns > 0 && usual_grid_columns <= most_right
                                && layout_.image_bin == 1
                                && bin_count(images, usual_grid_columns) <= most_down;
        if (usual_fits) {
            const MapLayout usual = with_grid(usual_grid_columns);
            best = elements_of_cell(usual) <= 2 * elements_of_cell(best) ? usual : best;
        }
        return best;
    }

  private:
    MapLayout with_grid(const std::uint64_t grid_columns) const {
        MapLayout layout = layout_;
        layout.grid_columns = grid_columns;
        layout.grid_rows = bin_count(layout.images, grid_columns);
        layout.row_bin =
            bin_count(layout.rows, room_of_image(room_.rows, room_.gap, layout.grid_rows));
        layout.column_bin =
            bin_count(layout.columns, room_of_image(room_.columns, room_.gap, layout.grid_columns));
        const auto [shorter, longer] = std::minmax(layout.rows, layout.columns);
        if (room_.keep_proportions && longer / greatest_kept_proportion <= shorter) {
            layout.row_bin = std::max(layout.row_bin, layout.column_bin);
            layout.column_bin = layout.row_bin;
        }
        layout.cell_rows = bin_count(layout.rows, layout.row_bin);
        layout.cell_columns = bin_count(layout.columns, layout.column_bin);
        return layout;
    }

    static std::uint64_t elements_of_cell(const MapLayout& layout) {
        return layout.row_bin * layout.column_bin;
    }

    // The least of the best grid.
    std::tuple<std::uint64_t, std::uint64_t> rank(const MapLayout& layout) const {
        const auto side = [this](const std::uint64_t images, const std::uint64_t cells) {
            return images * cells + (images - 1) * room_.gap;
        };
        return {elements_of_cell(layout), std::max(side(layout.grid_rows, layout.cell_rows),
                                                   side(layout.grid_columns, layout.cell_columns))};
    }

    MapLayout layout_;
    const MapRoom& room_;
};

} // namespace

MapLayout choose_layout(const Shape& shape, const MapRoom& room) {
    MapLayout layout;
    if (!has_elements(shape)) {
        return layout;
    }
    const std::size_t rank = shape.size();
    layout.columns = rank < 1 ? 1 : shape[rank - 1];
    layout.rows = rank < 2 ? 1 : shape[rank - 2];
    layout.outer = 1;
    std::uint64_t last_outer = 1;
    for (const std::uint64_t extent : outer_shape(shape)) {
        layout.outer *= extent;
        last_outer = extent > 1 ? extent : last_outer;
    }
    const bool has_several_outer = last_outer < layout.outer;
    return LayoutChoice(layout, room).choose(has_several_outer ? last_outer : 0);
}

bool is_reduced(const MapLayout& layout) {
    return layout.image_bin > 1 || layout.row_bin > 1 || layout.column_bin > 1;
}

std::string reduction_text(const MapLayout& layout, const std::string& cell) {
    if (!is_reduced(layout)) {
        return "each " + cell + ": one element";
    }
    std::string factors;
    for (const auto& [extent, bin] :
         {std::pair(layout.outer, layout.image_bin), std::pair(layout.rows, layout.row_bin),
          std::pair(layout.columns, layout.column_bin)}) {
        if (extent > 1) {
            factors += (factors.empty() ? "" : " x ") + std::to_string(bin);
        }
    }
    return "each " + cell + ": the worst of " + factors + " elements";
}

std::string axes_text(const Shape& shape) {
    const std::size_t rank = shape.size();
    if (rank == 0) {
        return "one number";
    }
    std::string right = "right: axis " + std::to_string(rank - 1);
    if (rank == 1) {
        return right;
    }
    std::string image = "down: axis " + std::to_string(rank - 2) + ", " + right;
    if (rank == 2) {
        return image;
    }
    const std::string images = rank == 3 ? "axis 0" : "axes 0 to " + std::to_string(rank - 3);
    return "images: " + images + "; " + image;
}

std::string image_text(const Shape& shape, const MapLayout& layout, const std::uint64_t image) {
    const Shape outer = outer_shape(shape);
    const auto index_text = [&outer](std::uint64_t number) {
        std::string text;
        for (std::size_t axis = outer.size(); axis-- > 0; number /= outer[axis]) {
            text.insert(0, std::to_string(number % outer[axis]) + (text.empty() ? "" : ", "));
        }
        return "[" + text + "]";
    };
    const std::uint64_t first = image * layout.image_bin;
    const std::uint64_t last = std::min(first + layout.image_bin, layout.outer) - 1;
    return index_text(first) + (first == last ? "" : " to " + index_text(last));
}

} // namespace talcmp
