// Pictures of where two arrays differ: which elements share a cell, and what is drawn.

#include "bitmap_font.h"
#include "difference_map.h"
#include "drawing.h"
#include "looks.h"
#include "svg_picture.h"
#include "text_map.h"
#include "ticks.h"

#include "support/named_cases.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <functional>
#include <iostream>
#include <random>
#include <set>
#include <string>
#include <thread>
#include <vector>

namespace {

using talcmp::DifferenceMap;
using talcmp::Level;
using talcmp::MapLayout;
using talcmp::MapRoom;
using talcmp::room_of_picture;
using talcmp::Shape;

const talcmp::PictureCaptions captions = {
    {"a<b>&c.npy", "float32", "(2, 3)"}, {"b.npy", "float64", "(2, 3)"}, 24};

// ---- Layouts

struct LayoutCase {
    const char* name;
    Shape shape;
    std::array<std::uint64_t, 2> grid;
    std::array<std::uint64_t, 2> cells; // of an image
    std::array<std::uint64_t, 3> bins;  // of outer numbers, rows and columns
    std::array<int, 2> pixels;          // width and height
};

const LayoutCase layouts[] = {
    {"OneNumber", {}, {1, 1}, {1, 1}, {1, 1, 1}, {628, 401}},
    {"Vector", {10}, {1, 1}, {1, 10}, {1, 1, 1}, {628, 401}},
    {"LongestVectorWithACellEach", {832}, {1, 1}, {1, 832}, {1, 1, 1}, {1696, 401}},
    {"LongVector", {833}, {1, 1}, {1, 417}, {1, 1, 2}, {866, 401}},
    {"VeryLongVector", {1000000}, {1, 1}, {1, 832}, {1, 1, 1202}, {1696, 401}},
    {"Matrix", {3, 4}, {1, 1}, {3, 4}, {1, 1, 1}, {628, 497}},
    {"LargeMatrix", {512, 512}, {1, 1}, {512, 512}, {1, 1, 1}, {1104, 1377}},
    {"ProportionsAreKept", {3000, 5000}, {1, 1}, {429, 715}, {1, 7, 7}, {1522, 1211}},
    {"ProportionsOfEight", {1000, 8000}, {1, 1}, {100, 800}, {1, 10, 10}, {1680, 553}},
    {"FewRowsAreNotReduced", {10, 100000}, {1, 1}, {10, 827}, {1, 1, 121}, {1710, 553}},
    {"FewColumnsAreNotReduced", {100000, 3}, {1, 1}, {827, 3}, {1, 121, 1}, {592, 2007}},
    {"OneOuterAxis", {100, 1000, 1000}, {10, 10}, {67, 67}, {1, 15, 15}, {1672, 1963}},
    {"OneOuterAxisOfOneImage", {1, 3, 4}, {1, 1}, {3, 4}, {1, 1, 1}, {628, 497}},
    {"WideImagesGoDown", {7, 4, 100}, {7, 1}, {4, 100}, {1, 1, 1}, {1056, 1407}},
    {"TwoOuterAxes", {4, 6, 64, 64}, {4, 6}, {64, 64}, {1, 1, 1}, {976, 967}},
    {"OuterAxesOfOneDoNotCount", {1, 6, 64, 64}, {2, 3}, {64, 64}, {1, 1, 1}, {1084, 1039}},
    {"ThreeOuterAxes", {2, 2, 3, 8, 8}, {4, 3}, {8, 8}, {1, 1, 1}, {808, 1383}},
    {"GridThatWouldBeTooLong", {40, 2, 64, 64}, {9, 9}, {64, 64}, {1, 1, 1}, {1444, 1747}},
    {"OuterAxesAreReduced", {3, 50, 70, 20, 30}, {28, 27}, {10, 15}, {14, 2, 2}, {1606, 1687}},
    {"AllAxesAreReduced",
     {100000000, 3, 10, 10, 1000},
     {35, 28},
     {10, 16},
     {3061225, 1, 63},
     {1708, 2023}},
    {"NoElements", {0, 3}, {0, 1}, {0, 0}, {1, 1, 1}, {628, 241}},
};

class Layouts : public NamedCaseTest<LayoutCase> {};

TEST_P(Layouts, AreChosen) {
    const LayoutCase& expected = GetParam();
    const DifferenceMap map(expected.shape, room_of_picture);
    const MapLayout& layout = map.layout();
    EXPECT_EQ(layout.grid_rows, expected.grid[0]);
    EXPECT_EQ(layout.grid_columns, expected.grid[1]);
    EXPECT_EQ(layout.cell_rows, expected.cells[0]);
    EXPECT_EQ(layout.cell_columns, expected.cells[1]);
    EXPECT_EQ(layout.image_bin, expected.bins[0]);
    EXPECT_EQ(layout.row_bin, expected.bins[1]);
    EXPECT_EQ(layout.column_bin, expected.bins[2]);
    const talcmp::Drawing drawing = talcmp::draw(map, captions);
    EXPECT_EQ(drawing.width, expected.pixels[0]);
    EXPECT_EQ(drawing.height, expected.pixels[1]);
}

INSTANTIATE_TEST_SUITE_P(Picture, Layouts, named_cases(layouts), name_of_case);

// ---- What is added

class Random {
  public:
    Random() : seed_(chosen_seed()), engine_(seed_) {
        std::cout << "TALNUMERICARRAY_SEED=" << seed_ << std::endl;
    }

