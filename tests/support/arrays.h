// Arrays for tests: records that own their dimensions and elements, and short ways to compare them.

#pragma once

#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"

#include "array_record.h"
#include "element_types.h"
#include "tolerances.h"

#include <initializer_list>
#include <thread>
#include <utility>
#include <vector>

template <typename T>
class Array {
  public:
    // Rank 1.
    Array(std::initializer_list<T> elements)
        : Array({static_cast<talint>(elements.size())}, std::vector<T>(elements)) {}

    Array(std::vector<talint> dimensions, std::vector<T> elements)
        : dimensions_(std::move(dimensions)), elements_(std::move(elements)),
          record_(record_of(element_type_id<T>, elements_.data(), dimensions_,
                            static_cast<talint>(elements_.size()))) {}
    Array(const Array&) = delete;
    Array& operator=(const Array&) = delete;
    ~Array() = default;

    // For tests that need a malformed record.
    st_TalDataArray& record() { return record_; }

    TalNumericArray handle() const { return const_cast<TalNumericArray>(&record_); }

  private:
    std::vector<talint> dimensions_;
    std::vector<T> elements_;
    st_TalDataArray record_{};
};

// An array of rank 1, of a type chosen at run time.
class AnyArray {
  public:
    AnyArray(const ElementType& type, const std::vector<int>& values)
        : bytes_(values.size() * type.size), record_(type.id, bytes_.data(), values.size()) {
        for (std::size_t i = 0; i < values.size(); ++i) {
            type.store(bytes_.data() + i * type.size, values[i]);
        }
    }

    unsigned char* bytes() { return bytes_.data(); }
    TalNumericArray handle() const { return record_.handle(); }

  private:
    std::vector<unsigned char> bytes_;
    ArrayRecord record_;
};

// The answer for arrays that may be of different types.
template <typename T1, typename T2>
int sameQ(const talreal tol, const Array<T1>& array1, const Array<T2>& array2) {
    return TalNumericArray_sameQ(tol, 1, array1.handle(), array2.handle());
}

// The answer for arrays of one element each.
template <typename T1, typename T2>
int sameQ_of(const talreal tol, const T1 element1, const T2 element2) {
    return sameQ(tol, Array<T1>{element1}, Array<T2>{element2});
}

// The answer under every tolerance, or 99 if it is not always the same.
template <typename T1, typename T2>
int sameQ_under_all(const T1 element1, const T2 element2) {
    return under_every_tolerance(
        [&](const talreal tol) { return sameQ_of(tol, element1, element2); });
}

// Runs `check` in a new thread, which has compared nothing and so remembers what a program
// remembers at its start.
template <typename Check>
void in_new_thread(const Check& check) {
    std::thread(check).join();
}
