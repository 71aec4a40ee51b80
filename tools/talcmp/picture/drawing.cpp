#include "drawing.h"

#include "shown.h"
#include "ticks.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

namespace talcmp {
namespace {

using Anchor = Drawing::Anchor;

// Pixels.
constexpr int margin = 16;
constexpr int line_step = 26;
constexpr int smallest_cell = 2;
constexpr int largest_cell = 48;
constexpr int separate_cell = 16; // with paper between it and the next
constexpr int usual_side = 1024;  // of all images, where they can be so small
constexpr int largest_side = smallest_cell * static_cast<int>(room_of_picture.columns);
constexpr int image_gap = smallest_cell * static_cast<int>(room_of_picture.gap);
constexpr int greatest_drawn_proportion = 8; // of an image with few rows or columns, if possible
constexpr int tick_length = 6;
constexpr int least_step_down = 40; // from tick to tick
constexpr int sample_width = 104;
constexpr int sample_height = 18;

// ---- Texts

bool begins_letter(const char byte) {
    return (static_cast<unsigned char>(byte) & 0xC0U) != 0x80; // in UTF-8
}

std::size_t letter_count(const std::string_view text) {
    return static_cast<std::size_t>(std::count_if(text.begin(), text.end(), begins_letter));
}

int text_width(const std::string_view text) {
    return static_cast<int>(letter_count(text)) * Drawing::letter_advance;
}

// Where the letter begins that `before` others come before.
std::size_t letter_offset(const std::string_view text, std::size_t before) {
    std::size_t offset = 0;
    while (offset < text.size() && (!begins_letter(text[offset]) || before-- > 0)) {
        ++offset;
    }
    return offset;
}

// Dots instead of the middle of a text of more than `most` letters.
std::string abbreviated(const std::string& text, const std::size_t most) {
    constexpr std::string_view dots = "...";
    const std::size_t all = letter_count(text);
    if (all <= most) {
        return text;
    }
    const std::size_t head = (most - dots.size()) / 2;
    const std::size_t tail = most - dots.size() - head;
    return text.substr(0, letter_offset(text, head)) + std::string(dots)
           + text.substr(letter_offset(text, all - tail));
}

std::string title_line(const ArrayCaption& array) {
    constexpr std::size_t room = (Drawing::largest_side - 2 * margin) / Drawing::letter_advance;
    constexpr std::size_t room_for_facts = 100;
    const std::string facts = abbreviated(": " + array.type + " " + array.shape, room_for_facts);
    return abbreviated(shown(array.name), room - letter_count(facts)) + facts;
}

// ---- The sizes of cells

struct CellSize {
    int width, height;
};

// Of all images along one side.
struct Extent {
    int images, cells; // the cells of one image
};

int side_length(const Extent side, const int cell) {
    return side.images * side.cells * cell + (side.images - 1) * image_gap;
}

// The largest cell up to `most` with which the side is not longer than `longest`.
int cell_for(const Extent side, const int longest, const int most) {
    const int room = (longest - (side.images - 1) * image_gap) / (side.images * side.cells);
    return std::clamp(room, smallest_cell, most);
}

// Cells are squares, except in long images of few rows or columns, where these are broadened.
CellSize cell_size(const Extent down, const Extent right) {
    const int square = std::min(cell_for(down, usual_side, largest_cell),
                                cell_for(right, usual_side, largest_cell));
    const auto broadened = [square](const Extent side, const Extent other) {
        const int wanted = other.cells * square / (greatest_drawn_proportion * side.cells);
        return cell_for(side, largest_side, std::clamp(wanted, square, largest_cell));
    };
    return {broadened(right, down), broadened(down, right)};
}

// ---- The drawing

class Draughtsman {
  public:
    Draughtsman(const DifferenceMap& map, const PictureCaptions& captions)
        : map_(map), layout_(map.layout()), captions_(captions),
          cell_name_(is_reduced(layout_) ? "cell" : "element") {
        drawing_.all_digits = captions.all_digits;
    }

    Drawing draw() {
        write_line(title_line(captions_.first));
        write_line(title_line(captions_.second));
        if (layout_.images == 0) {
            write_line("no elements");
        } else {
            draw_images();
            write_line(axes_text(map_.shape()));
            write_line(reduction_text(layout_, "cell"));
        }
        draw_legend();
        drawing_.width = right_ + margin;
        drawing_.height = bottom_ + margin - (line_step - Drawing::letter_height);
        return std::move(drawing_);
    }

