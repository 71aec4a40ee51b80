// A runtime that builds the module in and brings its own table of element sizes.

#include "talnumericarray.h"
#include "talnumericarray_compare.h"

#include <gtest/gtest.h>

// A value that the library's own table does not have.
constexpr std::size_t own_mark = 99;
extern const std::size_t TalNumericArray_typeSizeTable[13] = {own_mark, 1, 1, 2, 2, 4, 4,
                                                              8,        8, 4, 8, 8, 16};

namespace {

TEST(Embedding, PredicatesAnswer) {
    talint dimensions[] = {2};
    double reals[] = {1.0, 2.5};
    BIT8 integers[] = {1, 2};
    st_TalDataArray array1 = {};
    array1.dims = dimensions;
    array1.rank = 1;
    array1.data_type = REAL64_TYPE;
    array1.nelems = 2;
    array1.data = reals;
    st_TalDataArray array2 = array1;
    array2.data_type = BIT8_TYPE;
    array2.data = integers;
    EXPECT_EQ(TalNumericArray_sameQ(10.5, 1, &array1, &array2), 0);
    reals[1] = 2.0;
    EXPECT_EQ(TalNumericArray_sameQ(10.5, 1, &array1, &array2), 1);
    EXPECT_EQ(TalNumericArray_equivalentQ(&array1, &array2), 0);
    EXPECT_EQ(TalNumericArray_equivalentQ(&array1, &array1), 1);
}

TEST(Embedding, TheRuntimesTableWins) {
    EXPECT_EQ(TalNumericArray_typeSizeTable[0], own_mark);
}

} // namespace
