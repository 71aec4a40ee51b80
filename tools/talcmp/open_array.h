// The formats of files that talcmp reads.

#ifndef TALCMP_OPEN_ARRAY_H
#define TALCMP_OPEN_ARRAY_H

#include "array_source.h"

#include <memory>
#include <string>

namespace talcmp {

// Opens the array that is stored in the file. Throws Trouble when it cannot be read.
std::unique_ptr<ArraySource> open_array(const std::string& path);

} // namespace talcmp

#endif
