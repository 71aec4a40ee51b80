// What --slice selects of an array, and where that lies.

#include "layout.h"
#include "selection.h"

#include "support/indices.h"
#include "support/memory_array.h"
#include "support/named_cases.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

using talcmp::Shape;

// ---- From text

struct Range {
    const char* name;
    std::string text;
    std::string meaning; // of each axis "start:stop:step", or "[index]"
};

const Range ranges[] = {
    {"Whole", ":", " ::1"},
    {"TwoColons", "::", " ::1"},
    {"Start", "5:", " 5::1"},
    {"Stop", ":7", " :7:1"},
    {"Step", "::3", " ::3"},
    {"All", "1:20:4", " 1:20:4"},
    {"Index", "3", " [3]"},
    {"FromTheEnd", "-4:-2", " -4:-2:1"},
    {"LastIndex", "-1", " [-1]"},
    {"SeveralAxes", "0:10,:,3", " 0:10:1 ::1 [3]"},
    {"Spaces", "  1 : 2  ,   7 ", " 1:2:1 [7]"},
    {"Backwards", "::-1, 5:2:-2", " ::-1 5:2:-2"},
    {"Ellipsis", "...", ""},
    {"EllipsisAtTheFront", "...,3,::2", " ... [3] ::2"},
    {"EllipsisBetween", "1:2, ... ,3", " 1:2:1 ... [3]"},
    {"EllipsisAtTheEnd", "3,...", " [3]"},
    {"Limits", "-9223372036854775808:9223372036854775807:9223372036854775807",
     " -9223372036854775808:9223372036854775807:9223372036854775807"},
};

std::string text_of(const std::optional<std::int64_t>& number) {
    return number ? std::to_string(*number) : "";
}

std::string meaning_of(const std::vector<talcmp::AxisRange>& axes) {
    std::string text;
    for (const talcmp::AxisRange& range : axes) {
        text += range.one_index ? " [" + text_of(range.start) + "]"
                                : " " + text_of(range.start) + ":" + text_of(range.stop) + ":"
                                      + std::to_string(range.step);
    }
    return text;
}

// The ranges of the first axes and, after three dots, those of the last.
std::string meaning_of(const talcmp::Selection& selection) {
    return meaning_of(selection.first)
           + (selection.last.empty() ? "" : " ..." + meaning_of(selection.last));
}

class Ranges : public NamedCaseTest<Range> {};

TEST_P(Ranges, AreRead) {
    EXPECT_EQ(meaning_of(talcmp::read_selection(GetParam().text)), GetParam().meaning);
}

INSTANTIATE_TEST_SUITE_P(Selection, Ranges, named_cases(ranges), name_of_case);

const Range bad_ranges[] = {
    {"Nothing", "", "an axis has neither an index nor a colon"},
    {"Space", " ", "an axis has neither an index nor a colon"},
    {"NothingBetween", "1,,2", "an axis has neither an index nor a colon"},
    {"NothingAfter", "1,", "an axis has neither an index nor a colon"},
    {"Text", "x", "'x' is no index"},
    {"TextAfterANumber", "1:2x", "'2x' is no index"},
    {"SpaceInANumber", "1 2:", "'1 2' is no index"},
    {"Fraction", " 1.5 ", "'1.5' is no index"},
    {"TooLarge", "9223372036854775808", "'9223372036854775808' is no index"},
    {"ThreeColons", "1:2:3:4", "'1:2:3:4' has more than two colons"},
    {"ThreeColonsLater", "::,1:2:3:4", "'1:2:3:4' has more than two colons"},
    {"Brackets", "[1]", "'[1]' is no index"},
    {"StepZero", "::0", "a step is 0"},
    {"TwoEllipses", "...,1,...", "there is more than one '...'"},
    {"TwoDots", "..", "'..' is no index"},
    {"FourDots", "....", "'....' is no index"},
};

class BadRanges : public NamedCaseTest<Range> {};

TEST_P(BadRanges, AreRefused) {
    EXPECT_EQ(
        thrown_message<std::invalid_argument>([] { talcmp::read_selection(GetParam().text); }),
        GetParam().meaning);
}

INSTANTIATE_TEST_SUITE_P(Selection, BadRanges, named_cases(bad_ranges), name_of_case);

// ---- Of an array

MemoryArray<std::int8_t> array_of(const Shape& shape, const Order order) {
    return {shape, {}, order};
}

struct Part {
    const char* name;
    Shape shape;
    Order order;
    std::string text;
    std::uint64_t offset;
    Shape selected;
    std::vector<std::uint64_t> strides; // 0 where there is no second index
};

