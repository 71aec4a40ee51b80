#include "talnumericarray_compare.h"

#include "talnumericarray_sameq_impl.h"
#include "taltensor.h"

int TalNumericArray_sameQ(const talreal tol, const int compare_different_types, TalNumericArray na1,
                          TalNumericArray na2) noexcept {
    const talint rank = na1->rank;
    if (rank != na2->rank || EquivalentDimensions(rank, na1->dims, na2->dims) == 0) {
        return 0;
    }
    // Tested before the types: empty arrays of one shape are the same whatever their types.
    const talint len = na1->nelems;
    if (len == 0) {
        return 1;
    }
    const type_t type1 = na1->data_type;
    const type_t type2 = na2->data_type;
    if (compare_different_types == 0 && type1 != type2) {
        return 0;
    }
    return TalNumericArray_sameQ_impl(tol, na1, na2);
}

int TalNumericArray_equivalentQ(TalNumericArray na1, TalNumericArray na2) noexcept {
    const talint rank = na1->rank;
    if (rank != na2->rank || na1->data_type != na2->data_type) {
        return 0;
    }
    return EquivalentDimensions(rank, na1->dims, na2->dims);
}
