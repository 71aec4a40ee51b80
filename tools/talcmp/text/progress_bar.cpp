#include "progress_bar.h"

#include "terminal.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <string>

#include <unistd.h>

namespace talcmp {
namespace {

constexpr auto patience = std::chrono::milliseconds(500);
constexpr auto period = std::chrono::milliseconds(100);

std::string left_text(const double seconds) {
    const long long whole = std::llround(seconds);
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

ProgressBar::ProgressBar(const bool wanted) : wanted_(wanted && ::isatty(STDERR_FILENO) == 1) {}

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
        draw(now);
        next_ = now + period;
    }
}

void ProgressBar::draw(const Clock::time_point now) {
    const double seconds = std::chrono::duration<double>(now - begin_).count();
    const double part = static_cast<double>(done_) / static_cast<double>(total_);
    const double rate = static_cast<double>(done_) / seconds;
    const bool fast = rate >= 1e9;
    std::array<char, 64> numbers = {};
    std::snprintf(numbers.data(), numbers.size(), " %3.0f %%  %.2f %s  ", 100 * part,
                  rate / (fast ? 1e9 : 1e6), fast ? "GB/s" : "MB/s");
    const std::string behind = numbers.data() + left_text(seconds * (1 / part - 1));
    // One column stays free, as some terminals begin a new line behind the last.
    const int room = columns_of(STDERR_FILENO) - 3 - static_cast<int>(behind.size());
    std::string bar;
    if (room > 0) {
        const auto width = static_cast<std::size_t>(room);
        const auto full = static_cast<std::size_t>(part * room);
        bar = "[" + std::string(full, '=') + std::string(width - full, ' ') + "]";
    }
    std::fprintf(stderr, "\r%s%s\x1B[K", bar.c_str(), behind.c_str());
    shown_ = true;
}

void ProgressBar::clear() {
    if (shown_) {
        std::fputs("\r\x1B[K", stderr);
        shown_ = false;
    }
}

} // namespace talcmp
