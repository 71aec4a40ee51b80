// A runtime that embeds the module in its shared object: it links the archive, calls both
// predicates and brings its own table of element sizes. None of these leaves it.

#include "small_runtime.h"
#include "talnumericarray.h"
#include "talnumericarray_compare.h"

// Entry 0 is for the runtime to choose: room for an element of any type. As the table is defined
// here, the linker leaves the archive's out.
extern const std::size_t TalNumericArray_typeSizeTable[13] = {16, 1, 1, 2, 2, 4, 4,
                                                              8,  8, 4, 8, 8, 16};

std::size_t small_runtime_bytes_to_store(const talreal tolerance, TalNumericArray stored,
                                         TalNumericArray arriving) noexcept {
    const int same_type_only = 0;
    if (TalNumericArray_equivalentQ(stored, arriving) != 0
        && TalNumericArray_sameQ(tolerance, same_type_only, stored, arriving) != 0) {
        return 0;
    }
    return static_cast<std::size_t>(arriving->nelems)
           * TalNumericArray_typeSizeTable[arriving->data_type];
}
