// Calls of the module that a program in another language repeats, to time them without that
// language.

#include "taldata_array.h"
#include "talnumericarray_compare.h"
#include "type_properties.h"

// Compares two vectors of `count` doubles `calls` times, and returns how often they were the same.
extern "C" [[gnu::visibility("default")]] int
compare_doubles(const talreal tolerance, void* first, void* second, talint count, const int calls) {
    st_TalDataArray record1 = {};
    record1.dims = &count;
    record1.rank = 1;
    record1.data_type = REAL64_TYPE;
    record1.nelems = count;
    record1.data = first;
    st_TalDataArray record2 = record1;
    record2.data = second;
    int same = 0;
    for (int i = 0; i < calls; ++i) {
        same += TalNumericArray_sameQ(tolerance, 1, &record1, &record2);
    }
    return same;
}
