// A bar on the terminal for comparisons that take long.

#ifndef TALCMP_PROGRESS_BAR_H
#define TALCMP_PROGRESS_BAR_H

#include "comparison.h"

#include <atomic>
#include <chrono>
#include <cstdint>
#include <mutex>

namespace talcmp {

// Shows itself half a second after a comparison began, where standard error is a terminal, and is
// gone at the end. Shows what part of the bytes has been read, how fast, and how long the rest will
// take.
class ProgressBar : public ProgressListener {
  public:
    explicit ProgressBar(bool wanted);
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;
    ~ProgressBar() override { clear(); }

    void begin(std::uint64_t total_bytes) override;
    void advance(std::uint64_t bytes) override;

    // Takes the bar off the terminal.
    void clear();

  private:
    using Clock = std::chrono::steady_clock;

    void draw(Clock::time_point now);

    bool wanted_;
    std::uint64_t total_ = 0;
    std::atomic<std::uint64_t> done_ = 0;
    std::mutex drawing_;
    Clock::time_point begin_;
    Clock::time_point next_;
    bool shown_ = false;
};

} // namespace talcmp

#endif
