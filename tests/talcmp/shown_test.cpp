// What messages say instead of characters that a terminal might take for commands.

#include "shown.h"

#include "support/named_cases.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using talcmp::shown;

struct Text {
    const char* name;
    std::string text;
    std::string shown;
};

std::string repeated(const std::string& text, const int times) {
    std::string result;
    for (int i = 0; i < times; ++i) {
        result += text;
    }
    return result;
}

const Text texts[] = {
    {"Nothing", "", "''"},
    {"Ascii", "a b~[1]", "a b~[1]"},
    {"AsciiControls", std::string("\0\t\n\r\x1B[31m\x1F\x7F.", 12), "?????[31m??."},
    {"FirstAndLastC1Control", "a\xC2\x80\xC2\x9F.", "a??."},
    {"AfterC1Controls", "\xC2\xA0\xC2\xBF", "\xC2\xA0\xC2\xBF"},
    {"C1Byte", "a\x9Bm", "a?m"},
    {"ArabicLetterMark", "\xD8\x9B\xD8\x9C\xD8\x9D", "\xD8\x9B?\xD8\x9D"},
    {"DirectionMarks", "\xE2\x80\x8D\xE2\x80\x8E\xE2\x80\x8F\xE2\x80\x90",
     "\xE2\x80\x8D??\xE2\x80\x90"},
    {"Separators", "\xE2\x80\xA7\xE2\x80\xA8\xE2\x80\xA9", "\xE2\x80\xA7??"},
    {"Overrides", "\xE2\x80\xAA\xE2\x80\xAB\xE2\x80\xAC\xE2\x80\xAD\xE2\x80\xAE\xE2\x80\xAF",
     "?????\xE2\x80\xAF"},
    {"Isolates", "\xE2\x81\xA5\xE2\x81\xA6\xE2\x81\xA7\xE2\x81\xA8\xE2\x81\xA9\xE2\x81\xAA",
     "\xE2\x81\xA5????\xE2\x81\xAA"},
    {"Umlaut", "gr\xC3\xB6\xC3\x9F.", "gr\xC3\xB6\xC3\x9F."},
    {"Kanji", "\xE6\xBC\xA2", "\xE6\xBC\xA2"},
    {"Emoji", "\xF0\x9F\x98\x80", "\xF0\x9F\x98\x80"},
    {"LastCharacter", "\xF4\x8F\xBF\xBF", "\xF4\x8F\xBF\xBF"},
    {"AfterTheLastCharacter", "\xF4\x90\x80\x80", "????"},
    {"ReplacementCharacter", "\xEF\xBF\xBD", "\xEF\xBF\xBD"},
    {"OverlongInTwo", "\xC1\xBF", "??"},
    {"OverlongInThree", "\xE0\x9F\xBF", "???"},
    {"OverlongInFour", "\xF0\x8F\xBF\xBF", "????"},
    {"Surrogates", "\xED\x9F\xBF\xED\xA0\x80\xED\xBF\xBF\xEE\x80\x80",
     "\xED\x9F\xBF??????\xEE\x80\x80"},
    {"CutInTwo", "\xC3", "?"},
    {"CutInThree", "\xE6\xBC", "??"},
    {"CutInFour", "\xF0\x9F\x98", "???"},
    {"LeadBeforeAscii", "\xC3.\xE6\xBC.\xF0\x9F\x98.", "?.??.???."},
    {"AsLongAsIsShown", std::string(1000, 'x'), std::string(1000, 'x')},
    {"LongerThanIsShown",
     std::string(699, 'x') + "a" + std::string(51, 'y') + "b" + std::string(249, 'z'),
     std::string(699, 'x') + "a [...] b" + std::string(249, 'z')},
    {"LongAndNotAscii", repeated("\xE6\xBC\xA2", 400),
     repeated("\xE6\xBC\xA2", 233) + " [...] " + repeated("\xE6\xBC\xA2", 84)},
    {"NoLeads", "\xBF\xF5\xFF", "???"},
};

class Shown : public NamedCaseTest<Text> {};

TEST_P(Shown, IsHarmless) {
    EXPECT_EQ(shown(GetParam().text), GetParam().shown);
    EXPECT_EQ(shown(shown(GetParam().text)), GetParam().shown);
}

INSTANTIATE_TEST_SUITE_P(Text, Shown, named_cases(texts), name_of_case);

TEST(StandIns, MayDependOnWhatTheyStandFor) {
    const auto stand_in = [](const char32_t code) {
        return "<" + std::to_string(static_cast<unsigned>(code)) + ">";
    };
    EXPECT_EQ(talcmp::without_controls("a\n\xC2\x9B\xE2\x81\xA9\x9B\xC3\xB6", stand_in),
              "a<10><155><8297><65533>\xC3\xB6");
    EXPECT_EQ(talcmp::without_controls("", stand_in), "");
}

} // namespace
