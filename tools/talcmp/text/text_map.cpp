#include "text_map.h"

#include "environment.h"
#include "looks.h"
#include "ticks.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <cstddef>
#include <string_view>
#include <vector>

namespace talcmp {
namespace {

constexpr std::size_t map_margin = 2;
constexpr std::uint64_t lines_of_cells = 16;

// ---- The characters

// Levels that have one character: classes, of which some digits have three.
enum class Shade { nothing, equal, few, more, many, none_in_common, nan };

constexpr std::array<Shade, 7> shades = {Shade::nothing, Shade::equal, Shade::few,
                                         Shade::more,    Shade::many,  Shade::none_in_common,
                                         Shade::nan};

constexpr std::array<std::string_view, shades.size()> blocks = {" ", "·", "░", "▒", "▓", "█", "N"};
constexpr std::array<std::string_view, shades.size()> ascii = {" ", ".", "-", "+", "x", "#", "N"};

constexpr int thirds = 3;

Shade shade_of(const Level level, const int all_digits) {
    switch (class_of_level(level, all_digits)) {
    case LevelClass::nothing:
        return Shade::nothing;
    case LevelClass::equal:
        return Shade::equal;
    case LevelClass::some_digits: {
        const int third = (digits_of_level(level) - 1) * thirds / (all_digits - 1);
        return static_cast<Shade>(static_cast<int>(Shade::few) + third);
    }
    case LevelClass::nan:
        return Shade::nan;
    default:
        return Shade::none_in_common;
    }
}

// The fewest digits of a third, or of the one after the last.
int first_digits(const int third, const int all_digits) {
    return (third * (all_digits - 1) + thirds - 1) / thirds + 1;
}

std::string shade_text(const Shade shade, const int all_digits) {
    switch (shade) {
    case Shade::nothing:
        return class_text(LevelClass::nothing, all_digits);
    case Shade::equal:
        return class_text(LevelClass::equal, all_digits);
    case Shade::none_in_common:
        return class_text(LevelClass::all_digits, all_digits);
    case Shade::nan:
        return class_text(LevelClass::nan, all_digits);
    default:
        break;
    }
    const int third = static_cast<int>(shade) - static_cast<int>(Shade::few);
    return std::to_string(first_digits(third, all_digits)) + " to "
           + std::to_string(first_digits(third + 1, all_digits) - 1) + " digits";
}

// ---- Lines

std::size_t label_width(const std::uint64_t rows) {
    return rows < 2 ? 0 : std::to_string(rows - 1).size() + 1;
}

// One column stays free, as some terminals begin a new line after the last.
std::size_t room_in_line(const int columns) {
    return static_cast<std::size_t>(std::max(columns - 1, 0));
}

// Writes the text from a column on, unless what is there already reaches that column.
void write_at(std::string& line, const std::size_t column, const std::string& text) {
    if (line.empty() || line.size() < column) {
        line.resize(column, ' ');
        line += text;
    }
}

class MapText {
  public:
    MapText(const DifferenceMap& map, const int all_digits, const CharacterSet characters,
            const Terminal& terminal)
        : map_(map), layout_(map.layout()), all_digits_(all_digits),
          characters_(characters == CharacterSet::utf8 ? blocks : ascii), terminal_(terminal),
          room_(room_in_line(terminal.columns())), left_(map_margin + label_width(layout_.rows)),
          stride_(static_cast<std::size_t>(layout_.cell_columns) + 1) {}

    std::string text() {
        add_line("differences; " + axes_text(map_.shape()));
        if (layout_.images == 0) {
            add_line("no elements");
            return text_;
        }
        add_line(reduction_text(layout_, "character"));
        for (std::uint64_t grid_row = 0; grid_row < layout_.grid_rows; ++grid_row) {
            if (layout_.images > 1) {
                add_names(grid_row);
            }
            for (std::uint64_t row = 0; row < layout_.cell_rows; ++row) {
                add_cells(grid_row, row);
            }
        }
        add_column_ticks();
        add_legend();
        return text_;
    }

  private:
    // In as many lines as it takes.
    void add_line(std::string line) {
        const std::size_t most = std::max(room_, map_margin + 1) - map_margin;
        while (line.size() > most) {
            const std::size_t last = line.rfind(' ', most);
            const std::size_t end = last == std::string::npos ? line.find(' ') : last;
            if (end == std::string::npos) {
                break;
            }
            text_ += std::string(map_margin, ' ') + line.substr(0, end) + "\n";
            line.erase(0, end + 1);
        }
        text_ += std::string(map_margin, ' ') + line + "\n";
    }

    std::uint64_t first_image(const std::uint64_t grid_row) const {
        return grid_row * layout_.grid_columns;
    }

    std::uint64_t images_in(const std::uint64_t grid_row) const {
        return std::min(layout_.grid_columns, layout_.images - first_image(grid_row));
    }

    std::size_t column_of(const std::uint64_t grid_column) const {
        return left_ + static_cast<std::size_t>(grid_column) * stride_;
    }

