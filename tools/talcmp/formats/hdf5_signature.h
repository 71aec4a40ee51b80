// How HDF5 files are recognised.

#pragma once

#include "regular_file.h"

#include <string_view>

namespace talcmp {

inline constexpr std::string_view hdf5_signature = "\x89HDF\r\n\x1a\n";

// Whether the signature is after 512, 1024, 2048, ... bytes of the file, which are the user's.
// Throws Trouble.
bool has_hdf5_after_user_block(RegularFile& file);

} // namespace talcmp
