#include "svg_picture.h"

#include "whole_file.h"

#include <array>
#include <cstddef>

namespace talcmp {
namespace {

constexpr int font_size = 18; // whose letters are narrower than Drawing::letter_advance

std::string number(const int value) {
    return std::to_string(value);
}

std::string attribute(const char* const name, const std::string& value) {
    return " " + std::string(name) + "=\"" + value + "\"";
}

std::string hex_code(const Rgb colour) {
    constexpr char digits[] = "0123456789abcdef";
    std::string text = "#";
    for (const unsigned channel : {colour.red, colour.green, colour.blue}) {
        text += digits[channel >> 4U];
        text += digits[channel & 0xFU];
    }
    return text;
}

std::string in_xml(const std::string& text) {
    std::string result;
    for (const char each : text) {
        switch (each) {
        case '&':
            result += "&amp;";
            break;
        case '<':
            result += "&lt;";
            break;
        case '>':
            result += "&gt;";
            break;
        default:
            result += each;
        }
    }
    return result;
}

// In a line of its own.
std::string outline(const Drawing::Box& box) {
    return "\nM" + number(box.x) + " " + number(box.y) + "h" + number(box.width) + "v"
           + number(box.height) + "h-" + number(box.width) + "z";
}

std::string rectangle(const Drawing::Box& box, const std::string& fill) {
    return "<rect" + attribute("x", number(box.x)) + attribute("y", number(box.y))
           + attribute("width", number(box.width)) + attribute("height", number(box.height))
           + attribute("fill", fill) + "/>";
}

// Squares of the colours of NaNs and of paper, in the order of a chessboard.
std::string nan_pattern(const Drawing& drawing) {
    const int square = drawing.nan_square;
    const std::string side = number(2 * square);
    const std::string colour = hex_code(colour_of(nan_level, drawing.all_digits));
    return R"(<pattern id="nan" patternUnits="userSpaceOnUse")" + attribute("width", side)
           + attribute("height", side) + ">\n"
           + rectangle({0, 0, 2 * square, 2 * square}, hex_code(paper)) + "\n"
           + rectangle({0, 0, square, square}, colour) + "\n"
           + rectangle({square, square, square, square}, colour) + "\n</pattern>\n";
}

std::string look(const Level level, const int all_digits) {
    return level == nan_level ? "url(#nan)" : hex_code(colour_of(level, all_digits));
}

// One path for each level.
std::string paths(const Drawing& drawing) {
    std::array<std::string, level_count> outlines;
    for (const auto* const samples : {&drawing.cells, &drawing.samples}) {
        for (const Drawing::Sample& each : *samples) {
            outlines.at(each.level) += outline(each.box);
        }
    }
    std::string text;
    for (std::size_t level = 0; level < outlines.size(); ++level) {
        if (!outlines[level].empty()) {
            text += "<path" + attribute("fill", look(static_cast<Level>(level), drawing.all_digits))
                    + attribute("d", outlines[level]) + "/>\n";
        }
    }
    return text;
}

std::string lines_path(const Drawing& drawing) {
    std::string outlines;
    for (const Drawing::Box& line : drawing.lines) {
        outlines += outline(line);
    }
    return outlines.empty() ? "" : "<path" + attribute("d", outlines) + "/>\n";
}

std::string text_element(const Drawing::Text& text) {
    const char* const anchor = text.anchor == Drawing::Anchor::start    ? ""
                               : text.anchor == Drawing::Anchor::middle ? "middle"
                                                                        : "end";
    return "<text" + attribute("x", number(text.x))
           + attribute("y", number(text.y + Drawing::letter_height))
           + (*anchor == '\0' ? "" : attribute("text-anchor", anchor)) + ">" + in_xml(text.text)
           + "</text>\n";
}

} // namespace

std::string svg_text(const Drawing& drawing) {
    const std::string width = number(drawing.width);
    const std::string height = number(drawing.height);
    std::string text = R"(<svg xmlns="http://www.w3.org/2000/svg")" + attribute("width", width)
                       + attribute("height", height)
                       + attribute("viewBox", "0 0 " + width + " " + height)
                       + R"( shape-rendering="crispEdges" font-family="monospace")"
                       + attribute("font-size", number(font_size)) + ">\n";
    text += nan_pattern(drawing);
    text += R"(<rect width="100%" height="100%")" + attribute("fill", hex_code(paper)) + "/>\n";
    text += paths(drawing);
    text += lines_path(drawing);
    for (const Drawing::Text& each : drawing.texts) {
        text += text_element(each);
    }
    return text + "</svg>\n";
}

void write_svg(const Drawing& drawing, const std::string& path) {
    write_whole_file(path, svg_text(drawing));
}

} // namespace talcmp
