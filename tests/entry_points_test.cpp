// The two predicates: shape, count and type, and the dispatch over the pair of types.

#include "talnumericarray_compare.h"
#include "talnumericarray_sameq_impl.h"

#include "support/arrays.h"
#include "support/element_types.h"
#include "support/type_pairs.h"

#include <gtest/gtest.h>

#include <complex>
#include <initializer_list>
#include <limits>
#include <vector>

namespace {

constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr type_t unknown_types[] = {
    0, -1, 13, 42, std::numeric_limits<int>::min(), std::numeric_limits<int>::max()};

// Six integers of the given shape.
Array<BIT32> six(std::vector<talint> dimensions) {
    return Array<BIT32>(std::move(dimensions), {1, 2, 3, 4, 5, 6});
}

TEST(Shape, DifferentRanksAreNeitherSameNorEquivalent) {
    const auto array1 = six({2, 3});
    const auto array2 = six({2, 3, 1});
    EXPECT_EQ(sameQ(0, array1, array2), 0);
    EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), array2.handle()), 0);
    const Array<double> reals({2, 3, 1}, {1, 2, 3, 4, 5, 6});
    EXPECT_EQ(sameQ(0, array1, reals), 0);
    EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), reals.handle()), 0);
}

TEST(Shape, TransposedDimensionsAreNeitherSameNorEquivalent) {
    const auto array1 = six({2, 3});
    const auto array2 = six({3, 2});
    EXPECT_EQ(sameQ(0, array1, array2), 0);
    EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), array2.handle()), 0);
}

TEST(Shape, EqualShapesAndTypesAreEquivalentWhateverTheElements) {
    const Array<BIT32> array1({2, 3}, {1, 2, 3, 4, 5, 6});
    const Array<BIT32> array2({2, 3}, {0, 0, 0, 0, 0, 0});
    EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), array2.handle()), 1);
    EXPECT_EQ(sameQ(0, array1, array2), 0);
}

// No array has such dimensions, but every bit of a record's dimensions counts.
TEST(Shape, DimensionsThatDifferInTheSignAloneAreNeitherSameNorEquivalent) {
    constexpr talint sign = std::numeric_limits<talint>::min();
    for (const std::size_t place : {0U, 1U}) {
        for (const bool negated : {false, true}) {
            const auto array = six({2, 3});
            std::vector<talint> dimensions = {2, 3};
            talint& dimension = dimensions[place];
            dimension = negated ? -dimension : dimension + sign;
            const auto other = six(dimensions);
            EXPECT_EQ(sameQ(0, array, other), 0) << place << ", " << negated;
            EXPECT_EQ(sameQ(0, other, array), 0) << place << ", " << negated;
            EXPECT_EQ(TalNumericArray_equivalentQ(array.handle(), other.handle()), 0)
                << place << ", " << negated;
            EXPECT_EQ(TalNumericArray_equivalentQ(other.handle(), array.handle()), 0)
                << place << ", " << negated;
        }
    }
}

TEST(Shape, RankZeroIsOneElement) {
    const Array<double> array1({}, {1.5});
    const Array<double> array2({}, {1.5});
    const Array<double> array3({}, {2.5});
    EXPECT_EQ(sameQ(0, array1, array2), 1);
    EXPECT_EQ(sameQ(0, array1, array3), 0);
    EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), array3.handle()), 1);
}

TEST(Shape, RankZeroNeedsNoDimensions) {
    Array<double> array1({}, {1.5});
    Array<double> array2({}, {1.5});
    array1.record().dims = nullptr;
    array2.record().dims = nullptr;
    EXPECT_EQ(sameQ(0, array1, array2), 1);
    EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), array2.handle()), 1);
}

// ---- Arrays without elements

