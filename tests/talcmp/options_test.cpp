// The command lines that talcmp understands, and what it says of others.

#include "options.h"

#include "support/named_cases.h"
#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <sstream>
#include <string>
#include <vector>

namespace {

using Words = std::vector<std::string>;

// The words of a text, which spaces separate; or words given one by one, where one is empty or has
// a space in it.
struct Arguments : Words {
    using Words::Words;
    Arguments(const char* const text) {
        std::istringstream words(text);
        for (std::string word; std::getline(words, word, ' ');) {
            push_back(word);
        }
    }
};

// ---- Those that it does not understand

struct BadUsage {
    const char* name;
    Arguments arguments;
    std::string message;
};

const std::string tolerance_of = "--tol takes a number of binary digits, such as 10 or 2.5, not ";
const std::string differences_of = "--max-differences takes a number from 1 to 1000000, not ";
const std::string threads_of = "--threads takes a number from 1 to 64, not ";
const std::string slice_of = "--slice takes ranges such as 0:10,:,3; in ";
const std::string too_many = "there are more than two arrays; a pattern for several goes in quotes";
const std::string too_few = "two arrays are needed, A and B";
const std::string not_quiet =
    "--quiet prints nothing, and so does not go with --verbose, --report or --json";

const BadUsage operands[] = {
    {"None", {}, too_few},
    {"One", "a", too_few},
    {"EmptyOnes", {"", ""}, too_few},
    {"EmptyFirst", {"", "b"}, too_few},
    {"EmptySecond", {"a", ""}, too_few},
    {"Three", "a b c", too_many},
    {"ThirdAfterAPattern", "a b --exclude x c", too_many},
    {"ThirdAfterDashes", "a -- -b --tol", too_many},
    {"TwoStandardInputs", "- -", "standard input can be only one of the arrays"},
    {"QuietAndVerbose", "-q -v a b", not_quiet},
    {"QuietAndVerboseInOneWord", "-qv a b", not_quiet},
    {"QuietReport", "-q --report a b", not_quiet},
    {"QuietJson", "--quiet --json a b", not_quiet},
};

const std::string by_tol =
    "'; reals are tolerated by --tol DIGITS, in binary digits, or by --relative ERROR";
const std::string by_relative = "'; did you mean --relative?";

const BadUsage unknown[] = {
    {"Long", "--swiftly a b", "there is no option '--swiftly'"},
    {"Short", "-t a b", "there is no option '-t'"},
    {"ShortAfterAFlag", "-vt a b", "there is no option '-vt'"},
    {"Number", "-5 a", "there is no option '-5'"},
    {"Abbreviated", "--strict a b", "there is no option '--strict'; did you mean --strict-type?"},
    {"AbbreviatedWithValue", "--max=3 a b",
     "there is no option '--max'; did you mean --max-differences?"},
    {"OneLetterTooMany", "--slices 1 a b", "there is no option '--slices'; did you mean --slice?"},
    {"OneLetterTooFew", "--jso a b", "there is no option '--jso'; did you mean --json?"},
    {"OtherLetter", "--raport a b", "there is no option '--raport'; did you mean --report?"},
    {"LettersExchanged", "--thraeds=3 a b",
     "there is no option '--thraeds'; did you mean --threads?"},
    {"InCapitals", "--TOL 3 a b", "there is no option '--TOL'"},
    {"OneDash", "-tol 3 a b", "there is no option '-tol'; did you mean --tol?"},
    {"RelativeTolerance", "--rtol 1e-5 a b", "there is no option '--rtol" + by_relative},
    {"RelativeToleranceWithEquals", "--rtol=1e-5 a b", "there is no option '--rtol" + by_relative},
    {"AbsoluteTolerance", "--atol 0 a b", "there is no option '--atol'; did you mean --absolute?"},
    {"Tolerance", "--tolerance 3 a b", "there is no option '--tolerance" + by_tol},
    {"ToleranceMisspelt", "--tolerence 3 a b", "there is no option '--tolerence" + by_tol},
    {"Epsilon", "--eps 1e-5 a b", "there is no option '--eps" + by_tol},
    {"OnlyEquals", "--= a b", "there is no option '--'"},
    {"Controls", "--\x1B[31m\n\xC2\x9B\x9B\xE2\x80\xAE. a b", "there is no option '--?[31m????.'"},
};

const BadUsage values[] = {
    {"RelativeOfOne", "--relative 1 a b",
     "--relative takes an error between 0 and 1, such as 1e-9, not '1'"},
    {"RelativeOfZero", "--relative=0 a b",
     "--relative takes an error between 0 and 1, such as 1e-9, not '0'"},
    {"RelativeNaN", "--relative=nan a b",
     "--relative takes an error between 0 and 1, such as 1e-9, not 'nan'"},
    {"RelativeTooSmall", "--relative=1e-999 a b",
     "--relative 1e-999 is too large or too small for a double"},
    {"RelativeBesideTol", "--relative=.1 --tol=3 a b",
     "--tol and --relative both say how much reals may differ; give one"},
    {"AbsoluteNegative", "--absolute=-1 a b",
     "--absolute takes an error from 0 to 1e300, such as 1e-12, not '-1'"},
    {"AbsoluteTooLarge", "--absolute 1.1e300 a b",
     "--absolute takes an error from 0 to 1e300, such as 1e-12, not '1.1e300'"},
    {"AbsoluteText", "--absolute=x a b",
     "--absolute takes an error from 0 to 1e300, such as 1e-12, not 'x'"},
    {"PictureOfNoKind", "--picture a.jpg a b",
     "--picture takes a file named *.png or *.svg, not 'a.jpg'"},
    {"Missing", "a b --tol", "--tol needs a value"},
    {"MissingAfterALetter", "a b -n", "-n needs a value"},
    {"MissingBeforeAnOption", "--include --json a b",
     "--include needs a value, and '--json' is an option"},
    {"MissingBeforeALetter", "--include -v a b", "--include needs a value, and '-v' is an option"},
    {"MissingBeforeDashes", "--tol -- a b", "--tol needs a value, and '--' is an option"},
    {"Unwanted", "--json=1 a b", "--json takes no value"},
    {"UnwantedAndEmpty", "--strict-type= a b", "--strict-type takes no value"},
    {"UnwantedByHelp", "--help=all", "--help takes no value"},
    {"TolTwice", "--tol 1 --tol=2 a b", "--tol is given twice"},
    {"DifferencesTwice", "-n1 --max-differences 1 a b", "--max-differences is given twice"},
    {"SliceTwice", "--slice=1 --slice=1 a b", "--slice is given twice"},
    {"ThreadsTwice", "--threads=1 --threads=1 a b", "--threads is given twice"},
    {"NoTol", "--tol= a b", "--tol: empty value"},
    {"NoSlice", "--slice= a b", "--slice: empty value"},
    {"NoInclude", "--include= a b", "--include: empty value"},
    {"NoExclude", "--exclude= a b", "--exclude: empty value"},
    {"NoThreads", "--threads= a b", "--threads: empty value"},
    {"NoDifferences", "--max-differences= a b", "--max-differences: empty value"},
    {"EmptyTol", {"--tol", "", "a", "b"}, "--tol: empty value"},
    {"EmptySlice", {"--slice", "", "a", "b"}, "--slice: empty value"},
    {"EmptyInclude", {"--include", "", "a", "b"}, "--include: empty value"},
    {"EmptyDifferences", {"-n", "", "a", "b"}, "-n: empty value"},
    {"TolOfFile", "--tol a b", tolerance_of + "'a'"},
    {"TolOfText", "--tol x a b", tolerance_of + "'x'"},
    {"TolOfNaN", "--tol nan a b", tolerance_of + "'nan'"},
    {"TolOutOfRange", "--tol 1e999 a b", "--tol 1e999 is too large or too small for a double"},
    {"TolWithSpace", {"--tol", "10 ", "a", "b"}, tolerance_of + "'10 '"},
    {"TolWithUnit", "--tol=10bits a b", tolerance_of + "'10bits'"},
    {"TolWithDecimalComma", "--tol=2,5 a b", tolerance_of + "'2,5'"},
    {"TolWithEquals", "--tol==1 a b", tolerance_of + "'=1'"},
    {"TolOfTwoLines", "--tol 1\n2 a b", tolerance_of + "'1?2'"},
    {"TolWithControls", "--tol=\xC2\x9Bm\xE2\x80\xAE a b", tolerance_of + "'?m?'"},
    {"ZeroDifferences", "-n 0 a b", differences_of + "'0'"},
    {"NegativeDifferences", "-n -1 a b", differences_of + "'-1'"},
    {"DifferencesOfText", "-nall a b", differences_of + "'all'"},
    {"DifferencesOfTwoLines", "--max-differences=1\n a b", differences_of + "'1?'"},
    {"TooManyDifferences", "-n 1000001 a b", differences_of + "'1000001'"},
    {"ZeroThreads", "--threads 0 a b", threads_of + "'0'"},
    {"TooManyThreads", "--threads 65 a b", threads_of + "'65'"},
    {"SliceOfText", "--slice x a b", slice_of + "'x': 'x' is no index"},
    {"SliceOfTwoLines", "--slice 1\n2 a b", slice_of + "'1?2': '1?2' is no index"},
};

class BadUsages : public NamedCaseTest<BadUsage> {};

TEST_P(BadUsages, AreRefusedWithAHint) {
    const ProcessResult outcome = run_talcmp(GetParam().arguments);
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.output, "");
    EXPECT_EQ(outcome.errors, "talcmp: " + GetParam().message + "; see 'talcmp --help'\n");
}

