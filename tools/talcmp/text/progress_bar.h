// A progress bar on the terminal for long comparisons.

#pragma once

#include "progress_listener.h"

#include <atomic>
#include <chrono>
#include <cstdint>
#include <mutex>
#include <string>

#include <unistd.h>

namespace talcmp {

// A bar, then what part of the bytes has been read, how fast, and how long the rest will take; in
// fewer than `columns` characters, and without a bar where there is no room for it.
std::string progress_text(std::uint64_t done, std::uint64_t total, double seconds, int columns);

// Appears half a second after a comparison begins, if standard error is a terminal that takes
// escape sequences, and is gone at the end, even if a signal ends the program. Shows what part of
// the bytes has been read, how fast, and how long the rest will take.
class ProgressBar : public ProgressListener {
  public:
    // `terminal` is the descriptor of the terminal that shows what is written to standard error.
    explicit ProgressBar(bool wanted, int terminal = STDERR_FILENO);
    ProgressBar(const ProgressBar&) = delete;
    ProgressBar& operator=(const ProgressBar&) = delete;
    ~ProgressBar() override;

    void begin(std::uint64_t total_bytes) override;
    void advance(std::uint64_t bytes) override;

  private:
    using Clock = std::chrono::steady_clock;

    int terminal_;
    bool wanted_;
    std::uint64_t total_ = 0;
    std::atomic<std::uint64_t> done_ = 0;
    std::mutex drawing_;
    Clock::time_point begin_;
    Clock::time_point next_;
};

} // namespace talcmp
