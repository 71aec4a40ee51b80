// A record of rank 1 over elements that are somewhere else.

#ifndef TALNUMERICARRAY_BENCH_ARRAY_RECORD_H
#define TALNUMERICARRAY_BENCH_ARRAY_RECORD_H

#include "taldata_array.h"
#include "type_properties.h"

#include <cstddef>

class ArrayRecord {
  public:
    ArrayRecord(const type_t type, void* const data, const std::size_t len)
        : length_(static_cast<talint>(len)) {
        record_.dims = &length_;
        record_.rank = 1;
        record_.data_type = type;
        record_.nelems = length_;
        record_.data = data;
    }
    ArrayRecord(const ArrayRecord&) = delete;
    ArrayRecord& operator=(const ArrayRecord&) = delete;
    ~ArrayRecord() = default;

    TalNumericArray handle() { return &record_; }

  private:
    talint length_;
    st_TalDataArray record_ = {};
};

#endif
