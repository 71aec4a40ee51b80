// The way through two arrays: every pair once, in order, and each element where it belongs.

#include "to_type.h"
#include "traversal.h"

#include "support/indices.h"
#include "support/memory_array.h"
#include "support/named_cases.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <complex>
#include <cstddef>
#include <cstdint>
#include <map>
#include <numeric>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace {

using talcmp::Shape;
using talcmp::Side;

// Where the element of an index is stored.
std::uint64_t position_of(const Shape& shape, const Order order, const Shape& index) {
    std::uint64_t position = 0;
    for (std::size_t i = 0; i < shape.size(); ++i) {
        const std::size_t axis = order == Order::c ? i : shape.size() - 1 - i;
        position = position * shape[axis] + index[axis];
    }
    return position;
}

// The numbers of the places in row-major order, in the order in which `order` stores them.
std::vector<std::uint64_t> numbers_of(const Shape& shape, const Order order) {
    const std::vector<Shape> indices = indices_of(shape);
    std::vector<std::uint64_t> numbers(indices.size());
    for (std::size_t number = 0; number < indices.size(); ++number) {
        numbers[static_cast<std::size_t>(position_of(shape, order, indices[number]))] = number;
    }
    return numbers;
}

// The element that stands for a number; in narrow types one stands for several.
template <typename T>
T element_of(const std::uint64_t number) {
    return static_cast<T>(static_cast<to_real_type_t<T>>(number));
}

template <typename T>
MemoryArray<T> array_of(const Shape& shape, const std::vector<std::uint64_t>& numbers,
                        const Order order) {
    std::vector<T> elements(numbers.size());
    std::transform(numbers.begin(), numbers.end(), elements.begin(), element_of<T>);
    return {shape, std::move(elements), order};
}

struct Way {
    const char* name;
    Shape shape;
    const char* slice;
    Order first;
    Order second;
    std::uint64_t pairs;    // that are selected
    bool is_linear = false; // whether both are read from the beginning to the end
};

const Way ways[] = {
    {"OneElement", {1, 1}, ":", Order::c, Order::fortran, 1, true},
    {"NoAxis", {}, ":", Order::c, Order::c, 1, true},
    {"Row", {40000}, ":", Order::c, Order::c, 40000, true},
    {"RowInEitherOrder", {40000}, ":", Order::c, Order::fortran, 40000, true},
    {"Stretch", {40000}, "7:39999", Order::c, Order::c, 39992, true},
    {"COrder", {3, 5, 700}, ":", Order::c, Order::c, 10500, true},
    {"FortranOrder", {3, 5, 700}, ":", Order::fortran, Order::fortran, 10500, true},
    {"COrderAgainstFortran", {530, 370}, ":", Order::c, Order::fortran, 196100},
    {"FortranOrderAgainstC", {370, 530}, ":", Order::fortran, Order::c, 196100},
    {"EdgesOfOneElement", {363, 363}, ":", Order::c, Order::fortran, 131769},
    {"FewLongColumns", {20000, 2}, ":", Order::c, Order::fortran, 40000},
    {"FewLongRows", {2, 20000}, ":", Order::fortran, Order::c, 40000},
    {"FourAxes", {7, 30, 11, 13}, ":", Order::c, Order::fortran, 30030},
    {"AxesOfLengthOne", {1, 90, 1, 80, 1}, ":", Order::fortran, Order::c, 7200},
    {"EverySecondRow", {20000, 2}, "::2", Order::c, Order::c, 20000},
    {"EverySecondRowOfOtherOrders", {20000, 2}, "::2", Order::c, Order::fortran, 20000},
    {"EverySecondRowOfColumns", {20000, 2}, "::2", Order::fortran, Order::fortran, 20000},
    {"EveryFarRow", {20000, 2}, "5::999", Order::fortran, Order::c, 42},
    {"OneColumn", {20000, 2}, ":,1", Order::c, Order::fortran, 20000},
    {"Middle", {90, 100, 11}, "3:80,1:99,2:9", Order::c, Order::c, 52822},
    {"MiddleOfOtherOrders", {90, 100, 11}, "3:80,1:99,2:9", Order::c, Order::fortran, 52822},
    {"Steps", {90, 100, 11}, "3::3,1::7,::2", Order::fortran, Order::c, 2610},
};

