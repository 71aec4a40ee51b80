// The bar that shows how far a comparison is: what it says, and when it is drawn.

#include "progress_bar.h"
#include "status_line.h"

#include "support/named_cases.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <string>
#include <thread>

#include <fcntl.h>
#include <pty.h>
#include <unistd.h>

namespace {

struct Progress {
    const char* name;
    std::uint64_t done;
    std::uint64_t total;
    double seconds;
    int columns;
    std::string text;
};

constexpr std::uint64_t huge = std::numeric_limits<std::uint64_t>::max();

const Progress cases[] = {
    {"Quarter", 50'000'000, 200'000'000, 2, 50,
     "[====              ]  25 %  25.00 MB/s  0:06 left"},
    {"ThreeQuarters", 6'000'000'000, 8'000'000'000, 5, 50,
     "[==============     ]  75 %  1.20 GB/s  0:02 left"},
    {"JustBelowAGigabyteASecond", 999'000'000, 1'998'000'000, 1, 50,
     "[========         ]  50 %  999.00 MB/s  0:01 left"},
    {"AGigabyteASecond", 1'000'000'000, 2'000'000'000, 1, 50,
     "[=========          ]  50 %  1.00 GB/s  0:01 left"},
    {"All", 1'000'000, 1'000'000, 1, 50, "[===================] 100 %  1.00 MB/s  0:00 left"},
    {"MoreThanAll", 2'000'000, 1'000'000, 1, 50,
     "[===================] 100 %  2.00 MB/s  0:00 left"},
    {"Nothing", 0, 1'000'000, 1, 50, "[               ]   0 %  0.00 MB/s  99:59:59 left"},
    {"JustBelowAnHour", 1'000'000, 3'600'000'000, 1, 50,
     "[                  ]   0 %  1.00 MB/s  59:59 left"},
    {"AnHour", 1'000'000, 3'601'000'000, 1, 50,
     "[                ]   0 %  1.00 MB/s  1:00:00 left"},
    {"HoursMinutesSeconds", 1'000'000, 7'507'000'000, 1, 50,
     "[                ]   0 %  1.00 MB/s  2:05:06 left"},
    {"Ages", 1, huge, 1, 50, "[               ]   0 %  0.00 MB/s  99:59:59 left"},
    {"NarrowestWithBar", 50, 100, 1, 32, "[ ]  50 %  0.00 MB/s  0:01 left"},
    {"TooNarrowForABar", 50, 100, 1, 31, "  50 %  0.00 MB/s  0:01 left"},
    {"Narrower", 50, 100, 1, 10, "  50 %  0"},
    {"OneColumn", 50, 100, 1, 1, ""},
    {"NoColumns", 50, 100, 1, 0, ""},
};

class ProgressText : public NamedCaseTest<Progress> {};

TEST_P(ProgressText, Is) {
    const Progress& progress = GetParam();
    EXPECT_EQ(
        talcmp::progress_text(progress.done, progress.total, progress.seconds, progress.columns),
        progress.text);
}

INSTANTIATE_TEST_SUITE_P(Bar, ProgressText, named_cases(cases), name_of_case);

// ---- When it is drawn

constexpr auto patience = std::chrono::milliseconds(550);

// With a terminal as standard error.
class ProgressBar : public testing::Test {
  protected:
    void SetUp() override {
        ::setenv("TERM", "xterm", 1);
        struct winsize size = {};
        size.ws_col = 50;
        if (::openpty(&controller_, &device_, nullptr, nullptr, &size) != 0) {
            GTEST_SKIP() << "NOT TESTED: there is no pseudo-terminal";
        }
        ::dup2(device_, STDERR_FILENO);
        ::fcntl(controller_, F_SETFL, O_NONBLOCK);
    }
    void TearDown() override {
        ::dup2(old_errors_, STDERR_FILENO);
        for (const int file : {controller_, device_, old_errors_}) {
            ::close(file);
        }
    }

    // What has been written to the terminal since the last call.
    std::string take() const {
        std::array<char, 4096> text = {};
        const ssize_t length = ::read(controller_, text.data(), text.size());
        return {text.data(), static_cast<std::size_t>(std::max<ssize_t>(length, 0))};
    }

  private:
    int old_errors_ = ::dup(STDERR_FILENO);
    int controller_ = -1;
    int device_ = -1;
};

TEST_F(ProgressBar, BeginsAnewWithEachPair) {
    talcmp::ProgressBar bar(true);
    for (const std::uint64_t total : {200U, 1000U}) {
        bar.begin(total);
        bar.advance(50);
        EXPECT_EQ(take(), "");
        std::this_thread::sleep_for(patience);
        bar.advance(50);
        bar.advance(50); // too soon after the last time
        const std::string drawn = take();
        EXPECT_NE(drawn.find(total == 200 ? "]  50 %" : "]  10 %"), std::string::npos) << drawn;
        EXPECT_EQ(std::count(drawn.begin(), drawn.end(), '%'), 1) << drawn;
        talcmp::clear_status();
        EXPECT_EQ(take(), "\r\x1B[K");
        talcmp::clear_status();
        EXPECT_EQ(take(), "");
    }
}

TEST_F(ProgressBar, TakesItselfOffAtItsEnd) {
    {
        talcmp::ProgressBar bar(true);
        bar.begin(100);
        std::this_thread::sleep_for(patience);
        bar.advance(50);
        EXPECT_NE(take().find("]  50 %"), std::string::npos);
    }
    EXPECT_EQ(take(), "\r\x1B[K");
}

TEST_F(ProgressBar, IsNotDrawnWhereItIsNotWanted) {
    talcmp::ProgressBar bar(false);
    bar.begin(100);
    std::this_thread::sleep_for(patience);
    bar.advance(50);
    talcmp::clear_status();
    EXPECT_EQ(take(), "");
}

} // namespace
