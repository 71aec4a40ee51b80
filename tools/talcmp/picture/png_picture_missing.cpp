// Instead of png_picture.cpp, where there is no libpng.

#include "png_picture.h"

#include "trouble.h"

namespace talcmp {

void write_png(const Drawing& /*drawing*/, const std::string& path) {
    throw Trouble(path,
                  "cannot be written: this talcmp was built without libpng; name an .svg file");
}

} // namespace talcmp
