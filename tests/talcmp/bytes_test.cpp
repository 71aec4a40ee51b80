// Where bytes come from: streams that hand out some at a time, files, pipes, and the trouble when
// they cannot be read.

#include "array_file.h"
#include "descriptor.h"
#include "pipe.h"
#include "regular_file.h"

#include "support/memory_bytes.h"
#include "support/named_cases.h"
#include "support/npy_bytes.h"
#include "support/temporary_folder.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <cstddef>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

std::string text_of_length(const std::size_t length) {
    std::string text(length, '\0');
    for (std::size_t i = 0; i < length; ++i) {
        text[i] = static_cast<char>('a' + i % 23);
    }
    return text;
}

std::string read(talcmp::ByteSource& source, const std::uint64_t offset, const std::size_t count) {
    std::string bytes(count, '\0');
    bytes.resize(source.read(offset, bytes.data(), count));
    return bytes;
}

// ---- Streams

struct Reading {
    const char* name;
    std::vector<std::pair<std::uint64_t, std::size_t>> parts; // offset and count
};

const Reading readings[] = {
    {"All", {{0, 200000}}},
    {"OneAfterTheOther", {{0, 1}, {1, 7}, {8, 0}, {8, 199992}}},
    {"WithFewBytesBetween", {{3, 4}, {9, 10}, {100, 5}}},
    {"WithManyBytesBetween", {{65536, 3}, {131075, 5}, {199999, 1}}},
    {"PastTheEnd", {{199990, 100}, {200000, 1}}},
    {"AfterTheEnd", {{199999, 1}, {300000, 4}}},
    {"FarAfterTheEnd", {{5, 1}, {200001, 4}}},
};

class Streams : public NamedCaseTest<Reading> {};

TEST_P(Streams, AreReadInPiecesOfWhateverLength) {
    const std::string bytes = text_of_length(200000);
    for (const std::size_t at_once : {1U, 3U, 4096U, 65536U, 1000000U}) {
        MemoryStream stream(bytes, at_once);
        EXPECT_FALSE(stream.random_access());
        for (const auto& [offset, count] : GetParam().parts) {
            EXPECT_EQ(read(stream, offset, count),
                      offset < bytes.size() ? bytes.substr(static_cast<std::size_t>(offset), count)
                                            : "")
                << offset << ", " << at_once << " at once";
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Bytes, Streams, named_cases(readings), name_of_case);

// ---- Descriptors

bool is_open(const int descriptor) {
    return ::fcntl(descriptor, F_GETFD) != -1;
}

TEST(Descriptors, AreClosedAtTheEnd) {
    const int number = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    {
        const talcmp::Descriptor descriptor(number);
        EXPECT_EQ(descriptor.number(), number);
        EXPECT_TRUE(is_open(number));
    }
    EXPECT_FALSE(is_open(number));
}

talcmp::RegularFile opened(const std::string& path, const std::uint64_t size) {
    return {path, talcmp::Descriptor(::open(path.c_str(), O_RDONLY | O_CLOEXEC)), size};
}

// The first 4096 bytes are read once and kept.
TEST(Files, AreReadAnywhere) {
    const TemporaryFolder folder;
    for (const std::size_t size : {0U, 1000U, 4095U, 4096U, 4097U, 10000U}) {
        const std::string bytes = text_of_length(size);
        talcmp::RegularFile file = opened(folder.write("file", bytes), size);
        EXPECT_TRUE(file.random_access());
        EXPECT_EQ(file.size(), size);
        EXPECT_EQ(file.beginning(), bytes.substr(0, 4096));
        for (const std::size_t offset : {0U, 10U, 990U, 4095U, 4096U, 4097U, 9999U, 20000U}) {
            for (const std::size_t count : {0U, 1U, 20U, 4096U, 20000U}) {
                EXPECT_EQ(read(file, offset, count),
                          offset < size ? bytes.substr(offset, count) : "")
                    << count << " of " << size << " from " << offset << " on";
            }
        }
    }
}

TEST(Files, KeepTheirBeginning) {
    const TemporaryFolder folder;
    const std::string path = folder.write("file", std::string(5000, 'a'));
    talcmp::RegularFile file = opened(path, 5000);
    folder.write("file", std::string(5000, 'b'));
    EXPECT_EQ(read(file, 4090, 6), "aaaaaa");
    EXPECT_EQ(read(file, 4090, 7), "bbbbbbb");
}

TEST(Files, OfOneArrayHaveOneMemberWithoutAName) {
    const TemporaryFolder folder;
    const auto file = talcmp::open_array_file(folder.write("a.npy", npy::row<double>({1, 2})));
    EXPECT_FALSE(file->is_archive());
    EXPECT_EQ(file->members(), std::vector<std::string>{""});
    EXPECT_EQ(file->open("")->shape(), talcmp::Shape{2});
}

TEST(Files, ThatAreFoldersAreTrouble) {
    const TemporaryFolder folder;
    const std::string path = folder.path_of("");
    EXPECT_EQ(thrown_message([&path] { talcmp::open_array_file(path); }),
              path + ": is a folder; name a file in it, or two folders");
}

TEST(Files, ThatCannotBeReadAreTrouble) {
    const TemporaryFolder folder;
    const talcmp::Descriptor descriptor(
        ::open(folder.path_of("").c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
    char byte = 0;
    EXPECT_EQ(thrown_message([&] { talcmp::read_at(descriptor.number(), "name", 0, &byte, 1); }),
              "name: cannot be read: Is a directory");
    talcmp::Pipe pipe("pipe", talcmp::Descriptor(::dup(descriptor.number())));
    EXPECT_EQ(thrown_message([&] { pipe.read(0, &byte, 1); }),
              "pipe: cannot be read: Is a directory");
}

TEST(Pipes, AreReadToTheirEnd) {
    int ends[2] = {};
    ASSERT_EQ(::pipe(ends), 0);
    talcmp::Pipe pipe("pipe", talcmp::Descriptor(ends[0]));
    ASSERT_EQ(::write(ends[1], "abcdef", 6), 6);
    ::close(ends[1]);
    EXPECT_FALSE(pipe.size().has_value());
    EXPECT_EQ(read(pipe, 2, 3), "cde");
    EXPECT_EQ(read(pipe, 5, 9), "f");
}

TEST(Pipes, MayBeNamed) {
    const TemporaryFolder folder;
    const std::string path = folder.path_of("pipe");
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    const talcmp::Descriptor writer(::open(path.c_str(), O_RDWR | O_CLOEXEC));
    const std::string bytes = npy::row<double>({1, 2});
    ASSERT_EQ(::write(writer.number(), bytes.data(), bytes.size()),
              static_cast<ssize_t>(bytes.size()));
    const auto array = talcmp::open_array_file(path)->open("");
    EXPECT_FALSE(array->random_access());
    EXPECT_EQ(array->shape(), talcmp::Shape{2});
}

} // namespace