  private:
    void write(const int x, const int y, const Anchor anchor, const std::string& text) {
        const int width = text_width(text);
        const int after = anchor == Anchor::start ? width : anchor == Anchor::end ? 0 : width / 2;
        drawing_.texts.push_back({x, y, anchor, text});
        right_ = std::max(right_, x + after);
    }

    void write_line(const std::string& text) {
        write(margin, bottom_, Anchor::start, text);
        bottom_ += line_step;
    }

    void draw_images() {
        const Extent down = {static_cast<int>(layout_.grid_rows),
                             static_cast<int>(layout_.cell_rows)};
        const Extent right = {static_cast<int>(layout_.grid_columns),
                              static_cast<int>(layout_.cell_columns)};
        cell_ = cell_size(down, right);
        image_ = {0, 0, right.cells * cell_.width, down.cells * cell_.height};
        drawing_.nan_square = std::clamp(std::min(cell_.width, cell_.height) / 4, 1, 6);
        place_images(side_length(right, cell_.width));
        for (std::uint64_t image = 0; image < layout_.images; ++image) {
            draw_image(image);
        }
        draw_row_ticks();
        draw_column_ticks();
        if (layout_.images > 1) {
            draw_image_names();
        }
        bottom_ = image_.y + side_length(down, cell_.height) + 2 * line_step;
    }

    // The first image; the ticks are to its left and the names of images above.
    void place_images(const int width) {
        const int names = layout_.images > 1 ? line_step : margin / 2;
        const std::string last_row = std::to_string(layout_.rows - 1);
        const int ticks = layout_.rows > 1 ? text_width(last_row) + 2 * tick_length : 0;
        image_.x = margin + ticks;
        image_.y = bottom_ + names;
        right_ = std::max(right_, image_.x + width);
    }

    Drawing::Box box_of(const std::uint64_t image) const {
        const auto row = static_cast<int>(image / layout_.grid_columns);
        const auto column = static_cast<int>(image % layout_.grid_columns);
        return {image_.x + column * (image_.width + image_gap),
                image_.y + row * (image_.height + image_gap), image_.width, image_.height};
    }

    void draw_image(const std::uint64_t image) {
        const Drawing::Box box = box_of(image);
        draw_frame(box);
        for (std::uint64_t row = 0; row < layout_.cell_rows; ++row) {
            draw_row(image, row, box.x, box.y + static_cast<int>(row) * cell_.height);
        }
    }

    void draw_frame(const Drawing::Box& box) {
        drawing_.lines.push_back({box.x - 1, box.y - 1, box.width + 2, 1});
        drawing_.lines.push_back({box.x - 1, box.y + box.height, box.width + 2, 1});
        drawing_.lines.push_back({box.x - 1, box.y, 1, box.height});
        drawing_.lines.push_back({box.x + box.width, box.y, 1, box.height});
    }

    void draw_row(const std::uint64_t image, const std::uint64_t row, const int x, const int y) {
        const bool separate = std::min(cell_.width, cell_.height) >= separate_cell;
        const int paper_between = separate ? 1 : 0;
        const std::uint64_t columns = layout_.cell_columns;
        std::uint64_t end = 0;
        for (std::uint64_t begin = 0; begin < columns; begin = end) {
            const Level level = map_.level(image, row, begin);
            end = begin + 1;
            while (!separate && end < columns && map_.level(image, row, end) == level) {
                ++end;
            }
            const int width = static_cast<int>(end - begin) * cell_.width - paper_between;
            drawing_.cells.push_back({{x + static_cast<int>(begin) * cell_.width, y, width,
                                       cell_.height - paper_between},
                                      level});
        }
    }

    // Beside the first image of each row of images.
    void draw_row_ticks() {
        const int apart = (least_step_down + cell_.height - 1) / cell_.height;
        const auto ticks =
            round_ticks(layout_.rows, layout_.row_bin, static_cast<std::uint64_t>(apart));
        for (std::uint64_t grid_row = 0; layout_.rows > 1 && grid_row < layout_.grid_rows;
             ++grid_row) {
            const Drawing::Box box = box_of(grid_row * layout_.grid_columns);
            for (const auto& [index, cell] : ticks) {
                const int y = box.y + static_cast<int>(cell) * cell_.height + cell_.height / 2;
                drawing_.lines.push_back({box.x - 1 - tick_length, y - 1, tick_length, 2});
                write(box.x - 2 * tick_length, y - Drawing::letter_height / 2, Anchor::end,
                      std::to_string(index));
            }
        }
    }

