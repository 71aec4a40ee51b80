// What talcmp prints of many arrays: a line each, and how many had which result.

#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <utility>
#include <vector>

namespace {

using Words = std::vector<std::string>;

const std::string one = npy::row<double>({1});
const std::string two = npy::row<double>({2});
const std::string broken = "broken";

// Runs talcmp in a folder with the folders first/ and second/.
class Summaries : public testing::Test {
  protected:
    void SetUp() override {
        for (const char* const name : {"first", "second"}) {
            std::filesystem::create_directory(folder_.path_of(name));
        }
        std::filesystem::current_path(folder_.path_of(""));
    }
    void TearDown() override { std::filesystem::current_path(before_); }

    void write(const std::string& path, const std::string& bytes) const {
        folder_.write(path, bytes);
    }

    // Of the files `name`0.npy, `name`1.npy...; of none where the bytes are empty.
    void write_pairs(const std::string& name, const int count, const std::string& first,
                     const std::string& second) const {
        for (int i = 0; i < count; ++i) {
            const std::string file = name + std::to_string(i) + ".npy";
            for (const auto& [folder, bytes] :
                 {std::pair("first/", &first), std::pair("second/", &second)}) {
                if (!bytes->empty()) {
                    write(folder + file, *bytes);
                }
            }
        }
    }

    // Each count is another one.
    void write_all_kinds() const {
        write_pairs("a", 5, one, one);
        write_pairs("b", 4, one, two);
        write_pairs("c", 3, one, "");
        write_pairs("d", 2, "", one);
        write_pairs("e", 1, broken, one);
    }

    static std::string lines(const std::string& name, const int count, const std::string& before,
                             const std::string& after) {
        std::string text;
        for (int i = 0; i < count; ++i) {
            const std::string file = name + std::to_string(i) + ".npy";
            text += before + "first/" + file + " second/" + file + after + "\n";
        }
        return text;
    }

    static std::string lone_lines(const std::string& name, const int count,
                                  const std::string& folder) {
        std::string text;
        for (int i = 0; i < count; ++i) {
            text += "first second differ: only in " + folder + ": " + name + std::to_string(i)
                    + ".npy\n";
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

  private:
    TemporaryFolder folder_;
    std::filesystem::path before_ = std::filesystem::current_path();
};

const std::string no_npy =
    "talcmp: first/e0.npy: is not an .npy file: it does not begin with \\x93NUMPY\n";

TEST_F(Summaries, CountEachKind) {
    write_all_kinds();
    const std::string output = lines("a", 5, "", " are the same")
                               + lines("b", 4, "", " differ: [0]: 1 and 2 (no digit in common)")
                               + lone_lines("c", 3, "first") + lone_lines("d", 2, "second")
                               + "5 the same, 4 different, 3 only in the first, 2 only in the "
                                 "second, 1 in trouble\n";
    expect({"first", "second"}, 2, output, no_npy);
    expect({"-v", "first", "second"}, 2, output, no_npy);
    expect({"-q", "first", "second"}, 2, "", no_npy);
}

TEST_F(Summaries, EndWithTheStatusOfTheWorst) {
    const std::string nothing_more = " 0 only in the first, 0 only in the second, 0 in trouble\n";
    write_pairs("a", 1, one, one);
    expect({"first", "second"}, 0,
           lines("a", 1, "", " are the same") + "1 the same, 0 different," + nothing_more);
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
    const std::string different = "first/b0.npy second/b0.npy differ: [0]: 1 and 2 (no digit in "
                                  "common)\n";
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
        "talcmp: first: holds no .npy or .npz file to compare, nor does second\n";
    expect({"first", "second"}, 2, "", trouble);
    expect({"-v", "first", "second"}, 2, "", trouble);
    expect({"-q", "first", "second"}, 2, "", trouble);
    expect({"--report", "first", "second"}, 2, "", trouble);
}

TEST_F(Summaries, FollowReports) {
    write_pairs("a", 1, npy::row<float>({}), npy::row<float>({}));
    write_pairs("b", 1, npy::row<float>({}), npy::row<float>({1}));
    const std::string facts = "  first array           float32 (0,)\n";
    expect({"--report", "--tol=2.5", "first", "second"}, 1,
           "first/a0.npy second/a0.npy are the same (no elements)\n" + facts
               + "  second array          float32 (0,)\n"
                 "  tolerance             2.5 binary digits\n"
                 "  pairs                 0\n"
                 "first/b0.npy second/b0.npy differ: shape (0,) and (1,)\n"
               + facts
               + "  second array          float32 (1,)\n"
                 "  tolerance             2.5 binary digits\n"
                 "1 the same, 1 different, 0 only in the first, 0 only in the second, "
                 "0 in trouble\n");
}

TEST_F(Summaries, ShowNamesInOneLine) {
    write("first/a\n.npy", one);
    write("second/a\n.npy", one);
    write("second/b\x1B.npy", one);
    write("first/c\xC2\x9B.npy", broken);
    write("second/c\xC2\x9B.npy", one);
    expect({"first", "second"}, 2,
           "first/a?.npy second/a?.npy are the same\n"
           "first second differ: only in second: b?.npy\n"
           "1 the same, 0 different, 0 only in the first, 1 only in the second, 1 in trouble\n",
           "talcmp: first/c?.npy: is not an .npy file: it does not begin with \\x93NUMPY\n");
}

// What is known before the trouble stands before it, on one terminal or in one file too.
TEST_F(Summaries, KeepTheirOrderWithTrouble) {
    write_pairs("a", 1, one, one);
    write_pairs("b", 1, broken, one);
    write_pairs("c", 1, one, two);
    const ProcessResult outcome = run_talcmp({"first", "second"}, Output::with_errors);
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.output, "");
    EXPECT_EQ(outcome.errors,
              "first/a0.npy second/a0.npy are the same\n"
              "talcmp: first/b0.npy: is not an .npy file: it does not begin with \\x93NUMPY\n"
              "first/c0.npy second/c0.npy differ: [0]: 1 and 2 (no digit in common)\n"
              "1 the same, 1 different, 0 only in the first, 0 only in the second, 1 in trouble\n");
}

} // namespace
