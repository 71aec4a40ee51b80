#include "png_picture.h"

#include "bitmap_font.h"
#include "trouble.h"
#include "whole_file.h"

#include <array>
#include <cstddef>
#include <vector>

#include <png.h>

namespace talcmp {
namespace {

// Pixels for each of a glyph.
constexpr int magnification = 2;

static_assert(glyph_advance * magnification <= Drawing::letter_advance);

// Pixels have the numbers of levels, or of these colours; a pixel of a NaN's pattern is of paper or
// has the level.
constexpr std::uint8_t paper_pixel = level_count;
constexpr std::uint8_t ink_pixel = level_count + 1;
constexpr std::size_t colour_count = level_count + 2;

class Canvas {
  public:
    explicit Canvas(const Drawing& drawing)
        : width_(drawing.width), pixels_(static_cast<std::size_t>(drawing.width)
                                             * static_cast<std::size_t>(drawing.height),
                                         paper_pixel) {}

    // Calls `colour` with the place of each pixel.
    template <typename Colour>
    void paint(const Drawing::Box& box, const Colour& colour) {
        for (int y = box.y; y < box.y + box.height; ++y) {
            for (int x = box.x; x < box.x + box.width; ++x) {
                pixels_[static_cast<std::size_t>(y) * static_cast<std::size_t>(width_)
                        + static_cast<std::size_t>(x)] = colour(x, y);
            }
        }
    }

    const std::vector<std::uint8_t>& pixels() const { return pixels_; }

  private:
    int width_;
    std::vector<std::uint8_t> pixels_;
};

void paint_sample(Canvas& canvas, const Drawing::Sample& sample, const int nan_square) {
    canvas.paint(sample.box, [&](const int x, const int y) {
        const bool is_paper =
            sample.level == nan_level && (x / nan_square + y / nan_square) % 2 != 0;
        return is_paper ? paper_pixel : sample.level;
    });
}

void paint_ink(Canvas& canvas, const Drawing::Box& box) {
    canvas.paint(box, [](int /*x*/, int /*y*/) { return ink_pixel; });
}

void paint_glyph(Canvas& canvas, const char character, const int left, const int top) {
    for (int row = 0; row < glyph_height; ++row) {
        for (int column = 0; column < glyph_width; ++column) {
            if (glyph_is_black(character, column, row)) {
                paint_ink(canvas, {left + column * magnification, top + row * magnification,
                                   magnification, magnification});
            }
        }
    }
}

// Without the bytes with which UTF-8 continues a character.
std::string one_byte_each(const std::string& text) {
    std::string result;
    for (const char byte : text) {
        if ((static_cast<unsigned char>(byte) & 0xC0U) != 0x80) {
            result += byte;
        }
    }
    return result;
}

void paint_text(Canvas& canvas, const Drawing::Text& text) {
    constexpr int advance = glyph_advance * magnification;
    const std::string characters = one_byte_each(text.text);
    const int width = static_cast<int>(characters.size()) * advance;
    int x = text.x;
    if (text.anchor != Drawing::Anchor::start) {
        x -= text.anchor == Drawing::Anchor::end ? width : width / 2;
    }
    for (const char character : characters) {
        paint_glyph(canvas, character, x, text.y);
        x += advance;
    }
}

Canvas painted(const Drawing& drawing) {
    Canvas canvas(drawing);
    for (const auto* const samples : {&drawing.cells, &drawing.samples}) {
        for (const Drawing::Sample& each : *samples) {
            paint_sample(canvas, each, drawing.nan_square);
        }
    }
    for (const Drawing::Box& line : drawing.lines) {
        paint_ink(canvas, line);
    }
    for (const Drawing::Text& each : drawing.texts) {
        paint_text(canvas, each);
    }
    return canvas;
}

using Palette = std::array<std::uint8_t, 3 * colour_count>;

Palette palette(const int all_digits) {
    Palette bytes = {};
    auto* next = bytes.begin();
    for (std::size_t pixel = 0; pixel < colour_count; ++pixel) {
        const Rgb colour = pixel == paper_pixel ? paper
                           : pixel == ink_pixel ? ink
                                                : colour_of(static_cast<Level>(pixel), all_digits);
        for (const std::uint8_t channel : {colour.red, colour.green, colour.blue}) {
            *next++ = channel;
        }
    }
    return bytes;
}

} // namespace

void write_png(const Drawing& drawing, const std::string& path) {
    const Canvas canvas = painted(drawing);
    const Palette colours = palette(drawing.all_digits);
    png_image image = {};
    image.version = PNG_IMAGE_VERSION;
    image.width = static_cast<png_uint_32>(drawing.width);
    image.height = static_cast<png_uint_32>(drawing.height);
    image.format = PNG_FORMAT_RGB_COLORMAP;
    image.colormap_entries = colour_count;
    png_alloc_size_t size = PNG_IMAGE_PNG_SIZE_MAX(image);
    std::string bytes(size, '\0');
    if (png_image_write_to_memory(&image, bytes.data(), &size, 0, canvas.pixels().data(), 0,
                                  colours.data())
        == 0) {
        throw Trouble(path, "cannot be written: " + std::string(image.message));
    }
    bytes.resize(size);
    write_whole_file(path, bytes);
}

} // namespace talcmp
