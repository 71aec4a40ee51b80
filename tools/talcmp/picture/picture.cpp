#include "picture.h"

#include "drawing.h"
#include "ends_with.h"
#include "png_picture.h"
#include "shape_text.h"
#include "svg_picture.h"

namespace talcmp {
namespace {

ArrayCaption caption_of(const ArrayFacts& array) {
    const std::string part =
        array.selected_shape == array.shape ? "" : ", of it " + shape_text(array.selected_shape);
    return {array.name, array.stored_type, shape_text(array.shape) + part};
}

} // namespace

bool is_picture(const std::string& path) {
    return ends_with(path, ".png") || ends_with(path, ".svg");
}

void write_picture(const Comparison& comparison, const DifferenceMap& map,
                   const std::string& path) {
    const PictureCaptions captions = {caption_of(comparison.array1), caption_of(comparison.array2),
                                      all_digits(*comparison.array1.type, *comparison.array2.type)};
    const Drawing drawing = draw(map, captions);
    if (ends_with(path, ".svg")) {
        write_svg(drawing, path);
    } else {
        write_png(drawing, path);
    }
}

} // namespace talcmp
