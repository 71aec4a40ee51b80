// What the bar says that shows how far a comparison is.

#include "progress_bar.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <ostream>
#include <string>

namespace {

struct Progress {
    const char* name;
    std::uint64_t done;
    std::uint64_t total;
    double seconds;
    int columns;
    std::string text;
};

void PrintTo(const Progress& progress, std::ostream* out) {
    *out << progress.name;
}

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

class ProgressText : public testing::TestWithParam<Progress> {};

TEST_P(ProgressText, Is) {
    const Progress& progress = GetParam();
    EXPECT_EQ(
        talcmp::progress_text(progress.done, progress.total, progress.seconds, progress.columns),
        progress.text);
}

std::string name_of(const testing::TestParamInfo<Progress>& progress) {
    return progress.param.name;
}

INSTANTIATE_TEST_SUITE_P(Bar, ProgressText, testing::ValuesIn(cases), name_of);

} // namespace