TEST(NoElements, AreTheSameWhateverTheirTypes) {
    Array<BIT32> integers({2, 0}, {});
    Array<double> reals({2, 0}, {});
    integers.record().data = nullptr;
    reals.record().data = nullptr;
    EXPECT_EQ(TalNumericArray_sameQ(0, 0, integers.handle(), reals.handle()), 1);
    EXPECT_EQ(TalNumericArray_equivalentQ(integers.handle(), reals.handle()), 0);
    for (const type_t type : unknown_types) {
        integers.record().data_type = type;
        EXPECT_EQ(TalNumericArray_sameQ(0, 0, integers.handle(), reals.handle()), 1) << type;
        EXPECT_EQ(TalNumericArray_sameQ(0, 1, reals.handle(), integers.handle()), 1) << type;
    }
}

TEST(NoElements, OfDifferentShapesAreNotTheSame) {
    const Array<BIT32> array1({2, 0}, {});
    const Array<BIT32> array2({0, 2}, {});
    EXPECT_EQ(sameQ(0, array1, array2), 0);
}

// ---- Types

TEST(UnknownTypes, AreNeverTheSameButEquivalent) {
    for (const type_t type : unknown_types) {
        Array<BIT32> array1 = {1, 2, 3, 4};
        Array<BIT32> array2 = {1, 2, 3, 4};
        array1.record().data_type = type;
        array2.record().data_type = type;
        EXPECT_EQ(TalNumericArray_sameQ(0, 0, array1.handle(), array2.handle()), 0) << type;
        EXPECT_EQ(TalNumericArray_sameQ(0, 1, array1.handle(), array2.handle()), 0) << type;
        EXPECT_EQ(TalNumericArray_equivalentQ(array1.handle(), array2.handle()), 1) << type;
    }
}

TEST(UnknownTypes, OnOneSideMakeTheAnswerZeroForEveryTypeOnTheOther) {
    for (const type_t unknown : unknown_types) {
        for (type_t known = 1; known <= 12; ++known) {
            Array<std::complex<double>> of_known = {1.0};
            Array<std::complex<double>> of_unknown = {1.0};
            of_known.record().data_type = known;
            of_unknown.record().data_type = unknown;
            EXPECT_EQ(sameQ(0, of_known, of_unknown), 0) << known << " and " << unknown;
            EXPECT_EQ(sameQ(0, of_unknown, of_known), 0) << unknown << " and " << known;
        }
    }
}

TEST(DifferentTypes, AreTheSameOnlyWhereTheCallerAllowsIt) {
    for_each_pair([](const ElementType& type1, const ElementType& type2) {
        const AnyArray array1(type1, {5, 7});
        const AnyArray array2(type2, {5, 7});
        const AnyArray array3(type2, {5, 8});
        const int equal_types = type1.id == type2.id ? 1 : 0;
        const auto handle1 = array1.handle();
        for (const double tol : {0.0, -0.0, 1.0, 10.5, -1.0}) {
            EXPECT_EQ(TalNumericArray_sameQ(tol, 1, handle1, array2.handle()), 1);
            EXPECT_EQ(TalNumericArray_sameQ(tol, -1, handle1, array2.handle()), 1);
            EXPECT_EQ(TalNumericArray_sameQ(tol, 0, handle1, array2.handle()), equal_types);
            EXPECT_EQ(TalNumericArray_sameQ(tol, 1, handle1, array3.handle()), 0);
        }
        EXPECT_EQ(TalNumericArray_equivalentQ(handle1, array2.handle()), equal_types);
    });
}

// ---- The levels of the dispatch

using Routine = int (*)(const talreal&, TalNumericArray, TalNumericArray) noexcept;

void expect_answers(const ElementType& type1, const ElementType& type2,
                    const std::initializer_list<Routine> routines) {
    const AnyArray array1(type1, {5, 7});
    const AnyArray array2(type2, {5, 7});
    const AnyArray array3(type2, {5, 8});
    const talreal tol = 10.5;
    for (const Routine routine : routines) {
        EXPECT_EQ(routine(tol, array1.handle(), array2.handle()), 1);
        EXPECT_EQ(routine(tol, array1.handle(), array3.handle()), 0);
    }
}

TEST(Dispatch, EachLevelAnswers) {
    for_each_pair_of_types([](auto tag1, auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        SCOPED_TRACE(testing::Message() << element_type_id<T1> << " and " << element_type_id<T2>);
        expect_answers(element_type_of<T1>(), element_type_of<T2>(),
                       {&TalNumericArray_sameQ_impl, &TalNumericArray_sameQ_impl<T1>,
                        &TalNumericArray_sameQ_impl<T1, T2>});
    });
}

