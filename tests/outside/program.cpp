// The program of another project: it calls both predicates, and includes a template of the headers.

#include "compare.h"
#include "talnumericarray.h"
#include "talnumericarray_compare.h"

#include <cstdio>

// A runtime's own table of element sizes, which takes the place of the library's.
extern const std::size_t TalNumericArray_typeSizeTable[13] = {0, 1, 1, 2, 2, 4, 4,
                                                              8, 8, 4, 8, 8, 16};

namespace {

bool predicates_answer() {
    talint dimensions[] = {3};

    BIT32 integers[] = {1, 2, 3};
    st_TalDataArray counted = {};
    counted.rank = 1;
    counted.dims = dimensions;
    counted.data_type = BIT32_TYPE;
    counted.nelems = 3;
    counted.data = integers;

    double reals[] = {1.0, 2.0, 3.0000000001};
    st_TalDataArray measured = counted;
    measured.data_type = REAL64_TYPE;
    measured.data = reals;

    return TalNumericArray_sameQ(0, 1, &counted, &measured) == 0
           && TalNumericArray_sameQ(20, 1, &counted, &measured) == 1
           && TalNumericArray_sameQ(20, 0, &counted, &measured) == 0
           && TalNumericArray_equivalentQ(&counted, &measured) == 0
           && TalNumericArray_equivalentQ(&counted, &counted) == 1;
}

bool template_answers() {
    const BIT8 below = -1;
    const UBIT64 above = 255;
    return nesk::compare(0.0, below, above) == -1 && nesk::compare(0.0, 2.5, 2.0F) == 1
           && nesk::compare(20.0, 3, 3.0000000001) == 0
           && nesk::compare(20.0, 3.0000000001, 3.0) == 0;
}

} // namespace

int main() {
    const bool right = predicates_answer() && template_answers();
    std::puts(right ? "every answer is right" : "an answer is wrong");
    return right ? 0 : 1;
}
