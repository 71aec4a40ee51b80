// How often the module is asked about pairs that it has answered already, or that are alike.

#include "talnumericarray_compare.h"

#include "support/compare_arrays.h"
#include "support/memory_array.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstddef>
#include <limits>
#include <memory>
#include <vector>

// The linker gives these names to the module's function and to the one that is called instead.
extern "C" int module_answer(talreal tolerance, int compare_different_types, TalNumericArray first,
                             TalNumericArray second) __asm__("__real_TalNumericArray_sameQ");
extern "C" int counted_answer(talreal tolerance, int compare_different_types, TalNumericArray first,
                              TalNumericArray second) __asm__("__wrap_TalNumericArray_sameQ");

namespace {

int questions = 0;

// A hundred sums, two of three of which differ, in one to four digits.
talcmp::Comparison compare_sums(const bool report, const std::size_t differences) {
    std::vector<double> forward(100);
    std::vector<double> backward(forward.size());
    for (std::size_t i = 0; i < forward.size(); ++i) {
        forward[i] = 1 + std::sqrt(static_cast<double>(i)) / 16;
        const std::size_t places = i % 3 == 0 ? 0 : i % 5 + 1;
        backward[i] =
            forward[i] + static_cast<double>(places) * std::numeric_limits<double>::epsilon();
    }
    talcmp::Question question = question_of(1);
    question.report = report;
    question.differences = differences;
    using Array = MemoryArray<double>;
    questions = 0;
    return compare_arrays(std::make_unique<Array>(talcmp::Shape{100}, forward),
                          std::make_unique<Array>(talcmp::Shape{100}, backward), question);
}

TEST(Questions, AreFewWhereAReportIsAskedFor) {
    const talcmp::Comparison result = compare_sums(true, 100);
    EXPECT_EQ(result.places.size(), 66U);
    EXPECT_EQ(result.report->smallest_tolerance, 4);
    EXPECT_GT(questions, 0);
    EXPECT_LE(questions, 45);
}

// One or two questions find each place, and a few more in all how much the pairs differ.
TEST(Questions, AreFewWherePlacesAreListed) {
    EXPECT_EQ(compare_sums(false, 100).places.size(), 66U);
    EXPECT_LE(questions, 2 * 66 + 45);
}

TEST(Questions, AreFewAboutOnePlace) {
    EXPECT_EQ(compare_sums(false, 1).places.size(), 1U);
    EXPECT_LE(questions, 25);
}

} // namespace

int counted_answer(const talreal tolerance, const int compare_different_types,
                   TalNumericArray first, TalNumericArray second) {
    ++questions;
    return module_answer(tolerance, compare_different_types, first, second);
}
