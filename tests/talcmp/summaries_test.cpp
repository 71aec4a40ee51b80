// What talcmp prints of many arrays: a line each, and how many had which result.

#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <regex>
#include <string>
#include <vector>

namespace {

using Words = std::vector<std::string>;

const std::string one = npy::row<double>({1});
const std::string two = npy::row<double>({2});
const std::string broken = "broken";

// Runs talcmp in a folder with the folders first/ and second/.
class Summaries : public testing::Test {
  protected:
    CurrentFolder folder_;

    void SetUp() override {
        for (const char* const name : {"first", "second"}) {
            std::filesystem::create_directory(name);
        }
    }

    // Writes the files `name`0.npy, `name`1.npy... in each folder, but none where the bytes are
    // empty.
    void write_pairs(const std::string& name, const int count, const std::string& first,
                     const std::string& second) const {
        for (int i = 0; i < count; ++i) {
            const std::string file = "/" + name + std::to_string(i) + ".npy";
            if (!first.empty()) {
                folder_.write("first" + file, first);
            }
            if (!second.empty()) {
                folder_.write("second" + file, second);
            }
        }
    }

    // Copies of the line, with each number below `count` in place of its '#'s.
    static std::string lines(const std::string& line, const int count) {
        std::string text;
        for (int i = 0; i < count; ++i) {
            text += std::regex_replace(line, std::regex("#"), std::to_string(i)) + "\n";
        }
        return text;
    }

