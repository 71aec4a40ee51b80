// Copies of arrays that can be read only once, where there is no room for them or they are tampered
// with.

#include "temporary_copy.h"

#include "support/memory_array.h"
#include "support/temporary_folder.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <filesystem>
#include <memory>
#include <numeric>
#include <string>
#include <utility>
#include <vector>

#include <sys/resource.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;

constexpr std::uint64_t numbers = 100000;

// The numbers 0, 1, 2, ... as bytes, which can be read only once.
class ByteNumbers : public TypedArray<std::uint8_t> {
  public:
    explicit ByteNumbers(std::uint64_t& checked)
        : TypedArray({numbers}, Order::c, Access::once), checked_(checked) {}

    void read(const std::uint64_t first, const std::uint64_t count, void* elements) override {
        EXPECT_EQ(first, next_);
        next_ += count;
        std::generate_n(static_cast<std::uint8_t*>(elements), count,
                        [number = first]() mutable { return static_cast<std::uint8_t>(number++); });
    }

    void check_to_end() override { checked_ = next_; }

  private:
    std::uint64_t next_ = 0;
    std::uint64_t& checked_;
};

class TemporaryCopies : public testing::Test {
  protected:
    void SetUp() override { ::setenv("TMPDIR", folder_.path_of("").c_str(), 1); }
    void TearDown() override { ::unsetenv("TMPDIR"); }

    talcmp::TemporaryCopy take() {
        return {std::make_unique<ByteNumbers>(checked_),
                [this](const std::uint64_t bytes) { copied_ += bytes; }};
    }

    std::string trouble_in_taking() {
        return thrown_message([this] { take(); });
    }

    // The only file that is open in the folder.
    std::string open_file() const {
        for (const auto& entry : fs::directory_iterator("/proc/self/fd")) {
            std::error_code ignored;
            if (fs::read_symlink(entry.path(), ignored).string().rfind(folder_.path_of(""), 0)
                == 0) {
                return entry.path().string();
            }
        }
        return "none";
    }

    std::string folder_name() const { return folder_.path_of(""); }
    std::uint64_t copied() const { return copied_; }
    std::uint64_t checked() const { return checked_; }

  private:
    TemporaryFolder folder_;
    std::uint64_t copied_ = 0;
    std::uint64_t checked_ = 0;
};

TEST_F(TemporaryCopies, AreReadInAnyOrderAndLeaveNoFile) {
    auto copy = take();
    EXPECT_EQ(copied(), numbers);
    EXPECT_EQ(checked(), numbers);
    EXPECT_TRUE(fs::is_empty(folder_name()));
    for (const unsigned first : {99990U, 0U, 16380U}) {
        std::vector<std::uint8_t> elements(10);
        std::vector<std::uint8_t> expected(elements.size());
        std::iota(expected.begin(), expected.end(), static_cast<std::uint8_t>(first));
        copy.read(first, elements.size(), elements.data());
        EXPECT_EQ(elements, expected);
    }
}

TEST_F(TemporaryCopies, AreTroubleWhereTheyDoNotFit) {
    const auto old_action = std::signal(SIGXFSZ, SIG_IGN);
    struct rlimit old_limit = {};
    ::getrlimit(RLIMIT_FSIZE, &old_limit);
    // The first piece fits, and a part of the second.
    const struct rlimit limit = {20000, old_limit.rlim_max};
    ::setrlimit(RLIMIT_FSIZE, &limit);
    const std::string trouble = trouble_in_taking();
    ::setrlimit(RLIMIT_FSIZE, &old_limit);
    std::signal(SIGXFSZ, old_action);
    EXPECT_EQ(trouble, folder_name()
                           + ": cannot take a temporary copy of the array; set TMPDIR to a folder "
                             "with room for it: File too large");
    EXPECT_TRUE(fs::is_empty(folder_name()));
}

TEST_F(TemporaryCopies, AreTroubleWhereThereIsNoFolder) {
    ::setenv("TMPDIR", (folder_name() + "no").c_str(), 1);
    EXPECT_EQ(trouble_in_taking(),
              folder_name()
                  + "no: cannot take a temporary copy of the array; set TMPDIR "
                    "to a folder with room for it: No such file or directory");
}

TEST_F(TemporaryCopies, AreTroubleWhereTheyWereCutShort) {
    if (!fs::exists("/proc/self/fd")) {
        GTEST_SKIP() << "NOT TESTED: /proc is not mounted, where the file could be found";
    }
    auto copy = take();
    ASSERT_EQ(::truncate(open_file().c_str(), 50000), 0);
    std::vector<std::uint8_t> elements(10);
    copy.read(49990, elements.size(), elements.data());
    EXPECT_EQ(thrown_message([&] { copy.read(49991, elements.size(), elements.data()); }),
              folder_name() + ": the temporary copy of the array there was cut short");
}

} // namespace