const Part parts[] = {
    {"Whole", {4, 5, 6}, Order::c, ":", 0, {4, 5, 6}, {30, 6, 1}},
    {"WholeOfColumns", {4, 5, 6}, Order::fortran, ":", 0, {4, 5, 6}, {1, 4, 20}},
    {"Middle", {4, 5, 6}, Order::c, "1:3,2:,:4", 42, {2, 3, 4}, {30, 6, 1}},
    {"MiddleOfColumns", {4, 5, 6}, Order::fortran, "1:3,2:,:4", 9, {2, 3, 4}, {1, 4, 20}},
    {"Index", {4, 5, 6}, Order::c, "2,:,5", 65, {5}, {6}},
    {"IndexFromTheEnd", {4, 5, 6}, Order::c, "-4,-1", 24, {6}, {1}},
    {"Steps", {4, 5, 6}, Order::c, "::2,1::3,5::7", 11, {2, 2, 1}, {60, 18, 0}},
    {"StepOntoTheEnd", {7}, Order::c, "::3", 0, {3}, {3}},
    {"StepBeforeTheEnd", {6}, Order::c, "::3", 0, {2}, {3}},
    {"FromTheEnd", {9}, Order::c, "-4:-1", 5, {3}, {1}},
    {"CutOff", {9}, Order::c, "-100:100", 0, {9}, {1}},
    {"PastTheEnd", {9}, Order::c, "100:", 9, {0}, {0}},
    {"NothingBetween", {9}, Order::c, "5:5", 5, {0}, {0}},
    {"LastAxis", {4, 5, 6}, Order::c, "...,2", 2, {4, 5}, {30, 6}},
    {"FirstAndLastAxis", {4, 5, 6}, Order::c, "1,...,2", 32, {5}, {6}},
    {"EllipsisForNothing", {4, 5}, Order::c, "1:,...,2:", 7, {3, 3}, {5, 1}},
    {"Reversed", {9}, Order::c, "::-1", 0, {9}, {1}},
    {"EverySecondFromTheEnd", {10}, Order::c, "::-2", 1, {5}, {2}},
    {"BackwardsBetween", {10}, Order::c, "7:2:-2", 3, {3}, {2}},
    {"BackwardsFromTheEnd", {10}, Order::c, "-1:-4:-1", 7, {3}, {1}},
    {"BackwardsCutOff", {10}, Order::c, "100:-100:-3", 0, {4}, {3}},
    {"BackwardsOverNothing", {10}, Order::c, "2:5:-1", 0, {0}, {0}},
    {"BackwardsFromBeforeTheStart", {10}, Order::c, "-11::-1", 0, {0}, {0}},
    {"BackwardsInAnEmptyAxis", {0}, Order::c, "::-1", 0, {0}, {0}},
    {"FarthestStepBack", {10}, Order::c, "::-9223372036854775808", 9, {1}, {0}},
    {"FarthestStart", {9}, Order::c, "-9223372036854775808:", 0, {9}, {1}},
    {"OneElement", {9}, Order::c, "8:", 8, {1}, {0}},
    {"Longest", {1, UINT64_MAX}, Order::c, ":,1:", 1, {1, UINT64_MAX - 1}, {0, 1}},
};

class Parts : public NamedCaseTest<Part> {};

TEST_P(Parts, LieWhereTheyAreSelected) {
    const Part& part = GetParam();
    const talcmp::View view =
        select(array_of(part.shape, part.order), talcmp::read_selection(part.text));
    EXPECT_EQ(view.offset, part.offset);
    EXPECT_EQ(view.shape, part.selected);
    EXPECT_EQ(view.strides, part.strides);
}

INSTANTIATE_TEST_SUITE_P(Selection, Parts, named_cases(parts), name_of_case);

TEST(NoPart, IsSelectedWhereThereIsNone) {
    const auto complaint = [](const Shape& shape, const std::string& text) {
        return thrown_message<std::invalid_argument>(
            [&] { select(array_of(shape, Order::c), talcmp::read_selection(text)); });
    };
    EXPECT_EQ(complaint({2, 4}, "1,3"), "none");
    EXPECT_EQ(complaint({2, 4}, ":,4"), "has no index 4 in axis 1, whose length is 4");
    EXPECT_EQ(complaint({2, 4}, "-2,-4"), "none");
    EXPECT_EQ(complaint({2, 4}, "-3"), "has no index -3 in axis 0, whose length is 2");
    EXPECT_EQ(complaint({0}, "0"), "has no index 0 in axis 0, whose length is 0");
    EXPECT_EQ(complaint({2, 4}, "0,0,0"), "has fewer dimensions (2) than --slice (3)");
    EXPECT_EQ(complaint({}, ":"), "has fewer dimensions (0) than --slice (1)");
}

// ---- Positions

TEST(Positions, AreThoseOfIndices) {
    const Shape shape = {3, 1, 4, 2};
    const auto indices = indices_of(shape);
    const talcmp::RowMajorNumbers by_rows(shape, false);
    const talcmp::RowMajorNumbers by_columns(shape, true);
    for (std::size_t number = 0; number < indices.size(); ++number) {
        const Shape& index = indices[number];
        const std::uint64_t in_columns = index[0] + 3 * (index[2] + 4 * index[3]);
        EXPECT_EQ(talcmp::index_of(shape, false, number), index);
        EXPECT_EQ(talcmp::index_of(shape, true, in_columns), index);
        EXPECT_EQ(by_rows.of(number), number);
        EXPECT_EQ(by_columns.of(in_columns), number);
    }
}

} // namespace
