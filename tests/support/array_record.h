// Array records that point to dimensions and elements kept elsewhere, for tests, benchmarks and
// fuzzers.

#pragma once

#include "taldata_array.h"

#include <cstddef>
#include <vector>

// A record of rank 1 with `length` elements.
inline st_TalDataArray record_of(const type_t type, void* const data, talint& length) {
    st_TalDataArray record = {};
    record.dims = &length;
    record.rank = 1;
    record.data_type = type;
    record.nelems = length;
    record.data = data;
    return record;
}

// A record of any rank.
inline st_TalDataArray record_of(const type_t type, void* const data,
                                 std::vector<talint>& dimensions, const talint count) {
    talint length = count;
    st_TalDataArray record = record_of(type, data, length);
    record.dims = dimensions.data();
    record.rank = static_cast<talint>(dimensions.size());
    return record;
}

// A record of rank 1, and its length.
class ArrayRecord {
  public:
    ArrayRecord(const type_t type, void* const data, const std::size_t length)
        : length_(static_cast<talint>(length)), record_(record_of(type, data, length_)) {}
    ArrayRecord(const ArrayRecord&) = delete;
    ArrayRecord& operator=(const ArrayRecord&) = delete;
    ~ArrayRecord() = default;

    TalNumericArray handle() const { return const_cast<TalNumericArray>(&record_); }

  private:
    talint length_;
    st_TalDataArray record_;
};
