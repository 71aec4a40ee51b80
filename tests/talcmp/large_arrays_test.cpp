// Arrays with more elements than one record holds, and larger than the memory that talcmp may take,
// in sparse files. They take seconds to read.

#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

namespace {

using Words = std::vector<std::string>;

constexpr std::uint64_t GiB = std::uint64_t{1} << 30U;

// The memory of talcmp and the libraries that it uses, in KiB.
constexpr long most_memory = 64L * 1024;

class ExhaustiveLargeArrays : public testing::Test {
  protected:
    // Zeros, except the last byte.
    template <typename T>
    std::string write(const std::string& name, const std::string& fortran_order,
                      const std::string& shape, const std::uint64_t bytes, const char last) const {
        const std::string header =
            npy::header(npy::dictionary(npy::descr<T>(), fortran_order, shape));
        std::string path = folder_.write(name, header);
        std::filesystem::resize_file(path, header.size() + bytes);
        std::fstream file(path, std::ios::binary | std::ios::in | std::ios::out);
        file.seekp(-1, std::ios::end).put(last);
        return path;
    }

    std::string write_bytes(const std::string& name, const std::string& shape,
                            const char last) const {
        return write<std::int8_t>(name, "False", shape, 2 * GiB + 10, last);
    }

    static void expect_answer(const Words& arguments, const std::string& answer = "") {
        const ProcessResult outcome = run_talcmp(arguments);
        EXPECT_EQ(outcome.status, answer.empty() ? 0 : 1);
        EXPECT_EQ(outcome.output, answer);
        EXPECT_EQ(outcome.errors, "");
        EXPECT_LT(outcome.memory, most_memory);
    }

  private:
    TemporaryFolder folder_;
};

TEST_F(ExhaustiveLargeArrays, AreTheSame) {
    const std::string path = write_bytes("a.npy", "(2147483658,)", 1);
    expect_answer({path, path});
}

TEST_F(ExhaustiveLargeArrays, DifferInTheLastElement) {
    const std::string first = write_bytes("a.npy", "(1, 2147483658)", 0);
    const std::string second = write_bytes("b.npy", "(1, 2147483658)", 1);
    expect_answer({first, second},
                  first + " " + second
                      + " differ: [0, 2147483657]: 0 and 1 (different integers)\n");
}

TEST_F(ExhaustiveLargeArrays, TakeLittleMemory) {
    const std::string first = write<double>("a.npy", "False", "(603979776,)", 9 * GiB / 2, 1);
    const std::string second = write<double>("b.npy", "False", "(603979776,)", 9 * GiB / 2, 1);
    expect_answer({first, second});
}

TEST_F(ExhaustiveLargeArrays, TakeLittleMemoryInDifferentOrders) {
    constexpr std::uint64_t bytes = std::uint64_t{20000} * 13422 * 8;
    const std::string first = write<double>("a.npy", "False", "(20000, 13422)", bytes, 1);
    const std::string second = write<double>("b.npy", "True", "(20000, 13422)", bytes, 1);
    expect_answer({first, second});
    expect_answer({"--slice=::3,::7", first, second});
    expect_answer({"--slice=:,5", first, second});
}

std::size_t lines_with(const std::string& text, const std::string& words) {
    std::istringstream lines(text);
    std::size_t count = 0;
    for (std::string line; std::getline(lines, line);) {
        count += line.find(words) != std::string::npos ? 1 : 0;
    }
    return count;
}

// Each place is held by every thread, and by the code that merges them; its text is not held at
// all.
TEST(ExhaustiveManyPlaces, TakeTheMemoryThatIsDocumented) {
    constexpr std::size_t count = 300000;
    constexpr long bytes_of_place = 48;
    constexpr long threads = 2;
    const TemporaryFolder folder;
    const std::vector<std::int64_t> zeros(count);
    const std::string first = folder.write("a.npy", npy::row(zeros));
    const std::string second = folder.write("b.npy", npy::row(std::vector<std::int64_t>(count, 1)));
    for (const bool json : {false, true}) {
        Words arguments = {"--threads", std::to_string(threads), "-n", "1000000", first, second};
        if (json) {
            arguments.emplace_back("--json");
        }
        const ProcessResult outcome = run_talcmp(arguments);
        EXPECT_EQ(outcome.status, 1);
        EXPECT_EQ(outcome.errors, "");
        EXPECT_EQ(lines_with(outcome.output, "different integers"), json ? count + 2 : count);
        EXPECT_LT(outcome.memory, most_memory + bytes_of_place * (threads + 2) * long{count} / 1024)
            << json;
    }
}

} // namespace
