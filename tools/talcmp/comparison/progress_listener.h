// Who wants to know how far a comparison is.

#pragma once

#include <cstdint>

namespace talcmp {

class ProgressListener {
  public:
    ProgressListener() = default;
    ProgressListener(const ProgressListener&) = delete;
    ProgressListener& operator=(const ProgressListener&) = delete;
    virtual ~ProgressListener() = default;

    // Before anything is read, with what will be read at most.
    virtual void begin(std::uint64_t total_bytes) = 0;

    // By any thread, with what has been read since the last call.
    virtual void advance(std::uint64_t bytes) = 0;
};

} // namespace talcmp
