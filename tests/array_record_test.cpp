// The record, the element types and the equality of shapes.

#include "taldata_array.h"
#include "taldata_array_element_types.h"
#include "talnumericarray.h"
#include "taltensor.h"

#include "support/element_types.h"

#include <gtest/gtest.h>

#include <type_traits>

namespace {

TEST(EquivalentDimensions, RankZeroIsEqualWhateverThePointers) {
    const talint dimension = 1;
    EXPECT_EQ(EquivalentDimensions(0, nullptr, nullptr), 1);
    EXPECT_EQ(EquivalentDimensions(0, &dimension, nullptr), 1);
    EXPECT_EQ(EquivalentDimensions(0, nullptr, &dimension), 1);
}

TEST(EquivalentDimensions, ComparesValuesAndNotPointers) {
    const talint dims1[] = {2, 3};
    const talint dims2[] = {2, 3};
    EXPECT_EQ(EquivalentDimensions(2, dims1, dims2), 1);
}

TEST(EquivalentDimensions, SeesADifferenceInTheLastEntry) {
    const talint dims1[] = {2, 3, 7};
    const talint dims2[] = {2, 3, 9};
    EXPECT_EQ(EquivalentDimensions(3, dims1, dims2), 0);
}

TEST(EquivalentDimensions, LooksAtNothingBeyondTheRank) {
    const talint dims1[] = {2, 3, 7};
    const talint dims2[] = {2, 3, 9};
    EXPECT_EQ(EquivalentDimensions(2, dims1, dims2), 1);
}

TEST(EquivalentDimensions, SeesADifferenceInAnyByte) {
    for (talint bit = 0; bit < 31; ++bit) {
        const talint dims1[] = {0};
        const talint dims2[] = {talint{1} << bit};
        EXPECT_EQ(EquivalentDimensions(1, dims1, dims2), 0) << "bit " << bit;
    }
}

TEST(ElementTypes, TableHoldsTheSizeOfEachType) {
    for (const ElementType& type : element_types) {
        EXPECT_EQ(TalNumericArray_typeSizeTable[type.id], type.size) << type.id;
    }
}

TEST(ElementTypes, TableIsTheOneThatIsDocumented) {
    const std::size_t sizes[] = {1, 1, 2, 2, 4, 4, 8, 8, 4, 8, 8, 16};
    for (std::size_t id = 1; id <= 12; ++id) {
        EXPECT_EQ(TalNumericArray_typeSizeTable[id], sizes[id - 1]) << "id " << id;
    }
}

TEST(ElementTypes, ListMakes144Pairs) {
    int pairs = 0;
    for_each_pair([&](const ElementType& /*type1*/, const ElementType& /*type2*/) { ++pairs; });
    EXPECT_EQ(pairs, 144);
}

TEST(ElementTypes, IdsAreUnsigned) {
    EXPECT_TRUE((std::is_same_v<std::underlying_type_t<TalNumericArrayTypeId>, unsigned int>));
}

TEST(Record, TensorsAndNumericArraysAreTheSameRecord) {
    EXPECT_TRUE((std::is_same_v<TalTensor, TalNumericArray>));
    EXPECT_TRUE((std::is_same_v<TalNumericArray, st_TalDataArray*>));
}

} // namespace
