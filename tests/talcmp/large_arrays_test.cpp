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

using Options = std::vector<std::string>;

constexpr std::uint64_t GiB = std::uint64_t{1} << 30U;

// Of talcmp and the libraries that it uses, in KiB.
constexpr long most_memory = 64L * 1024;

std::size_t lines_with(const std::string& text, const std::string& words) {
    std::istringstream lines(text);
    std::size_t count = 0;
    for (std::string line; std::getline(lines, line);) {
        count += line.find(words) != std::string::npos ? 1 : 0;
    }
    return count;
}

class ExhaustiveLargeArrays : public testing::Test {
  protected:
    // Zeros, except the last byte.
    std::string write(const std::string& name, const std::string& dictionary,
                      const std::uint64_t bytes, const char last) const {
        const std::string header = npy::header(dictionary);
        std::string path = folder_.write(name, header);
        std::filesystem::resize_file(path, header.size() + bytes);
        std::fstream file(path, std::ios::binary | std::ios::in | std::ios::out);
        file.seekp(-1, std::ios::end).put(last);
        return path;
    }

    std::string write_bytes(const std::string& name, const std::string& shape,
                            const char last) const {
        return write(name, npy::dictionary(npy::descr<std::int8_t>(), "False", shape), 2 * GiB + 10,
                     last);
    }

    std::string write_doubles(const std::string& name, const std::string& fortran_order,
                              const std::string& shape, const std::uint64_t bytes) const {
        return write(name, npy::dictionary(npy::descr<double>(), fortran_order, shape), bytes, 1);
    }

    static void expect_same(const ProcessResult& outcome) {
        EXPECT_EQ(outcome.status, 0);
        EXPECT_EQ(outcome.output + outcome.errors, "");
        EXPECT_LT(outcome.memory, most_memory);
    }

  private:
    TemporaryFolder folder_;
};

TEST_F(ExhaustiveLargeArrays, AreTheSame) {
    const std::string path = write_bytes("a.npy", "(2147483658,)", 1);
    expect_same(run_talcmp({path, path}));
}

TEST_F(ExhaustiveLargeArrays, DifferInTheLastElement) {
    const std::string first = write_bytes("a.npy", "(1, 2147483658)", 0);
    const std::string second = write_bytes("b.npy", "(1, 2147483658)", 1);
    const ProcessResult outcome = run_talcmp({first, second});
    EXPECT_EQ(outcome.status, 1);
    EXPECT_EQ(outcome.output,
              first + " " + second + " differ: [0, 2147483657]: 0 and 1 (different integers)\n");
    EXPECT_EQ(outcome.errors, "");
    EXPECT_LT(outcome.memory, most_memory);
}

TEST_F(ExhaustiveLargeArrays, TakeLittleMemory) {
    const std::string first = write_doubles("a.npy", "False", "(603979776,)", 9 * GiB / 2);
    const std::string second = write_doubles("b.npy", "False", "(603979776,)", 9 * GiB / 2);
    expect_same(run_talcmp({first, second}));
}

TEST_F(ExhaustiveLargeArrays, TakeLittleMemoryInDifferentOrders) {
    constexpr std::uint64_t bytes = std::uint64_t{20000} * 13422 * 8;
    const std::string first = write_doubles("a.npy", "False", "(20000, 13422)", bytes);
    const std::string second = write_doubles("b.npy", "True", "(20000, 13422)", bytes);
    expect_same(run_talcmp({first, second}));
    expect_same(run_talcmp({"--slice=::3,::7", first, second}));
    expect_same(run_talcmp({"--slice=:,5", first, second}));
}

// Each place is held by every thread, and by what puts them together; its text is not held at all.
TEST(ExhaustiveManyPlaces, TakeTheMemoryThatIsDocumented) {
    constexpr std::size_t count = 300000;
    constexpr long bytes_of_place = 48;
    constexpr long threads = 2;
    const TemporaryFolder folder;
    const std::vector<std::int64_t> zeros(count);
    const std::string first = folder.write("a.npy", npy::row(zeros));
    const std::string second = folder.write("b.npy", npy::row(std::vector<std::int64_t>(count, 1)));
    const Options arguments = {"--threads", std::to_string(threads), "-n", "1000000", first,
                               second};
    for (const bool json : {false, true}) {
        Options all = arguments;
        if (json) {
            all.emplace_back("--json");
        }
        const ProcessResult outcome = run_talcmp(all);
        EXPECT_EQ(outcome.status, 1);
        EXPECT_EQ(outcome.errors, "");
        EXPECT_EQ(lines_with(outcome.output, "different integers"), json ? count + 2 : count);
        EXPECT_LT(outcome.memory, most_memory + bytes_of_place * (threads + 2) * long{count} / 1024)
            << json;
    }
}

} // namespace
