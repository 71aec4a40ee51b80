// Protection against what the HDF5 library does with some damaged files: it crashes, or never ends.

#pragma once

#include <chrono>
#include <string>

namespace talcmp::hdf5 {

// While such an object lives, of which there is one at a time, a crash of its thread ends the
// process with exit status 2 after a message; so does its using the processor for longer than the
// limit. Nothing more can be done: what the library has in memory may be damaged too.
class Guard {
  public:
    // `name` is what the message calls the file.
    Guard(const std::string& name, std::chrono::seconds limit);
    Guard(const Guard&) = delete;
    Guard& operator=(const Guard&) = delete;
    ~Guard();
};

} // namespace talcmp::hdf5