    // Beneath the last row of images.
    void draw_column_ticks() {
        const int widest = text_width(std::to_string(layout_.columns - 1));
        const int apart = (widest + 2 * Drawing::letter_advance + cell_.width - 1) / cell_.width;
        const auto ticks =
            round_ticks(layout_.columns, layout_.column_bin, static_cast<std::uint64_t>(apart));
        const std::uint64_t first = (layout_.grid_rows - 1) * layout_.grid_columns;
        for (std::uint64_t image = first; image < layout_.images; ++image) {
            const Drawing::Box box = box_of(image);
            const bool is_last = image + 1 == layout_.images;
            for (const auto& [index, cell] : ticks) {
                const std::string text = std::to_string(index);
                const int x = box.x + static_cast<int>(cell) * cell_.width + cell_.width / 2;
                if (!is_last && x + text_width(text) / 2 > box.x + box.width + image_gap / 2) {
                    break; // it would meet the next image's
                }
                const int y = box.y + box.height + 1;
                drawing_.lines.push_back({x - 1, y, 2, tick_length});
                write(x, y + tick_length + 3, Anchor::middle, text);
            }
        }
    }

    // Above the images; where names are longer than images, above some of them.
    void draw_image_names() {
        constexpr std::size_t longest = 100;
        const auto name_of = [&](const std::uint64_t image) {
            return abbreviated(image_text(map_.shape(), layout_, image), longest);
        };
        int widest = 0;
        for (std::uint64_t image = 0; image < layout_.images; ++image) {
            widest = std::max(widest, text_width(name_of(image)));
        }
        const int stride = image_.width + image_gap;
        const int every = (widest + Drawing::letter_advance + stride - 1) / stride;
        const int right = std::max(right_, image_.x + widest);
        for (std::uint64_t image = 0; image < layout_.images; ++image) {
            const Drawing::Box box = box_of(image);
            const bool is_named =
                image % layout_.grid_columns % static_cast<std::uint64_t>(every) == 0;
            const std::string name = name_of(image);
            if (is_named && box.x + text_width(name) <= right) {
                write(box.x, box.y - Drawing::letter_height - 6, Anchor::start, name);
            }
        }
    }

    void draw_legend() {
        const ClassCounts counts = class_counts(map_, captions_.all_digits);
        bottom_ += line_step / 2;
        for (const LevelClass each : level_classes) {
            const std::uint64_t count = counts.at(static_cast<std::size_t>(each));
            if (each == LevelClass::nothing && count == 0) {
                continue;
            }
            draw_samples(each);
            write(margin + sample_width + Drawing::letter_advance, bottom_, Anchor::start,
                  class_text(each, captions_.all_digits) + ": " + count_text(count, cell_name_));
            bottom_ += line_step;
        }
    }

    void draw_samples(const LevelClass wanted) {
        std::vector<Level> levels;
        for (std::size_t level = 0; level < level_count; ++level) {
            if (class_of_level(static_cast<Level>(level), captions_.all_digits) == wanted) {
                levels.push_back(static_cast<Level>(level));
            }
        }
        if (wanted != LevelClass::some_digits) {
            levels.resize(1); // the others look the same
        }
        const int width = sample_width / static_cast<int>(levels.size());
        const int y = bottom_ - (sample_height - Drawing::letter_height) / 2;
        int x = margin;
        for (const Level level : levels) {
            drawing_.samples.push_back({{x, y, width, sample_height}, level});
            x += width;
        }
        draw_frame({margin, y, x - margin, sample_height});
    }

    const DifferenceMap& map_;
    const MapLayout& layout_;
    const PictureCaptions& captions_;
    std::string cell_name_;
    Drawing drawing_;
    CellSize cell_ = {};
    Drawing::Box image_ = {}; // the first one
    int right_ = 0;           // of all that is drawn
    int bottom_ = margin;
};

} // namespace

Drawing draw(const DifferenceMap& map, const PictureCaptions& captions) {
    return Draughtsman(map, captions).draw();
}

} // namespace talcmp
