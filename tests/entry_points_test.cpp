// The two predicates: shape, count and type, and the dispatch over the pair of types.

#include "talnumericarray_compare.h"
#include "talnumericarray_sameq_impl.h"

#include "support/arrays.h"
#include "support/element_pairs.h"

#include <gtest/gtest.h>

#include <complex>
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
    for_each_pair([](const auto tag1, const auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        const Array<T1> array1 = {T1(5), T1(7)};
        const Array<T2> array2 = {T2(5), T2(7)};
        const Array<T2> array3 = {T2(5), T2(8)};
        const int equal_types = std::is_same_v<T1, T2> ? 1 : 0;
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

// The three levels of the dispatch agree with the predicate.
TEST(Dispatch, EachLevelAnswers) {
    for_each_pair([](const auto tag1, const auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        const Array<T1> array1 = {T1(5), T1(7)};
        const Array<T2> array2 = {T2(5), T2(7)};
        const Array<T2> array3 = {T2(5), T2(8)};
        const talreal tol = 10.5;
        const auto handle1 = array1.handle();
        EXPECT_EQ(TalNumericArray_sameQ_impl(tol, handle1, array2.handle()), 1);
        EXPECT_EQ(TalNumericArray_sameQ_impl<T1>(tol, handle1, array2.handle()), 1);
        EXPECT_EQ((TalNumericArray_sameQ_impl<T1, T2>(tol, handle1, array2.handle())), 1);
        EXPECT_EQ(TalNumericArray_sameQ_impl(tol, handle1, array3.handle()), 0);
        EXPECT_EQ(TalNumericArray_sameQ_impl<T1>(tol, handle1, array3.handle()), 0);
        EXPECT_EQ((TalNumericArray_sameQ_impl<T1, T2>(tol, handle1, array3.handle())), 0);
    });
}

TEST(Dispatch, LoopTakesANegativeCountForNoElements) {
    Array<BIT32> array1 = {1, 2, 3};
    const Array<double> array2 = {4, 5, 6};
    array1.record().nelems = -1;
    EXPECT_EQ(sameQ(10, array1, array2), 1);
}

// ---- Bytes

TEST(Bytes, IntegersOfOneTypeIgnoreTheTolerance) {
    const Array<BIT32> array1 = {1, 2, 3};
    const Array<BIT32> array2 = {1, 2, 3};
    const Array<BIT32> array3 = {1, 2, 4};
    for (const double tol : {0.0, 1e300, nan, -5.0, 60.0}) {
        EXPECT_EQ(sameQ(tol, array1, array2), 1) << tol;
        EXPECT_EQ(sameQ(tol, array1, array3), 0) << tol;
    }
}

TEST(Bytes, ZerosOfBothSignsDifferUnderToleranceZero) {
    EXPECT_EQ(sameQ_of(0.0, 0.0, -0.0), 0);
    EXPECT_EQ(sameQ_of(-0.0, 0.0, -0.0), 0);
    EXPECT_EQ(sameQ_of(1e-10, 0.0, -0.0), 1);
    EXPECT_EQ(sameQ_of(nan, 0.0, -0.0), 1);
}

TEST(Bytes, NaNsOfEqualBitsAreTheSameUnderToleranceZero) {
    const float quiet = std::numeric_limits<float>::quiet_NaN();
    EXPECT_EQ(sameQ_of(0.0, quiet, quiet), 1);
    EXPECT_EQ(sameQ_of(0.0, quiet, -quiet), 0);
    EXPECT_EQ(sameQ_of(10.0, quiet, quiet), 0);
}

// One differing byte at each place, in an element that is not the last.
TEST(Bytes, EveryByteOfEveryElementIsCompared) {
    for_each_type(element_type_list{}, [](const auto tag) {
        using T = typename decltype(tag)::type;
        const std::vector<T> elements(3, T(1));
        const Array<T> array1({3}, elements);
        for (std::size_t i = 0; i < 3 * sizeof(T); ++i) {
            const Array<T> array2({3}, elements);
            static_cast<unsigned char*>(array2.handle()->data)[i] ^= 1U;
            EXPECT_EQ(sameQ(0, array1, array2), 0) << "byte " << i;
        }
        EXPECT_EQ(sameQ(0, array1, Array<T>({3}, elements)), 1);
    });
}

TEST(Bytes, PermissionForOtherTypesChangesNothingForEqualOnes) {
    const Array<double> array1 = {1.0, -0.0, nan};
    const Array<double> array2 = {1.0, 0.0, nan};
    for (const double tol : {0.0, 1.0, 53.0, nan}) {
        for (const Array<double>* other : {&array1, &array2}) {
            EXPECT_EQ(TalNumericArray_sameQ(tol, 0, array1.handle(), other->handle()),
                      TalNumericArray_sameQ(tol, 1, array1.handle(), other->handle()));
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

TEST(Identity, AnArrayIsEquivalentToItselfAndTheSameByItsBytes) {
    for_each_type(element_type_list{}, [](const auto tag) {
        using T = typename decltype(tag)::type;
        const Array<T> array = {T(1), T(2), T(3)};
        EXPECT_EQ(TalNumericArray_equivalentQ(array.handle(), array.handle()), 1);
        EXPECT_EQ(sameQ(0, array, array), 1);
    });
    const Array<double> with_nan = {nan, -0.0};
    EXPECT_EQ(sameQ(0, with_nan, with_nan), 1);
    EXPECT_EQ(sameQ(1, with_nan, with_nan), 0);
}

} // namespace
