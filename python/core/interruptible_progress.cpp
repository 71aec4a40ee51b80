#include "interruptible_progress.h"

#include <utility>

namespace talcmp {
namespace {

// Seldom enough to cost nothing, often enough for Ctrl-C to feel immediate.
constexpr std::chrono::milliseconds interval{50};

} // namespace

InterruptibleProgress::InterruptibleProgress(pybind11::object callback)
    : callback_(std::move(callback)) {}

void InterruptibleProgress::begin(const std::uint64_t total_bytes) {
    total_ = total_bytes;
    next_ = Clock::now() + interval;
}

void InterruptibleProgress::advance(const std::uint64_t bytes) {
    done_ += bytes;
    if (std::this_thread::get_id() != owner_ || Clock::now() < next_) {
        return;
    }
    {
        const pybind11::gil_scoped_acquire lock;
        call_python();
    }
    next_ = Clock::now() + interval;
    if (error_) {
        throw Interrupted();
    }
}

void InterruptibleProgress::finish() {
    if (!error_) {
        call_python();
    }
    if (error_) {
        throw pybind11::error_already_set(*error_);
    }
}

void InterruptibleProgress::call_python() {
    try {
        check_signals_and_call();
    } catch (pybind11::error_already_set& error) {
        error_.emplace(std::move(error));
    }
}

void InterruptibleProgress::check_signals_and_call() {
    if (PyErr_CheckSignals() != 0) {
        throw pybind11::error_already_set();
    }
    if (!callback_.is_none()) {
        callback_(done_.load(), total_);
    }
}

} // namespace talcmp