    static void expect(const Words& words, const int status, const std::string& output,
                       const std::string& errors = "") {
        const ProcessResult outcome = run_talcmp(words);
        EXPECT_EQ(outcome.status, status);
        EXPECT_EQ(outcome.output, output);
        EXPECT_EQ(outcome.errors, errors);
    }
};

const std::string no_npy =
    "talcmp: first/e0.npy: is not an .npy file: it does not begin with \\x93NUMPY\n";

TEST_F(Summaries, CountEachKind) {
    // No two counts are equal.
    write_pairs("a", 5, one, one);
    write_pairs("b", 4, one, two);
    write_pairs("c", 3, one, "");
    write_pairs("d", 2, "", one);
    write_pairs("e", 1, broken, one);
    const std::string same = lines("first/a#.npy second/a#.npy are the same", 5);
    const std::string output =
        lines("first/b#.npy second/b#.npy differ: [0]: 1 and 2 (no digit in common)", 4)
        + lines("first second differ: only in first: c#.npy", 3)
        + lines("first second differ: only in second: d#.npy", 2)
        + "5 the same, 4 different, 3 only in the first, 2 only in the second, 1 in trouble\n";
    expect({"first", "second"}, 2, output, no_npy);
    expect({"-v", "first", "second"}, 2, same + output, no_npy);
    expect({"-q", "first", "second"}, 2, "", no_npy);
}

TEST_F(Summaries, EndWithTheStatusOfTheWorst) {
    write_pairs("a", 1, one, one);
    expect({"first", "second"}, 0,
           "1 the same, 0 different, 0 only in the first, 0 only in the second, 0 in trouble\n");
    expect({"-q", "first", "second"}, 0, "");
    write_pairs("b", 1, one, two);
    expect({"-q", "first", "second"}, 1, "");
    expect({"-q", "first", "second", "--exclude=b*"}, 0, "");
    write_pairs("c", 1, one, "");
    expect({"-q", "first", "second", "--exclude=b*"}, 1, "");
    write_pairs("d", 1, "", one);
    expect({"-q", "first", "second", "--exclude=[bc]*"}, 1, "");
    write_pairs("e", 1, broken, one);
    expect({"-q", "first", "second", "--exclude=[bcd]*"}, 2, "", no_npy);
}

TEST_F(Summaries, AreNotOfOnePairOfFiles) {
    write_pairs("a", 1, one, one);
    write_pairs("b", 1, one, two);
    const std::string same = "first/a0.npy second/a0.npy are the same\n";
    const std::string different =
        "first/b0.npy second/b0.npy differ: [0]: 1 and 2 (no digit in common)\n";
    expect({"first/a0.npy", "second/a0.npy"}, 0, "");
    expect({"-v", "first/a0.npy", "second/a0.npy"}, 0, same);
    expect({"-q", "first/a0.npy", "second/a0.npy"}, 0, "");
    expect({"first/b0.npy", "second/b0.npy"}, 1, different);
    expect({"-v", "first/b0.npy", "second/b0.npy"}, 1, different);
    expect({"-q", "first/b0.npy", "second/b0.npy"}, 1, "");
    expect({"-v", "first/b0.npy", "second"}, 1, different);
}

TEST_F(Summaries, AreNotOfOperandsInTrouble) {
    const std::string trouble =
        "talcmp: first: holds no file of arrays to compare, nor does second; in folders, these are "
        "the files named *.npy, *.npz, *.h5, *.hdf5, *.he5, *.nc, *.nc4 and *.cdf\n";
    expect({"first", "second"}, 2, "", trouble);
    for (const char* const option : {"-v", "-q", "--report"}) {
        expect({option, "first", "second"}, 2, "", trouble);
    }
}

TEST_F(Summaries, FollowReports) {
    write_pairs("a", 1, npy::row<float>({}), npy::row<double>({}));
    write_pairs("b", 1, npy::row<float>({}), npy::row<double>({1}));
    const std::string first = "  first array           float32 (0,)\n";
    for (const std::string tolerance : {"0", "2.5"}) {
        const std::string under = "  tolerance             " + tolerance + " binary digits\n";
        expect({"--report", "--tol=" + tolerance, "first", "second"}, 1,
               "first/a0.npy second/a0.npy are the same (no elements)\n" + first
                   + "  second array          float64 (0,)\n" + under
                   + "  pairs                 0\n"
                     "first/b0.npy second/b0.npy differ: shape (0,) and (1,)\n"
                   + first + "  second array          float64 (1,)\n" + under
                   + "1 the same, 1 different, 0 only in the first, 0 only in the second, "
                     "0 in trouble\n");
    }
}

// Controls of either kind, an override of the direction, a separator of lines, half a character; an
// umlaut is none of these.
TEST_F(Summaries, ShowNamesInOneLine) {
    folder_.write("first/a\n.npy", one);
    folder_.write("second/a\n.npy", one);
    folder_.write("second/b\x1B[31m.npy", one);
    folder_.write("first/c\xC2\x9B.npy", broken);
    folder_.write("second/c\xC2\x9B.npy", one);
    folder_.write("first/gr\xC3\xBCn\xE2\x80\xAE\xE2\x80\xA8\xC3.npy", one);
    folder_.write("second/gr\xC3\xBCn\xE2\x80\xAE\xE2\x80\xA8\xC3.npy", two);
    expect({"first", "second"}, 2,
           "first second differ: only in second: b?[31m.npy\n"
           "first/gr\xC3\xBCn???.npy second/gr\xC3\xBCn???.npy differ: [0]: 1 and 2 (no digit in "
           "common)\n"
           "1 the same, 1 different, 0 only in the first, 1 only in the second, 1 in trouble\n",
           "talcmp: first/c?.npy: is not an .npy file: it does not begin with \\x93NUMPY\n");
    expect({"[\x9B].npy", "first/a\n.npy"}, 2, "",
           "talcmp: [?].npy: there is no such file; a pattern can be compared with another one or "
           "with a folder\n");
}

// What is known before the trouble is printed before it, on one terminal or in one file too.
TEST_F(Summaries, KeepTheirOrderWithTrouble) {
    write_pairs("a", 1, one, one);
    write_pairs("b", 1, broken, one);
    write_pairs("c", 1, one, two);
    const ProcessResult outcome = run_talcmp({"-v", "first", "second"}, Output::with_errors);
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.output, "");
    EXPECT_EQ(outcome.errors,
              "first/a0.npy second/a0.npy are the same\n"
              "talcmp: first/b0.npy: is not an .npy file: it does not begin with \\x93NUMPY\n"
              "first/c0.npy second/c0.npy differ: [0]: 1 and 2 (no digit in common)\n"
              "1 the same, 1 different, 0 only in the first, 0 only in the second, 1 in trouble\n");
}

} // namespace
