#include "progress_bar.h"

#include "status_line.h"
#include "terminal.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>

namespace talcmp {
namespace {

constexpr auto patience = std::chrono::milliseconds(500);
constexpr auto period = std::chrono::milliseconds(100);

std::string left_text(const double seconds) {
    constexpr double most = 100.0 * 3600 - 1;
    const long long whole = std::llround(std::min(seconds, most));
    std::array<char, 48> text = {};
    if (whole < 3600) {
        std::snprintf(text.data(), text.size(), "%lld:%02lld left", whole / 60, whole % 60);
    } else {
        std::snprintf(text.data(), text.size(), "%lld:%02lld:%02lld left", whole / 3600,
                      whole / 60 % 60, whole % 60);
    }
    return text.data();
}

} // namespace

std::string progress_text(const std::uint64_t done, const std::uint64_t total, const double seconds,
                          const int columns) {
    const double part = std::min(static_cast<double>(done) / static_cast<double>(total), 1.0);
    const double rate = static_cast<double>(done) / seconds;
    const bool fast = rate >= 1e9;
    std::array<char, 64> numbers = {};
    std::snprintf(numbers.data(), numbers.size(), " %3.0f %%  %.2f %s  ", 100 * part,
                  rate / (fast ? 1e9 : 1e6), fast ? "GB/s" : "MB/s");
    const std::string text = numbers.data() + left_text(seconds * (1 / part - 1));
    // One column stays free, as some terminals begin a new line after the last.
    const auto most = static_cast<std::size_t>(std::max(columns - 1, 0));
    if (most < text.size() + 3) {
        return text.substr(0, most);
    }
    const std::size_t width = most - text.size() - 2;
    const auto full = static_cast<std::size_t>(part * static_cast<double>(width));
    return "[" + std::string(full, '=') + std::string(width - full, ' ') + "]" + text;
}

ProgressBar::ProgressBar(const bool wanted, const int terminal)
    : terminal_(terminal), wanted_(wanted && ::isatty(terminal) == 1 && takes_escapes()) {
    if (wanted_) {
        clear_status_at_signals();
    }
}

void ProgressBar::begin(const std::uint64_t total_bytes) {
    total_ = std::max<std::uint64_t>(total_bytes, 1);
    done_ = 0;
    begin_ = Clock::now();
    next_ = begin_ + patience;
}

void ProgressBar::advance(const std::uint64_t bytes) {
    done_ += bytes;
    const std::unique_lock<std::mutex> lock(drawing_, std::try_to_lock);
    if (!wanted_ || !lock) {
        return; // another thread is drawing
    }
    const auto now = Clock::now();
    if (now >= next_) {
        const double seconds = std::chrono::duration<double>(now - begin_).count();
        show_status(progress_text(done_, total_, seconds, columns_of(terminal_)));
        next_ = now + period;
    }
}

ProgressBar::~ProgressBar() {
    clear_status();
}

} // namespace talcmp