    // Of as many images as there is room for.
    void add_names(const std::uint64_t grid_row) {
        std::string line;
        for (std::uint64_t column = 0; column < images_in(grid_row); ++column) {
            const std::string name =
                image_text(map_.shape(), layout_, first_image(grid_row) + column);
            const std::size_t end = column_of(column) + name.size();
            if (column == 0 || end < column_of(layout_.grid_columns)) {
                write_at(line, column_of(column), name);
            }
        }
        text_ += line.substr(0, room_) + "\n";
    }

    void add_cells(const std::uint64_t grid_row, const std::uint64_t row) {
        std::string label;
        if (layout_.rows > 1) {
            label = std::to_string(row * layout_.row_bin) + " ";
        }
        text_ += std::string(left_ - label.size(), ' ') + label;
        for (std::uint64_t column = 0; column < images_in(grid_row); ++column) {
            text_ += column == 0 ? "" : " ";
            add_row(first_image(grid_row) + column, row);
        }
        text_ += "\n";
    }

    void add_row(const std::uint64_t image, const std::uint64_t row) {
        const auto shade_at = [&](const std::uint64_t column) {
            return shade_of(map_.level(image, row, column), all_digits_);
        };
        std::uint64_t end = 0;
        for (std::uint64_t begin = 0; begin < layout_.cell_columns; begin = end) {
            const Shade shade = shade_at(begin);
            std::string run;
            for (end = begin; end < layout_.cell_columns && shade_at(end) == shade; ++end) {
                run += character(shade);
            }
            text_ += coloured(run, shade);
        }
    }

    std::string_view character(const Shade shade) const {
        return characters_.at(static_cast<std::size_t>(shade));
    }

    std::string coloured(const std::string& text, const Shade shade) const {
        if (shade == Shade::nothing || shade == Shade::equal) {
            return text;
        }
        const bool bad = shade == Shade::none_in_common || shade == Shade::nan;
        return terminal_.coloured(text, bad ? Colour::red : Colour::blue);
    }

    void add_column_ticks() {
        const std::size_t apart = std::to_string(layout_.columns - 1).size() + 2;
        const auto ticks = round_ticks(layout_.columns, layout_.column_bin, apart);
        const std::size_t end = column_of(layout_.grid_columns) - 1;
        std::string line;
        for (std::uint64_t column = 0; column < layout_.grid_columns; ++column) {
            for (const auto& [index, cell] : ticks) {
                const std::string text = std::to_string(index);
                const std::size_t begin = column_of(column) + static_cast<std::size_t>(cell);
                if (begin + text.size() <= end) {
                    write_at(line, begin, text);
                }
            }
        }
        text_ += line + "\n";
    }

    // What the characters mean that there are.
    void add_legend() {
        std::array<bool, shades.size()> is_used = {};
        const auto counts = map_.counts();
        for (std::size_t level = 0; level < counts.size(); ++level) {
            const Shade shade = shade_of(static_cast<Level>(level), all_digits_);
            is_used.at(static_cast<std::size_t>(shade)) |= counts[level] != 0;
        }
        std::size_t length = 0; // of the line so far
        for (const Shade shade : shades) {
            if (!is_used.at(static_cast<std::size_t>(shade))) {
                continue;
            }
            const std::string meaning = shade_text(shade, all_digits_);
            const std::size_t width = map_margin + 2 + meaning.size();
            if (length != 0 && length + width > room_) {
                text_ += "\n";
                length = 0;
            }
            text_ += std::string(map_margin, ' ') + coloured(std::string(character(shade)), shade)
                     + " " + meaning;
            length += width;
        }
        text_ += "\n";
    }

    const DifferenceMap& map_;
    const MapLayout& layout_;
    int all_digits_;
    const std::array<std::string_view, shades.size()>& characters_;
    const Terminal& terminal_;
    std::size_t room_;   // characters of a line
    std::size_t left_;   // of the first image
    std::size_t stride_; // from one image to the next
    std::string text_;
};

} // namespace

CharacterSet character_set_of_environment() {
    for (const char* const variable : {"LC_ALL", "LC_CTYPE", "LANG"}) {
        const std::string value = environment(variable);
        if (value.empty()) {
            continue;
        }
        std::string name;
        for (const char each : value) {
            name += static_cast<char>(std::tolower(static_cast<unsigned char>(each)));
        }
        const bool is_utf8 =
            name.find("utf-8") != std::string::npos || name.find("utf8") != std::string::npos;
        return is_utf8 ? CharacterSet::utf8 : CharacterSet::ascii;
    }
    return CharacterSet::ascii;
}

MapRoom room_of_text(const Shape& shape, const int columns) {
    const std::uint64_t rows = shape.size() < 2 ? 1 : shape[shape.size() - 2];
    const std::size_t left = map_margin + label_width(rows);
    const std::size_t all = room_in_line(columns);
    const std::size_t room = all > left ? all - left : 1;
    return {lines_of_cells, room, 1, 3, false};
}

std::string text_map(const DifferenceMap& map, const int all_digits, const CharacterSet characters,
                     const Terminal& terminal) {
    return MapText(map, all_digits, characters, terminal).text();
}

} // namespace talcmp
