// Lets Python interrupt a comparison that runs without the interpreter's lock.

#pragma once

#include "progress_listener.h"

#include <pybind11/pybind11.h>

#include <atomic>
#include <chrono>
#include <cstdint>
#include <optional>
#include <thread>

namespace talcmp {

// From time to time the thread that has made this object takes the interpreter's lock, lets Python
// handle signals, and calls the caller's function. If either raises an exception, the comparison
// ends by `Interrupted`.
class InterruptibleProgress : public ProgressListener {
  public:
    struct Interrupted {};

    // `callback` takes the numbers of bytes that have been compared and that will be at most; or is
    // None.
    explicit InterruptibleProgress(pybind11::object callback);

    void begin(std::uint64_t total_bytes) override;
    void advance(std::uint64_t bytes) override;

    // With the interpreter's lock: throws what Python raised meanwhile; calls the function for the
    // last time otherwise.
    void finish();

  private:
    using Clock = std::chrono::steady_clock;

    void call_python();
    void check_signals_and_call();

    pybind11::object callback_;
    std::thread::id owner_ = std::this_thread::get_id();
    Clock::time_point next_ = Clock::now();
    std::uint64_t total_ = 0;
    std::atomic<std::uint64_t> done_ = 0;
    std::optional<pybind11::error_already_set> error_;
};

} // namespace talcmp
