// A file without a name, which is gone when it is closed.

#pragma once

#include "descriptor.h"

#include <cstddef>
#include <cstdint>
#include <string>

namespace talcmp {

// In the folder that the environment variable TMPDIR names.
class TemporaryFile {
  public:
    // Throws Trouble.
    TemporaryFile();

    const std::string& folder() const { return folder_; }
    Descriptor& descriptor() { return file_; }

    // Throws Trouble when there is no room.
    void write(std::uint64_t offset, const void* bytes, std::size_t count);

  private:
    std::string folder_;
    Descriptor file_;
};

} // namespace talcmp
