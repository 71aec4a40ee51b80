// Compares two arrays of different element types, with and without a tolerance.

#include "talnumericarray_compare.h"

#include <cstdio>

int main() {
    BIT32 integers[] = {1, 2, 3};
    double reals[] = {1.0, 2.0, 3.0000000001};
    talint dimensions[] = {3};

    st_TalDataArray counted = {};
    counted.rank = 1;
    counted.dims = dimensions;
    counted.nelems = 3;
    counted.data_type = BIT32_TYPE;
    counted.data = integers;

    st_TalDataArray measured = counted;
    measured.data_type = REAL64_TYPE;
    measured.data = reals;

    const int any_type = 1;
    std::printf("exactly the same: %d\n", TalNumericArray_sameQ(0, any_type, &counted, &measured));
    std::printf("the same with a tolerance of 20 binary digits: %d\n",
                TalNumericArray_sameQ(20, any_type, &counted, &measured));
    std::printf("same rank, type and shape: %d\n",
                TalNumericArray_equivalentQ(&counted, &measured));
}