class Ways : public NamedCaseTest<Way> {
  protected:
    const Way& way_ = GetParam();
    talcmp::Selection selection_ =
        way_.shape.empty() ? talcmp::Selection() : talcmp::read_selection(way_.slice);
    bool column_major_ = way_.first == Order::fortran && way_.second == Order::fortran;
    std::vector<std::uint64_t> numbers1_ = numbers_of(way_.shape, way_.first);
    std::vector<std::uint64_t> numbers2_ = numbers_of(way_.shape, way_.second);
    std::vector<int> selected_ = selected_numbers();

    template <typename T>
    void expect_every_pair_once() const {
        SCOPED_TRACE(sizeof(T));
        auto first = array_of<T>(way_.shape, numbers1_, way_.first);
        auto second = array_of<T>(way_.shape, numbers2_, way_.second);
        const talcmp::Traversal traversal(select(first, selection_), select(second, selection_),
                                          column_major_, sizeof(T));
        EXPECT_EQ(traversal.is_linear(), way_.is_linear);
        EXPECT_EQ(traversal.pair_count(), way_.pairs);
        EXPECT_EQ(walk(traversal, first, second), selected_);
    }

    // How often each element was met, by its number.
    template <typename T>
    std::vector<int> walk(const talcmp::Traversal& traversal, MemoryArray<T>& first,
                          MemoryArray<T>& second) const {
        std::vector<int> met(numbers1_.size());
        std::vector<T> elements1(traversal.largest_box());
        std::vector<T> elements2(traversal.largest_box());
        for (std::uint64_t i = 0; i < traversal.box_count(); ++i) {
            const talcmp::Box box = traversal.box(i);
            traversal.read(Side::first, first, box, elements1.data());
            traversal.read(Side::second, second, box, elements2.data());
            std::uint64_t last = 0;
            for (std::size_t local = 0; local < box.count; ++local) {
                const std::uint64_t position = traversal.first_position(box, local);
                const std::uint64_t number = numbers1_.at(static_cast<std::size_t>(position));
                const std::uint64_t order = column_major_ ? position : number;
                const T element = element_of<T>(number);
                if (elements1[local] != element || elements2[local] != element
                    || (local != 0 && order <= last)) {
                    ADD_FAILURE() << "box " << i << ", pair " << local << ", number " << number
                                  << ": " << elements1[local] << " and " << elements2[local];
                    return met;
                }
                ++met[static_cast<std::size_t>(number)];
                last = order;
            }
        }
        return met;
    }

    // As `walk` returns them: 1 for each element that is selected.
    std::vector<int> selected_numbers() const {
        std::vector<int> numbers;
        for (const Shape& index : indices_of(way_.shape)) {
            bool inside = true;
            for (std::size_t axis = 0; axis < selection_.first.size(); ++axis) {
                const talcmp::AxisRange& range = selection_.first[axis];
                const auto at = static_cast<std::int64_t>(index[axis]);
                const std::int64_t start = range.start.value_or(0);
                inside = inside && at >= start
                         && (range.one_index ? at == start
                                             : (at - start) % range.step == 0
                                                   && (!range.stop || at < *range.stop));
            }
            numbers.push_back(inside ? 1 : 0);
        }
        return numbers;
    }
};

TEST_P(Ways, LeadToEveryPairOnce) {
    expect_every_pair_once<std::int8_t>();
    expect_every_pair_once<std::uint16_t>();
    expect_every_pair_once<std::int32_t>();
    expect_every_pair_once<std::uint64_t>();
    expect_every_pair_once<std::complex<double>>();
}

INSTANTIATE_TEST_SUITE_P(Traversal, Ways, named_cases(ways), name_of_case);

// ---- Arrays in blocks