INSTANTIATE_TEST_SUITE_P(Operand, BadUsages, named_cases(operands), name_of_case);
INSTANTIATE_TEST_SUITE_P(Unknown, BadUsages, named_cases(unknown), name_of_case);
INSTANTIATE_TEST_SUITE_P(Value, BadUsages, named_cases(values), name_of_case);

// ---- Those that it understands

struct Usage {
    const char* name;
    Arguments arguments;
    std::string output; // of arrays that differ under the tolerance 0 alone
    int status = 0;
};

const std::string differ = "a.npy b.npy differ: ";
const std::string from_one = " (the same from --tol 1 on)\n";
const std::string first = differ + "[0]: 1 and 1.0000000000000002" + from_one;
const std::string second = differ + "[1]: 2 and 2.0000000000000004" + from_one;
const std::string third = differ + "[2]: 4 and 4.000000000000001" + from_one;
const std::string same = "a.npy b.npy are the same\n";

const Usage usages[] = {
    {"NoOptions", "a.npy b.npy", first, 1},
    {"OptionsBetweenOperands", "a.npy --tol 1 b.npy", ""},
    {"OptionsAfterOperands", "a.npy b.npy --tol=1", ""},
    {"NegativeTolerance", "--tol -1 a.npy b.npy", first, 1},
    {"ValueThatLooksLikeAnOption", "--include=--json a.npy b.npy", first, 1},
    {"NegativeSlice", "--slice -1: a.npy b.npy", third, 1},
    {"LetterAndValue", "-n 2 a.npy b.npy", first + second, 1},
    {"LetterWithValue", "-n2 a.npy b.npy", first + second, 1},
    {"AllDifferences", "--max-differences=3 a.npy b.npy", first + second + third, 1},
    {"MostDifferences", "-n1000000 a.npy b.npy", first + second + third, 1},
    {"FlagTwice", "-v --verbose --tol=1 a.npy b.npy", same},
    {"FlagsInOneWord", "-vv --tol=1 a.npy b.npy", same},
    {"FlagAndValueInOneWord", "-vn2 a.npy b.npy", first + second, 1},
    {"ThreadsAndPatterns",
     "--threads 64 --include x --include y --exclude=z --exclude=z a.npy b.npy", first, 1},
    {"StrictType", "--strict-type --tol=1 a.npy b.npy", ""},
    {"Quiet", "--quiet a.npy b.npy", "", 1},
    {"OperandsAfterDashes", "--tol=1 -- -x --tol", ""},
};

