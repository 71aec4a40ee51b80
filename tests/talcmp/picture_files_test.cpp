// Files of pictures: the pixels of PNG files, and what is left where a file cannot be written.

#include "descriptor.h"
#include "drawing.h"
#include "png_picture.h"
#include "svg_picture.h"

#include "support/temporary_folder.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <csignal>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#ifdef TALCMP_HAS_PNG
#    include <png.h>
#endif

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

namespace {

namespace fs = std::filesystem;

talcmp::Drawing small_drawing() {
    talcmp::DifferenceMap map({2, 4}, talcmp::room_of_picture);
    map.add(1, talcmp::equal_level);
    map.add(2, talcmp::level_of_digits(1));
    map.add(3, talcmp::level_of_digits(52));
    map.add(4, talcmp::level_of_digits(53));
    map.add(5, talcmp::more_than_all_level);
    map.add(6, talcmp::nan_level);
    map.add(7, talcmp::level_of_digits(26));
    return talcmp::draw(map, {{"a", "b", "c"}, {"d", "e", "f"}, 53});
}

std::string content(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(file), {}};
}

// ---- PNG

#ifdef TALCMP_HAS_PNG

// A file as libpng reads it.
class ReadPng {
  public:
    explicit ReadPng(const std::string& path) {
        image_.version = PNG_IMAGE_VERSION;
        EXPECT_NE(png_image_begin_read_from_file(&image_, path.c_str()), 0) << image_.message;
        image_.format = PNG_FORMAT_RGB;
        bytes_.resize(PNG_IMAGE_SIZE(image_));
        EXPECT_NE(png_image_finish_read(&image_, nullptr, bytes_.data(), 0, nullptr), 0)
            << image_.message;
    }

    int width() const { return static_cast<int>(image_.width); }
    int height() const { return static_cast<int>(image_.height); }

    // As 0xRRGGBB.
    std::uint32_t at(const int x, const int y) const {
        const std::size_t first =
            3 * (static_cast<std::size_t>(y) * image_.width + static_cast<std::size_t>(x));
        return static_cast<std::uint32_t>(bytes_.at(first) << 16U | bytes_.at(first + 1) << 8U
                                          | bytes_.at(first + 2));
    }

  private:
    png_image image_ = {};
    std::vector<std::uint8_t> bytes_;
};

TEST(Png, HasTheColoursOfItsCells) {
    const TemporaryFolder folder;
    const std::string path = folder.path_of("picture.png");
    const talcmp::Drawing drawing = small_drawing();
    talcmp::write_png(drawing, path);
    const ReadPng read(path);
    EXPECT_EQ(read.width(), drawing.width);
    EXPECT_EQ(read.height(), drawing.height);
    const std::uint32_t expected[2][4] = {{0xFFFFFF, 0xEBEBEB, 0xEBC846, 0x3C327D},
                                          {0x1E1946, 0x000000, 0xB4005A, 0x3F9276}};
    for (int row = 0; row < 2; ++row) {
        for (int column = 0; column < 4; ++column) {
            EXPECT_EQ(read.at(40 + 48 * column + 1, 76 + 48 * row + 1), expected[row][column])
                << row << " " << column;
            EXPECT_EQ(read.at(40 + 48 * column + 46, 76 + 48 * row + 46), expected[row][column])
                << row << " " << column;
            EXPECT_EQ(read.at(40 + 48 * column + 47, 76 + 48 * row + 10), 0xFFFFFFU);
        }
    }
    // The pattern of a NaN, in squares of six pixels that begin at multiples of six.
    for (int x = 136; x < 183; ++x) {
        for (int y = 124; y < 171; ++y) {
            ASSERT_EQ(read.at(x, y), (x / 6 + y / 6) % 2 == 0 ? 0xB4005AU : 0xFFFFFFU)
                << x << " " << y;
        }
    }
}

TEST(Png, HasNanPatternsInTheSmallestCells) {
    const TemporaryFolder folder;
    const std::string path = folder.path_of("picture.png");
    talcmp::DifferenceMap map({832, 832}, talcmp::room_of_picture);
    map.add_run(0, std::uint64_t{832} * 832, talcmp::equal_level);
    map.add(832 * 100 + 100, talcmp::nan_level);
    const talcmp::Drawing drawing = talcmp::draw(map, {{"a", "b", "c"}, {"d", "e", "f"}, 53});
    talcmp::write_png(drawing, path);
    const ReadPng read(path);
    int equal = 0;
    int nan = 0;
    int paper = 0;
    for (int y = 276 - 1; y < 276 + 3; ++y) {
        for (int x = 64 + 200 - 1; x < 64 + 200 + 3; ++x) {
            equal += read.at(x, y) == 0xEBEBEB ? 1 : 0;
            nan += read.at(x, y) == 0xB4005A ? 1 : 0;
            paper += read.at(x, y) == 0xFFFFFF ? 1 : 0;
        }
    }
    EXPECT_EQ(equal, 12);
    EXPECT_EQ(nan, 2);
    EXPECT_EQ(paper, 2);
}