// An array in memory, of which blocks are read as a file's compressed chunks would be. Elements are
// their row-major numbers.
class BlockArray : public TypedArray<std::int32_t> {
  public:
    BlockArray(Shape shape, Shape block)
        : TypedArray<std::int32_t>(std::move(shape)), block_(std::move(block)) {}

    const Shape& block() const override { return block_; }

    void read(std::uint64_t /*first*/, std::uint64_t /*count*/, void* /*elements*/) override {
        throw std::logic_error("an array in blocks is read by its positions");
    }

    void read_slab(const talcmp::Slab& slab, void* const elements) override {
        Shape extents;
        for (const talcmp::Slab::Axis& axis : slab.axes) {
            extents.push_back(axis.extent);
        }
        std::set<Shape> touched;
        auto* next = static_cast<std::int32_t*>(elements);
        for (Shape index : indices_of(extents)) {
            std::int32_t number = 0;
            for (std::size_t axis = 0; axis < index.size(); ++axis) {
                index[axis] = slab.axes[axis].begin + index[axis] * slab.axes[axis].step;
                number = number * static_cast<std::int32_t>(shape()[axis])
                         + static_cast<std::int32_t>(index[axis]);
                index[axis] /= block_[axis];
            }
            *next++ = number;
            touched.insert(index);
        }
        for (const Shape& block : touched) {
            ++reads_of_[block];
        }
    }

    // How often the block was read that was read most often.
    int most_reads() const {
        int most = 0;
        for (const auto& [block, reads] : reads_of_) {
            most = std::max(most, reads);
        }
        return most;
    }

  private:
    Shape block_;
    std::map<Shape, int> reads_of_;
};

struct BlockWay {
    const char* name;
    Shape shape;
    const char* slice;
    Shape block1;
    Shape block2; // empty for an array without blocks
};

const BlockWay block_ways[] = {
    {"OneBlock", {10, 20}, ":", {10, 20}, {10, 20}},
    {"LargerThanTheArray", {10, 20}, ":", {16, 32}, {16, 32}},
    {"OneElementEach", {5, 7}, ":", {1, 1}, {1, 1}},
    {"Alike", {100, 90}, ":", {32, 32}, {32, 32}},
    {"SecondInStretches", {100, 90}, ":", {32, 7}, {}},
    {"Multiples", {120, 90}, ":", {20, 15}, {40, 5}},
    {"NoMultiples", {120, 90}, ":", {12, 15}, {18, 10}},
    {"RowsAndColumns", {60, 70}, ":", {1, 70}, {60, 1}},
    {"FourAxes", {9, 8, 7, 6}, ":", {4, 4, 4, 4}, {2, 8, 1, 3}},
    {"FromTheMiddle", {100, 90}, "13:90,40:", {32, 32}, {32, 32}},
    {"FromTheMiddleOfMultiples", {100, 90}, "13:90,40:", {16, 32}, {32, 8}},
    {"Index", {100, 90, 20}, ":,17,3:", {8, 8, 8}, {8, 4, 2}},
    {"StepsOfABlock", {100, 90}, "::32,::32", {32, 32}, {32, 32}},
    {"StepsThatDivide", {100, 90}, "1::4,3::2", {32, 32}, {16, 32}},
    {"StepsThatDoNotDivide", {100, 90}, "5::3,2::7", {32, 16}, {32, 16}},
    {"StepsOfSeveralBlocks", {100, 90}, "5::30,2::45", {8, 4}, {2, 4}},
    {"BackwardSteps", {100, 90}, "90:3:-3,::-1", {32, 16}, {32, 16}},
};

class BlockWays : public NamedCaseTest<BlockWay> {};

