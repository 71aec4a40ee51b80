// An object that is told how far a comparison has come.

#pragma once

#include <cstdint>

namespace talcmp {

class ProgressListener {
  public:
    ProgressListener() = default;
    ProgressListener(const ProgressListener&) = delete;
    ProgressListener& operator=(const ProgressListener&) = delete;
    virtual ~ProgressListener() = default;

    // Called before anything is read, with the most that will be read.
    virtual void begin(std::uint64_t total_bytes) = 0;

    // Called by any thread, with what has been read since the last call.
    virtual void advance(std::uint64_t bytes) = 0;
};

class NoProgress : public ProgressListener {
  public:
    void begin(std::uint64_t /*total_bytes*/) override {}
    void advance(std::uint64_t /*bytes*/) override {}
};

} // namespace talcmp