TEST(Png, HasTextsWhereTheyBelong) {
    const TemporaryFolder folder;
    const std::string path = folder.path_of("picture.png");
    talcmp::Drawing drawing;
    drawing.width = 60;
    drawing.height = 70;
    drawing.texts = {{30, 0, talcmp::Drawing::Anchor::start, "T"},
                     {30, 20, talcmp::Drawing::Anchor::middle, "TT"},
                     {30, 40, talcmp::Drawing::Anchor::end, "\u00E4T"}};
    talcmp::write_png(drawing, path);
    const ReadPng read(path);
    const auto row = [&](const int y) {
        std::string text;
        for (int x = 0; x < read.width(); x += 2) {
            text += read.at(x, y) == 0 ? '#' : ' ';
        }
        return text;
    };
    EXPECT_EQ(row(0), "               #####          ");
    EXPECT_EQ(row(1), row(0));
    EXPECT_EQ(row(2), "                 #            ");
    EXPECT_EQ(row(20), "         ##### #####          ");
    EXPECT_EQ(row(40), "    ###  #####                ");
}

#else

TEST(Png, IsTroubleWithoutLibpng) {
    EXPECT_EQ(thrown_message([] { talcmp::write_png(small_drawing(), "a.png"); }),
              "a.png: cannot be written: this talcmp was built without libpng; name an .svg file");
}

#endif

// ---- Files

class PictureFiles : public testing::Test {
  protected:
    std::string path(const std::string& name) const { return folder_.path_of(name); }

    void write(const std::string& name) const { folder_.write(name, "old"); }

    static std::string trouble_of(const std::string& path) {
        return thrown_message([&] { talcmp::write_svg(small_drawing(), path); });
    }

    std::size_t files() const {
        const fs::directory_iterator all(path(""));
        return static_cast<std::size_t>(std::distance(all, fs::directory_iterator()));
    }

  private:
    TemporaryFolder folder_;
};

TEST_F(PictureFiles, ReplaceOldOnes) {
    write("a.svg");
    EXPECT_EQ(trouble_of(path("a.svg")), "none");
    EXPECT_EQ(content(path("a.svg")), talcmp::svg_text(small_drawing()));
    EXPECT_EQ(files(), 1U);
}

TEST_F(PictureFiles, HaveThePermissionsOfNewFiles) {
    const mode_t before = ::umask(027);
    EXPECT_EQ(trouble_of(path("a.svg")), "none");
    ::umask(before);
    EXPECT_EQ(fs::status(path("a.svg")).permissions(), fs::perms{0640});
}

TEST_F(PictureFiles, KeepLinks) {
    write("a.svg");
    fs::create_symlink("a.svg", path("link.svg"));
    EXPECT_EQ(trouble_of(path("link.svg")), "none");
    EXPECT_TRUE(fs::is_symlink(path("link.svg")));
    EXPECT_EQ(content(path("a.svg")), talcmp::svg_text(small_drawing()));
}

TEST_F(PictureFiles, AreWrittenToPipes) {
    const std::string pipe = path("pipe");
    ASSERT_EQ(::mkfifo(pipe.c_str(), 0600), 0);
    const talcmp::Descriptor reader(::open(pipe.c_str(), O_RDWR)); // does not wait for a writer
    ASSERT_GE(reader.number(), 0);
    EXPECT_EQ(trouble_of(pipe), "none");
    EXPECT_TRUE(fs::is_fifo(pipe));
    char first = ' ';
    EXPECT_EQ(::read(reader.number(), &first, 1), 1);
    EXPECT_EQ(first, '<');
}

TEST_F(PictureFiles, AreTroubleWhereThereIsNoFolder) {
    EXPECT_EQ(trouble_of(path("no/a.svg")),
              path("no/a.svg") + ": cannot be written: No such file or directory");
}

TEST_F(PictureFiles, AreTroubleWhereAFolderIs) {
    fs::create_directory(path("a.svg"));
    EXPECT_EQ(trouble_of(path("a.svg")), path("a.svg") + ": cannot be written: Is a directory");
}

TEST_F(PictureFiles, AreNotLeftHalfWritten) {
    write("old.svg");
    const auto old_action = std::signal(SIGXFSZ, SIG_IGN);
    struct rlimit old_limit = {};
    ::getrlimit(RLIMIT_FSIZE, &old_limit);
    const struct rlimit limit = {1000, old_limit.rlim_max};
    ::setrlimit(RLIMIT_FSIZE, &limit);
    const std::string trouble = trouble_of(path("old.svg"));
    const std::string trouble_of_new = trouble_of(path("new.svg"));
    ::setrlimit(RLIMIT_FSIZE, &old_limit);
    std::signal(SIGXFSZ, old_action);
    EXPECT_EQ(trouble, path("old.svg") + ": cannot be written: File too large");
    EXPECT_EQ(trouble_of_new, path("new.svg") + ": cannot be written: File too large");
    EXPECT_EQ(content(path("old.svg")), "old");
    EXPECT_EQ(files(), 1U);
}

} // namespace
