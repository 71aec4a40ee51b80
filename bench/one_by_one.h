// The module built once more, with the rule one by one and no vectors.

#ifndef TALNUMERICARRAY_BENCH_ONE_BY_ONE_H
#define TALNUMERICARRAY_BENCH_ONE_BY_ONE_H

#include "taldata_array.h"
#include "type_properties.h"

// See `TalNumericArray_sameQ`.
extern "C" int one_by_one_sameQ(talreal tol, int compare_different_types, TalNumericArray na1,
                                TalNumericArray na2) noexcept;

#endif