TEST_P(BlockWays, LeadToEveryPairAndReadEachBlockOnce) {
    const BlockWay& way = GetParam();
    BlockArray first(way.shape, way.block1);
    BlockArray in_blocks(way.shape, way.block2);
    std::vector<std::int32_t> numbers(indices_of(way.shape).size());
    std::iota(numbers.begin(), numbers.end(), 0);
    MemoryArray<std::int32_t> in_stretches(way.shape, numbers);
    talcmp::ArraySource& second =
        way.block2.empty() ? static_cast<talcmp::ArraySource&>(in_stretches) : in_blocks;
    const talcmp::Selection selection = talcmp::read_selection(way.slice);
    const talcmp::View view = select(in_stretches, selection);
    const talcmp::Traversal traversal(select(first, selection), select(second, selection), false,
                                      sizeof(std::int32_t));
    EXPECT_FALSE(traversal.is_linear());
    std::multiset<std::int32_t> met;
    std::vector<std::int32_t> elements1(traversal.largest_box());
    std::vector<std::int32_t> elements2(traversal.largest_box());
    for (std::uint64_t i = 0; i < traversal.box_count(); ++i) {
        const talcmp::Box box = traversal.box(i);
        ASSERT_LE(box.count, traversal.largest_box());
        traversal.read(Side::first, first, box, elements1.data());
        traversal.read(Side::second, second, box, elements2.data());
        for (std::size_t local = 0; local < box.count; ++local) {
            ASSERT_EQ(elements1[local], elements2[local]);
            ASSERT_EQ(static_cast<std::uint64_t>(elements1[local]),
                      traversal.first_position(box, local));
            met.insert(elements1[local]);
        }
    }
    std::multiset<std::int32_t> expected;
    for (const Shape& index : indices_of(view.shape)) {
        std::uint64_t position = view.offset;
        for (std::size_t axis = 0; axis < index.size(); ++axis) {
            position += index[axis] * view.strides[axis];
        }
        expected.insert(static_cast<std::int32_t>(position));
    }
    EXPECT_EQ(met, expected);
    EXPECT_EQ(traversal.pair_count(), expected.size());
    EXPECT_EQ(first.most_reads(), 1);
    EXPECT_EQ(in_blocks.most_reads(), way.block2.empty() ? 0 : 1);
}

INSTANTIATE_TEST_SUITE_P(Traversal, BlockWays, named_cases(block_ways), name_of_case);

// Small blocks make no small boxes, and large ones no larger ones than needed.
TEST(BoxesOfBlocks, TakeAFewMiBUnlessABlockIsLarger) {
    const struct {
        Shape block;
        std::uint64_t largest; // box
    } cases[] = {
        {{1, 1}, 524000}, {{64, 64}, 512000}, {{2048, 1024}, 2097152}, {{3000, 1}, 522000}};
    for (const auto& [block, largest] : cases) {
        const BlockArray array({3000, 4000}, block);
        const talcmp::View view = select(array, {});
        EXPECT_EQ(talcmp::Traversal(view, view, false, 4).largest_box(), largest);
        EXPECT_EQ(talcmp::smallest_box(view, view), block[0] * block[1]);
    }
}

TEST(BoxesOfBlocks, OfTwoArraysAreWholeBlocksOfBoth) {
    const auto smallest = [](const Shape& block1, const Shape& block2, const char* const slice1,
                             const char* const slice2) {
        return talcmp::smallest_box(
            select(BlockArray({600, 600}, block1), talcmp::read_selection(slice1)),
            select(BlockArray({600, 600}, block2), talcmp::read_selection(slice2)));
    };
    EXPECT_EQ(smallest({10, 10}, {15, 10}, ":", ":"), 300U);
    EXPECT_EQ(smallest({1, 600}, {600, 1}, ":", ":"), 360000U);
    // Blocks that never begin together have one box from end to end.
    EXPECT_EQ(smallest({10, 600}, {10, 600}, ":500", "5:505"), 500U * 600);
    EXPECT_EQ(smallest({10, 600}, {10, 600}, ":500", "10:510"), 10U * 600);
    EXPECT_EQ(smallest({10, 600}, {4, 600}, ":500", "2:502"), 20U * 600);
    EXPECT_EQ(smallest({7, 600}, {10, 600}, ":50", ":50"), 50U * 600);
}

} // namespace