TEST(Dispatch, LoopTakesANegativeCountForNoElements) {
    Array<BIT32> array1 = {1, 2, 3};
    const Array<double> array2 = {4, 5, 6};
    array1.record().nelems = -1;
    EXPECT_EQ(sameQ(10, array1, array2), 1);
}

// ---- Bytes

// One differing byte at each place.
TEST(Bytes, EveryByteOfEveryElementIsCompared) {
    for (const ElementType& type : element_types) {
        const AnyArray array1(type, {1, 1, 1});
        for (std::size_t i = 0; i < 3 * type.size; ++i) {
            AnyArray array2(type, {1, 1, 1});
            EXPECT_EQ(TalNumericArray_sameQ(0, 0, array1.handle(), array2.handle()), 1);
            array2.bytes()[i] ^= 1U;
            EXPECT_EQ(TalNumericArray_sameQ(0, 0, array1.handle(), array2.handle()), 0)
                << "element type " << type.id << ", byte " << i;
        }
    }
}

TEST(Bytes, PermissionForOtherTypesChangesNothingForEqualOnes) {
    for (const ElementType& type : element_types) {
        const AnyArray array1(type, {1, 0, 3});
        const AnyArray array2(type, {1, 0, 3});
        const AnyArray array3(type, {1, 0, 4});
        for (const double tol : every_tolerance) {
            for (const AnyArray* other : {&array2, &array3}) {
                EXPECT_EQ(TalNumericArray_sameQ(tol, 0, array1.handle(), other->handle()),
                          TalNumericArray_sameQ(tol, 1, array1.handle(), other->handle()))
                    << "element type " << type.id << ", tolerance " << tol;
            }
        }
    }
}

// ---- Counts and identity

TEST(Count, OfTheSecondArrayIsNeverRead) {
    const Array<BIT32> array1 = {1, 2, 3};
    Array<BIT32> array2 = {1, 2, 4};
    Array<double> array3 = {1, 2, 4};
    for (const talint count : {0, 2, 7, -1}) {
        array2.record().nelems = count;
        array3.record().nelems = count;
        EXPECT_EQ(sameQ(0, array1, array2), 0) << count;
        EXPECT_EQ(sameQ(0, array1, array3), 0) << count;
    }
}

TEST(Count, OfZeroInTheFirstArrayIsEnough) {
    Array<BIT32> array1 = {1, 2, 3};
    const Array<BIT32> array2 = {4, 5, 6};
    array1.record().nelems = 0;
    EXPECT_EQ(sameQ(0, array1, array2), 1);
}

// 65536 elements, which a count of 16 bits would take for none.
TEST(Count, HasMoreThan16Bits) {
    constexpr std::size_t count = 65536;
    std::vector<BIT32> integers(count, 1);
    const std::vector<talint> dimensions = {static_cast<talint>(count)};
    const Array<BIT32> array1(dimensions, integers);
    integers.back() = 2;
    const Array<BIT32> array2(dimensions, integers);
    const Array<double> array3(dimensions, std::vector<double>(integers.begin(), integers.end()));
    EXPECT_EQ(sameQ(0, array1, array2), 0);
    EXPECT_EQ(sameQ(0, array1, array3), 0);
    EXPECT_EQ(sameQ(0, array2, array3), 1);
}

TEST(Identity, AnArrayIsEquivalentToItselfAndTheSameByItsBytes) {
    for (const ElementType& type : element_types) {
        const AnyArray array(type, {1, 2, 3});
        EXPECT_EQ(TalNumericArray_equivalentQ(array.handle(), array.handle()), 1) << type.id;
        EXPECT_EQ(TalNumericArray_sameQ(0, 0, array.handle(), array.handle()), 1) << type.id;
    }
    const Array<double> with_nan = {nan, -0.0};
    EXPECT_EQ(sameQ(0, with_nan, with_nan), 1);
    EXPECT_EQ(sameQ(1, with_nan, with_nan), 0);
}

} // namespace