    std::uint64_t below(const std::uint64_t bound) { return engine_() % bound; }

    std::uint64_t bits() { return engine_(); }

  private:
    static std::uint64_t chosen_seed() {
        const char* const text =
            std::getenv("TALNUMERICARRAY_SEED"); // NOLINT(concurrency-mt-unsafe)
        return text != nullptr ? std::strtoull(text, nullptr, 10) : std::random_device{}();
    }

    std::uint64_t seed_;
    std::mt19937_64 engine_;
};

Shape random_shape(Random& random) {
    Shape shape(static_cast<std::size_t>(random.below(6)));
    std::uint64_t most = 30000; // elements
    for (std::uint64_t& extent : shape) {
        extent = 1 + random.below(random.below(3) == 0 ? most : std::min<std::uint64_t>(most, 9));
        most /= extent;
    }
    std::shuffle(shape.begin(), shape.end(), std::mt19937_64(random.bits()));
    return shape;
}

MapRoom random_room(Random& random) {
    const std::uint64_t fewest = 1 + random.below(4);
    return {fewest + random.below(40), fewest + random.below(40), random.below(4), fewest,
            random.below(2) == 0};
}

struct Addition {
    std::uint64_t first, count;
    Level level;
};

std::vector<Addition> random_additions(Random& random, const std::uint64_t elements) {
    std::vector<Addition> additions(static_cast<std::size_t>(1 + random.below(40)));
    for (Addition& each : additions) {
        each.first = random.below(elements);
        each.count = 1 + random.below(random.below(2) == 0 ? 1 : elements - each.first);
        each.level = static_cast<Level>(random.below(talcmp::level_count));
    }
    return additions;
}

void add(DifferenceMap& map, const Addition& addition, const bool one_by_one) {
    if (!one_by_one) {
        map.add_run(addition.first, addition.count, addition.level);
        return;
    }
    for (std::uint64_t i = 0; i < addition.count; ++i) {
        map.add(addition.first + i, addition.level);
    }
}

// The cells, image by image, as the layout defines them.
std::vector<Level> cells_of(const DifferenceMap& map) {
    std::vector<Level> cells;
    for (std::uint64_t image = 0; image < map.layout().images; ++image) {
        for (std::uint64_t row = 0; row < map.layout().cell_rows; ++row) {
            for (std::uint64_t column = 0; column < map.layout().cell_columns; ++column) {
                cells.push_back(map.level(image, row, column));
            }
        }
    }
    return cells;
}

std::vector<Level> expected_cells(const MapLayout& layout, const std::vector<Addition>& additions) {
    const auto above = [](const std::uint64_t a, const std::uint64_t b) { return (a + b - 1) / b; };
    const std::uint64_t down = above(layout.rows, layout.row_bin);
    const std::uint64_t right = above(layout.columns, layout.column_bin);
    std::vector<Level> cells(
        static_cast<std::size_t>(above(layout.outer, layout.image_bin) * down * right));
    for (const Addition& each : additions) {
        for (std::uint64_t number = each.first; number < each.first + each.count; ++number) {
            const std::uint64_t column = number % layout.columns / layout.column_bin;
            const std::uint64_t row = number / layout.columns % layout.rows / layout.row_bin;
            const std::uint64_t image = number / layout.columns / layout.rows / layout.image_bin;
            Level& cell = cells.at(static_cast<std::size_t>((image * down + row) * right + column));
            cell = std::max(cell, each.level);
        }
    }
    return cells;
}

std::uint64_t side(const std::uint64_t images, const std::uint64_t cells, const std::uint64_t gap) {
    return images * cells + (images - 1) * gap;
}

TEST(DifferenceMaps, HaveTheWorstLevelOfEachCell) {
    Random random;
    for (int i = 0; i < 1000; ++i) {
        const MapRoom room = random_room(random);
        DifferenceMap map(random_shape(random), room);
        const MapLayout& layout = map.layout();
        const auto additions =
            random_additions(random, layout.outer * layout.rows * layout.columns);
        for (const Addition& each : additions) {
            add(map, each, random.below(4) == 0);
        }
        const std::vector<Level> expected = expected_cells(layout, additions);
        ASSERT_EQ(cells_of(map), expected) << testing::PrintToString(map.shape());
        for (std::size_t level = 0; level < talcmp::level_count; ++level) {
            const auto count = std::count(expected.begin(), expected.end(), level);
            ASSERT_EQ(map.counts().at(level), static_cast<std::uint64_t>(count));
        }
    }
}

TEST(DifferenceMaps, FitIntoTheirRoom) {
    Random random;
    for (int i = 0; i < 10000; ++i) {
        const MapRoom room = random_room(random);
        const Shape shape = random_shape(random);
        const MapLayout layout = talcmp::choose_layout(shape, room);
        const std::string text = testing::PrintToString(shape);
        ASSERT_LE(side(layout.grid_rows, layout.cell_rows, room.gap), room.rows) << text;
        ASSERT_LE(side(layout.grid_columns, layout.cell_columns, room.gap), room.columns) << text;
    }
}

TEST(DifferenceMaps, AreFilledByManyThreads) {
    Random random;
    DifferenceMap map({30, 40, 50}, {20, 20, 1, 3, false});
    const auto additions = random_additions(random, std::uint64_t{30} * 40 * 50);
    std::vector<std::thread> threads;
    for (unsigned thread = 0; thread < 4; ++thread) {
        threads.emplace_back([&, thread] {
            for (std::size_t i = 0; i < additions.size(); ++i) {
                // All of them in two threads each, so that they meet in the same cells.
                if (i % 2 == thread % 2) {
                    add(map, additions[i], thread < 2);
                }
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(cells_of(map), expected_cells(map.layout(), additions));
}

TEST(DifferenceMaps, FindTheCellsOfLargeArrays) {
    Random random;
    for (const std::uint64_t rows : {3'000'000'000U, 2'000'000'000U}) {
        // Below and above 2^53 elements.
        for (const std::uint64_t columns : {2'999'999U, 7'777'777U}) {
            for (int i = 0; i < 1000; ++i) {
                DifferenceMap map({rows, columns}, {9, 9, 0, 1, false});
                const std::uint64_t row_bin = rows / 9 + (rows % 9 == 0 ? 0 : 1);
                const std::uint64_t row =
                    std::min(random.below(10) * row_bin + random.below(3), rows - 1);
                const bool last = random.below(2) == 0;
                map.add(row * columns + (last ? columns - 1 : 0), 5);
                ASSERT_EQ(map.level(0, row / row_bin, last ? 8 : 0), 5)
                    << row << " of " << rows << ", " << columns << " columns";
            }
        }
    }
}

TEST(Dividers, DivideAsTheLanguageDoes) {
    Random random;
    constexpr std::uint64_t most = (std::uint64_t{1} << 53U) - 1;
    for (int i = 0; i < 1000000; ++i) {
        const std::uint64_t divisor = 1 + (random.bits() >> (11 + random.below(53)));
        const talcmp::Divider divider(divisor, most);
        const std::uint64_t multiple = most / divisor * divisor - random.below(3) * divisor;
        for (const std::uint64_t dividend :
             {random.bits() & most, multiple, multiple - 1, multiple + 1}) {
            if (dividend <= most) {
                ASSERT_EQ(divider.quotient(dividend), dividend / divisor) << dividend;
            }
        }
    }
}

TEST(Levels, AreInOrder) {
    EXPECT_EQ(talcmp::level_of_digits(0), talcmp::equal_level);
    EXPECT_EQ(talcmp::level_of_digits(1), talcmp::equal_level + 1);
    EXPECT_EQ(talcmp::level_of_digits(53), talcmp::most_digits_level);
    EXPECT_EQ(talcmp::level_of_digits(54), talcmp::more_than_all_level);
    EXPECT_LT(talcmp::more_than_all_level, talcmp::nan_level);
}

// ---- Looks

// From 0 for black to 100 for white, as people see it.
double lightness(const talcmp::Rgb colour) {
    const auto linear = [](const std::uint8_t channel) {
        const double part = channel / 255.0;
        return part <= 0.04045 ? part / 12.92 : std::pow((part + 0.055) / 1.055, 2.4);
    };
    const double luminance =
        0.2126 * linear(colour.red) + 0.7152 * linear(colour.green) + 0.0722 * linear(colour.blue);
    return luminance <= 0.008856 ? 903.3 * luminance : 116 * std::cbrt(luminance) - 16;
}

TEST(Looks, AreToldApartWithoutColour) {
    for (const int all_digits : {24, 53}) {
        const auto lightness_of = [&](const Level level) {
            return lightness(talcmp::colour_of(level, all_digits));
        };
        const Level last = talcmp::level_of_digits(all_digits - 1);
        const Level all = talcmp::level_of_digits(all_digits);
        EXPECT_EQ(lightness_of(talcmp::nothing_compared), 100);
        EXPECT_GT(100 - lightness_of(talcmp::equal_level), 6);
        EXPECT_GT(lightness_of(talcmp::equal_level) - lightness_of(2), 10);
        for (Level level = 2; level < last; ++level) {
            EXPECT_GT(lightness_of(level), lightness_of(level + 1) + 0.5) << int{level};
        }
        EXPECT_GT(lightness_of(2) - lightness_of(last), 50);
        EXPECT_GT(lightness_of(last) - lightness_of(all), 10);
        EXPECT_GT(lightness_of(all) - lightness_of(talcmp::more_than_all_level), 10);
        // The pattern of NaNs.
        EXPECT_GT(lightness(talcmp::paper) - lightness_of(talcmp::nan_level), 50);
    }
}

TEST(Glyphs, AreDrawn) {
    const auto drawn = [](const char character) {
        std::string text;
        for (int row = 0; row < talcmp::glyph_height; ++row) {
            for (int column = 0; column < talcmp::glyph_width; ++column) {
                text += talcmp::glyph_is_black(character, column, row) ? '#' : ' ';
            }
            text += '\n';
        }
        return text;
    };
    EXPECT_EQ(drawn('g'), "     \n     \n ####\n#   #\n#   #\n#   #\n ####\n    #\n ### \n");
    EXPECT_EQ(drawn('T'), "#####\n  #  \n  #  \n  #  \n  #  \n  #  \n  #  \n     \n     \n");
    EXPECT_EQ(drawn('\n'), drawn('?'));
    EXPECT_EQ(drawn('\x7F'), drawn('?'));
    EXPECT_EQ(drawn('\xC3'), drawn('?'));
    std::set<std::string> different;
    for (char character = ' '; character <= '~'; ++character) {
        different.insert(drawn(character));
    }
    EXPECT_EQ(different.size(), 95U);
}

struct TickCase {
    const char* name;
    std::uint64_t extent, bin, apart;
    std::vector<std::array<std::uint64_t, 2>> ticks; // indices and cells
};

const TickCase tick_cases[] = {
    {"One", 1, 1, 1, {{0, 0}}},
    {"Each", 3, 1, 1, {{0, 0}, {1, 1}, {2, 2}}},
    {"EverySecond", 5, 1, 2, {{0, 0}, {2, 2}, {4, 4}}},
    {"EveryFifth", 11, 1, 3, {{0, 0}, {5, 5}, {10, 10}}},
    {"EveryTenth", 30, 1, 6, {{0, 0}, {10, 10}, {20, 20}}},
    {"EveryTwentieth", 41, 1, 11, {{0, 0}, {20, 20}, {40, 40}}},
    {"OfBins", 1000, 7, 30, {{0, 0}, {500, 71}}},
    {"UpToTheLargestNumber",
     18446744073709551615U,
     18446744073709551U,
     500,
     {{0, 0}, {10000000000000000000U, 542}}},
};

class Ticks : public NamedCaseTest<TickCase> {};

TEST_P(Ticks, AreRound) {
    std::vector<std::array<std::uint64_t, 2>> ticks;
    for (const talcmp::Tick& each :
         talcmp::round_ticks(GetParam().extent, GetParam().bin, GetParam().apart)) {
        ticks.push_back({each.index, each.cell});
    }
    EXPECT_EQ(ticks, GetParam().ticks);
}

INSTANTIATE_TEST_SUITE_P(Picture, Ticks, named_cases(tick_cases), name_of_case);

// ---- What is drawn

// One element of each class, and two that are equal.
void fill_small(DifferenceMap& map) {
    map.add_run(0, 2, talcmp::equal_level);
    map.add(2, talcmp::nan_level);
    map.add(3, talcmp::level_of_digits(1));
    map.add(4, talcmp::level_of_digits(24));
    map.add(5, talcmp::more_than_all_level);
}

constexpr const char* small_svg =
    R"svg(<svg xmlns="http://www.w3.org/2000/svg" width="616" height="423" viewBox="0 0 616 423" shape-rendering="crispEdges" font-family="monospace" font-size="18">
<pattern id="nan" patternUnits="userSpaceOnUse" width="12" height="12">
<rect x="0" y="0" width="12" height="12" fill="#ffffff"/>
<rect x="0" y="0" width="6" height="6" fill="#b4005a"/>
<rect x="6" y="6" width="6" height="6" fill="#b4005a"/>
</pattern>
<rect width="100%" height="100%" fill="#ffffff"/>
<path fill="#ebebeb" d="
M40 76h47v47h-47z
M88 76h47v47h-47z
M16 287h104v18h-104z"/>
<path fill="#ebc846" d="
M40 124h47v47h-47z
M16 313h4v18h-4z"/>
<path fill="#dac448" d="
M20 313h4v18h-4z"/>
<path fill="#c8c14a" d="
M24 313h4v18h-4z"/>
<path fill="#b7bd4b" d="
M28 313h4v18h-4z"/>
<path fill="#a6b94d" d="
M32 313h4v18h-4z"/>
<path fill="#95b64f" d="
M36 313h4v18h-4z"/>
<path fill="#85b154" d="
M40 313h4v18h-4z"/>
<path fill="#76aa5b" d="
M44 313h4v18h-4z"/>
<path fill="#68a462" d="
M48 313h4v18h-4z"/>
<path fill="#599e69" d="
M52 313h4v18h-4z"/>
<path fill="#4b9771" d="
M56 313h4v18h-4z"/>
<path fill="#3c9178" d="
M60 313h4v18h-4z"/>
<path fill="#39897d" d="
M64 313h4v18h-4z"/>
<path fill="#378183" d="
M68 313h4v18h-4z"/>
<path fill="#347888" d="
M72 313h4v18h-4z"/>
<path fill="#31708e" d="
M76 313h4v18h-4z"/>
<path fill="#2e6893" d="
M80 313h4v18h-4z"/>
<path fill="#2e5f94" d="
M84 313h4v18h-4z"/>
<path fill="#31568f" d="
M88 313h4v18h-4z"/>
<path fill="#344d8b" d="
M92 313h4v18h-4z"/>
<path fill="#374486" d="
M96 313h4v18h-4z"/>
<path fill="#393b82" d="
M100 313h4v18h-4z"/>
<path fill="#3c327d" d="
M104 313h4v18h-4z"/>
<path fill="#1e1946" d="
M88 124h47v47h-47z
M16 339h104v18h-104z"/>
<path fill="#000000" d="
M136 124h47v47h-47z
M16 365h104v18h-104z"/>
<path fill="url(#nan)" d="
M136 76h47v47h-47z
M16 391h104v18h-104z"/>
<path d="
M39 75h146v1h-146z
M39 172h146v1h-146z
M39 76h1v96h-1z
M184 76h1v96h-1z
M33 99h6v2h-6z
M33 147h6v2h-6z
M63 173h2v6h-2z
M111 173h2v6h-2z
M159 173h2v6h-2z
M15 286h106v1h-106z
M15 305h106v1h-106z
M15 287h1v18h-1z
M120 287h1v18h-1z
M15 312h94v1h-94z
M15 331h94v1h-94z
M15 313h1v18h-1z
M108 313h1v18h-1z
M15 338h106v1h-106z
M15 357h106v1h-106z
M15 339h1v18h-1z
M120 339h1v18h-1z
M15 364h106v1h-106z
M15 383h106v1h-106z
M15 365h1v18h-1z
M120 365h1v18h-1z
M15 390h106v1h-106z
M15 409h106v1h-106z
M15 391h1v18h-1z
M120 391h1v18h-1z"/>
<text x="16" y="30">a&lt;b&gt;&amp;c.npy: float32 (2, 3)</text>
<text x="16" y="56">b.npy: float64 (2, 3)</text>
<text x="28" y="107" text-anchor="end">0</text>
<text x="28" y="155" text-anchor="end">1</text>
<text x="64" y="196" text-anchor="middle">0</text>
<text x="112" y="196" text-anchor="middle">1</text>
<text x="160" y="196" text-anchor="middle">2</text>
<text x="16" y="238">down: axis 0, right: axis 1</text>
<text x="16" y="264">each cell: one element</text>
<text x="132" y="303">equal: 2 elements</text>
<text x="132" y="329">1 to 23 binary digits differ: 1 element</text>
<text x="132" y="355">no digit in common: 1 element</text>
<text x="132" y="381">the same under no tolerance: 1 element</text>
<text x="132" y="407">a NaN: 1 element</text>
</svg>
)svg";

TEST(Svg, IsWhole) {
    DifferenceMap map({2, 3}, room_of_picture);
    fill_small(map);
    EXPECT_EQ(talcmp::svg_text(talcmp::draw(map, captions)), small_svg);
}

TEST(Svg, DrawsARunOfEqualCellsAsOne) {
    DifferenceMap map({1, 200}, room_of_picture);
    map.add_run(0, 200, talcmp::equal_level);
    map.add(50, talcmp::more_than_all_level);
    const talcmp::Drawing drawing = talcmp::draw(map, captions);
    ASSERT_EQ(drawing.cells.size(), 3U);
    const std::array<Level, 3> levels = {talcmp::equal_level, talcmp::more_than_all_level,
                                         talcmp::equal_level};
    const std::array<int, 3> widths = {250, 5, 745};
    for (std::size_t i = 0; i < levels.size(); ++i) {
        EXPECT_EQ(drawing.cells[i].level, levels.at(i));
        EXPECT_EQ(drawing.cells[i].box.width, widths.at(i));
    }
}

TEST(Drawings, AreNeverTooLarge) {
    const std::string name(5000, 'n');
    const talcmp::PictureCaptions long_captions = {
        {name, "complex128", name}, {name, "uint64", name}, 53};
    for (const LayoutCase& each : layouts) {
        const DifferenceMap map(each.shape, room_of_picture);
        const talcmp::Drawing drawing = talcmp::draw(map, long_captions);
        EXPECT_LE(drawing.width, 2048) << each.name;
        EXPECT_LE(drawing.height, 2048) << each.name;
        for (const talcmp::Drawing::Sample& cell : drawing.cells) {
            ASSERT_GE(cell.box.width, 2) << each.name;
            ASSERT_GE(cell.box.height, 2) << each.name;
        }
    }
}

TEST(Drawings, LeaveOutTheMiddleOfLongNames) {
    const DifferenceMap map({}, room_of_picture);
    std::string name;
    for (int i = 0; i < 200; ++i) {
        name += "\u00E4";
    }
    const talcmp::Drawing drawing =
        talcmp::draw(map, {{name, "int8", "()"}, {"line\nfeed", "int8", "()"}, 53});
    std::string half;
    for (int i = 0; i < 78; ++i) {
        half += "\u00E4";
    }
    EXPECT_EQ(drawing.texts[0].text, half + "..." + half + ": int8 ()");
    EXPECT_EQ(drawing.texts[1].text, "line?feed: int8 ()");
}

// ---- Text

struct TextCase {
    const char* name;
    Shape shape;
    int columns;
    talcmp::CharacterSet characters;
    std::function<void(DifferenceMap&)> fill;
    std::string text;
};

void fill_equal(DifferenceMap& map) {
    std::uint64_t elements = 1;
    for (const std::uint64_t extent : map.shape()) {
        elements *= extent;
    }
    map.add_run(0, elements, talcmp::equal_level);
}

void fill_digits(DifferenceMap& map) {
    for (int digits = 0; digits < 30; ++digits) {
        map.add(static_cast<std::uint64_t>(digits), talcmp::level_of_digits(digits));
    }
}

constexpr auto utf8 = talcmp::CharacterSet::utf8;
constexpr auto ascii = talcmp::CharacterSet::ascii;

const TextCase texts[] = {
    {"Small",
     {2, 3},
     80,
     utf8,
     fill_small,
     "  differences; down: axis 0, right: axis 1\n"
     "  each character: one element\n"
     "  0 ··N\n"
     "  1 ░██\n"
     "    0\n"
     "  · equal  ░ 1 to 8 digits  █ no digit in common  N a NaN\n"},
    {"SmallInAscii",
     {2, 3},
     80,
     ascii,
     fill_small,
     "  differences; down: axis 0, right: axis 1\n"
     "  each character: one element\n"
     "  0 ..N\n"
     "  1 -##\n"
     "    0\n"
     "  . equal  - 1 to 8 digits  # no digit in common  N a NaN\n"},
    {"Digits",
     {30},
     80,
     utf8,
     fill_digits,
     "  differences; right: axis 0\n"
     "  each character: one element\n"
     "  ·░░░░░░░░▒▒▒▒▒▒▒▒▓▓▓▓▓▓▓██████\n"
     "  0    5    10   15   20   25\n"
     "  · equal  ░ 1 to 8 digits  ▒ 9 to 16 digits  ▓ 17 to 23 digits\n"
     "  █ no digit in common\n"},
    {"NothingComparedAtTheEnd",
     {31},
     40,
     ascii,
     fill_digits,
     "  differences; right: axis 0\n"
     "  each character: one element\n"
     "  .--------++++++++xxxxxxx###### \n"
     "  0    5    10   15   20   25\n"
     "    not compared  . equal\n"
     "  - 1 to 8 digits  + 9 to 16 digits\n"
     "  x 17 to 23 digits\n"
     "  # no digit in common\n"},
    {"Reduced",
     {3, 1000},
     40,
     ascii,
     fill_small,
     "  differences; down: axis 0, right:\n"
     "  axis 1\n"
     "  each character: the worst of 1 x 29\n"
     "  elements\n"
     "  0 N                                  \n"
     "  1                                    \n"
     "  2                                    \n"
     "    0     200    400    600    800\n"
     "    not compared  N a NaN\n"},
    {"Grid",
     {2, 3, 2, 5},
     40,
     ascii,
     fill_digits,
     "  differences; images: axes 0 to 1;\n"
     "  down: axis 2, right: axis 3\n"
     "  each character: one element\n"
     "    [0, 0]\n"
     "  0 .---- +++++ xxxx#\n"
     "  1 ----+ ++xxx #####\n"
     "    [1, 0]\n"
     "  0                  \n"
     "  1                  \n"
     "    0     0     0\n"
     "    not compared  . equal\n"
     "  - 1 to 8 digits  + 9 to 16 digits\n"
     "  x 17 to 23 digits\n"
     "  # no digit in common\n"},
    {"LargeGrid",
     {2, 30, 200, 200},
     40,
     ascii,
     fill_equal,
     "  differences; images: axes 0 to 1;\n"
     "  down: axis 2, right: axis 3\n"
     "  each character: the worst of 2 x 67 x\n"
     "  67 elements\n"
     "      [0, 0] to [0, 1]\n"
     "    0 ... ... ... ... ... ... ... ...\n"
     "   67 ... ... ... ... ... ... ... ...\n"
     "  134 ... ... ... ... ... ... ... ...\n"
     "      [0, 16] to [0, 17]\n"
     "    0 ... ... ... ... ... ... ... ...\n"
     "   67 ... ... ... ... ... ... ... ...\n"
     "  134 ... ... ... ... ... ... ... ...\n"
     "      [1, 2] to [1, 3]\n"
     "    0 ... ... ... ... ... ... ... ...\n"
     "   67 ... ... ... ... ... ... ... ...\n"
     "  134 ... ... ... ... ... ... ... ...\n"
     "      [1, 18] to [1, 19]\n"
     "    0 ... ... ... ... ... ...\n"
     "   67 ... ... ... ... ... ...\n"
     "  134 ... ... ... ... ... ...\n"
     "      0   0   0   0   0   0   0   0\n"
     "  . equal\n"},
    {"OneNumber",
     {},
     80,
     ascii,
     fill_equal,
     "  differences; one number\n"
     "  each character: one element\n"
     "  .\n"
     "  0\n"
     "  . equal\n"},
    {"NoElements",
     {0, 3},
     80,
     ascii,
     [](DifferenceMap& /*map*/) {},
     "  differences; down: axis 0, right: axis 1\n"
     "  no elements\n"},
    {"NoColumns",
     {30},
     0,
     ascii,
     fill_equal,
     "  differences;\n"
     "  right:\n"
     "  axis\n"
     "  0\n"
     "  each\n"
     "  character:\n"
     "  the\n"
     "  worst\n"
     "  of\n"
     "  30\n"
     "  elements\n"
     "  .\n"
     "  0\n"
     "  . equal\n"},
};

class TextMaps : public NamedCaseTest<TextCase> {};

TEST_P(TextMaps, Are) {
    const TextCase& each = GetParam();
    DifferenceMap map(each.shape, talcmp::room_of_text(each.shape, each.columns));
    each.fill(map);
    const talcmp::Terminal terminal(false, false, each.columns);
    EXPECT_EQ(talcmp::text_map(map, 24, each.characters, terminal), each.text);
}

INSTANTIATE_TEST_SUITE_P(Picture, TextMaps, named_cases(texts), name_of_case);

TEST(TextMap, IsColouredByRuns) {
    DifferenceMap map({2, 3}, talcmp::room_of_text({2, 3}, 80));
    fill_small(map);
    const std::string text = talcmp::text_map(map, 24, ascii, talcmp::Terminal(true, true, 80));
    EXPECT_EQ(text, "  differences; down: axis 0, right: axis 1\n"
                    "  each character: one element\n"
                    "  0 ..\x1B[31mN\x1B[0m\n"
                    "  1 \x1B[34m-\x1B[0m\x1B[31m##\x1B[0m\n"
                    "    0\n"
                    "  . equal  \x1B[34m-\x1B[0m 1 to 8 digits  \x1B[31m#\x1B[0m no digit in common"
                    "  \x1B[31mN\x1B[0m a NaN\n");
}

TEST(TextMap, HasTheCharactersThatTheEnvironmentNames) {
    const auto characters = [](const char* const all, const char* const type,
                               const char* const language) {
        ::setenv("LC_ALL", all, 1);
        ::setenv("LC_CTYPE", type, 1);
        ::setenv("LANG", language, 1);
        return talcmp::character_set_of_environment();
    };
    EXPECT_EQ(characters("", "", ""), ascii);
    EXPECT_EQ(characters("", "", "en_GB.UTF-8"), utf8);
    EXPECT_EQ(characters("", "de_DE.utf8", "C"), utf8);
    EXPECT_EQ(characters("", "C", "en_GB.UTF-8"), ascii);
    EXPECT_EQ(characters("C", "C.UTF-8", "C.UTF-8"), ascii);
    ::unsetenv("LC_ALL");
    ::unsetenv("LC_CTYPE");
    ::unsetenv("LANG");
    EXPECT_EQ(talcmp::character_set_of_environment(), ascii);
}

} // namespace
