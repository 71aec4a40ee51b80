// Calls of the module that a program in another language repeats, to time them without that
// language.

#include "array_record.h"
#include "taldata_array_types.h"
#include "talnumericarray_compare.h"
#include "type_properties.h"

// Compares two vectors of `count` doubles `calls` times, and returns how often they were the same.
extern "C" [[gnu::visibility("default")]] int
compare_doubles(const talreal tolerance, void* first, void* second, talint count, const int calls) {
    st_TalDataArray record1 = record_of(REAL64_TYPE, first, count);
    st_TalDataArray record2 = record_of(REAL64_TYPE, second, count);
    int same = 0;
    for (int i = 0; i < calls; ++i) {
        same += TalNumericArray_sameQ(tolerance, 1, &record1, &record2);
    }
    return same;
}
