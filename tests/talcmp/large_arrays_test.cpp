// Arrays with more elements than one record holds, in sparse files. They take seconds to read, and
// more memory than a machine may have under a sanitizer.

#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>

namespace {

constexpr std::uint64_t element_count = (std::uint64_t{1} << 31U) + 10;

class ExhaustiveLargeArrays : public testing::Test {
  protected:
    void SetUp() override {
        if (sizeof(void*) < 8) {
            GTEST_SKIP() << "two such files do not fit the address space";
        }
    }

    // Zeros, but for the last element.
    std::string write(const std::string& name, const std::string& shape, const char last) const {
        const std::string header =
            npy::header(npy::dictionary(npy::descr<std::int8_t>(), "False", shape));
        std::string path = folder_.write(name, header);
        std::filesystem::resize_file(path, header.size() + element_count);
        std::fstream file(path, std::ios::binary | std::ios::in | std::ios::out);
        file.seekp(-1, std::ios::end).put(last);
        return path;
    }

  private:
    TemporaryFolder folder_;
};

TEST_F(ExhaustiveLargeArrays, AreTheSame) {
    const std::string path = write("a.npy", "(2147483658,)", 1);
    const Outcome outcome = run_talcmp({path, path});
    EXPECT_EQ(outcome.status, 0);
    EXPECT_EQ(outcome.output + outcome.errors, "");
}

TEST_F(ExhaustiveLargeArrays, DifferInTheLastElement) {
    const std::string first = write("a.npy", "(1, 2147483658)", 0);
    const std::string second = write("b.npy", "(1, 2147483658)", 1);
    const Outcome outcome = run_talcmp({first, second});
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.output, first + " " + second + " differ: [0, 2147483657]: 0 and 1\n");
    EXPECT_EQ(outcome.errors, "");
}

} // namespace