// Runs talcmp in a folder with the files a.npy and b.npy, -x and --tol.
class Usages : public NamedCaseTest<Usage> {
  protected:
    void SetUp() override {
        for (const char* const name : {"a.npy", "-x"}) {
            folder_.write(name, npy::row<double>({1, 2, 4}));
        }
        for (const char* const name : {"b.npy", "--tol"}) {
            folder_.write(name, npy::row<double>({1 + 0x1p-52, 2 + 0x1p-51, 4 + 0x1p-50}));
        }
    }

  private:
    CurrentFolder folder_;
};

TEST_P(Usages, AreUnderstood) {
    const ProcessResult outcome = run_talcmp(GetParam().arguments);
    EXPECT_EQ(outcome.status, GetParam().status);
    EXPECT_EQ(outcome.output, GetParam().output);
    EXPECT_EQ(outcome.errors, "");
}

INSTANTIATE_TEST_SUITE_P(CommandLine, Usages, named_cases(usages), name_of_case);

TEST(SortedWords, DoNotDependOnThoseSortedBefore) {
    const std::vector<talcmp::Option> options = {{"--flag", talcmp::Option::Kind::flag, 'f'},
                                                 {"--value", talcmp::Option::Kind::value}};
    for (int times = 0; times < 2; ++times) {
        const talcmp::Words sorted =
            talcmp::sort_words(options, {"-f", "a", "--value=b", "--", "-c"});
        EXPECT_TRUE(has(sorted, "--flag"));
        EXPECT_EQ(value_of(sorted, "--value", "otherwise"), "b");
        EXPECT_EQ(sorted.operands, (Words{"a", "-c"}));
    }
}

} // namespace
