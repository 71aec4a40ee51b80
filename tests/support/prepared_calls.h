// Calls of every kind, with arrays and answers prepared, for tests that watch what happens during
// the calls alone.

#pragma once

#include "arrays.h"
#include "element_types.h"
#include "oracle.h"

#include <cmath>
#include <cstddef>
#include <deque>
#include <vector>

struct PreparedCall {
    talreal tol;
    int any_type;
    TalNumericArray array1, array2;
    int same;
    int equivalent;
};

inline int wrong_answers_to(const PreparedCall& call) noexcept {
    const int same = TalNumericArray_sameQ(call.tol, call.any_type, call.array1, call.array2);
    const int equivalent = TalNumericArray_equivalentQ(call.array1, call.array2);
    return (same == call.same ? 0 : 1) + (equivalent == call.equivalent ? 0 : 1);
}

// Calls for all pairs of element types, under tolerances that need no factor, a factor of either
// kind, one that depends on what is remembered, and none again. Arrays are short, or long enough to
// be compared in blocks; they hold equal pairs or near pairs, with or without an unlike pair in the
// middle. No answer depends on what the thread has compared before.
class PreparedCalls {
  public:
    PreparedCalls() {
        for_each_pair([this](const ElementType& type1, const ElementType& type2) {
            for (const std::size_t count : counts) {
                prepare_fillings(type1, type2, count);
            }
        });
    }

    // Makes the calls and does nothing else.
    int wrong_answers() const noexcept {
        int wrong = 0;
        for (const PreparedCall& call : calls_) {
            wrong += wrong_answers_to(call);
        }
        return wrong;
    }

    const std::vector<PreparedCall>& calls() const { return calls_; }

  private:
    static constexpr std::size_t counts[] = {1, 5, 300};
    static constexpr double tolerances[] = {0, -1, 10, 10.5, 23.5, 52.5, 53, NAN};

    void prepare_fillings(const ElementType& type1, const ElementType& type2,
                          const std::size_t count) {
        const Values equal = {3, 3};
        const bool integers = compared_digits(type1, type2) == 0;
        const Values near = integers ? Values{3, 4} : near_threes(type1, type2);
        const Values apart = {3, 0};
        const Values fillings[][2] = {
            {equal, equal}, {equal, near}, {equal, apart}, {near, near}, {near, apart}};
        for (const auto& [usual, in_the_middle] : fillings) {
            AnyArray& array1 = filled(type1, count, usual.value1, in_the_middle.value1);
            AnyArray& array2 = filled(type2, count, usual.value2, in_the_middle.value2);
            prepare_calls(array1.handle(), array2.handle());
        }
    }

    AnyArray& filled(const ElementType& type, const std::size_t count, const double usual,
                     const double in_the_middle) {
        AnyArray& array = arrays_.emplace_back(type, std::vector<int>(count));
        for (std::size_t i = 0; i < count; ++i) {
            type.store(array.bytes() + i * type.size, i == count / 2 ? in_the_middle : usual);
        }
        return array;
    }

    static oracle::Array seen_by_oracle(const st_TalDataArray& record) {
        return {
            record.data_type, {record.dims, record.dims + record.rank}, record.nelems, record.data};
    }

    void prepare_calls(TalNumericArray handle1, TalNumericArray handle2) {
        const oracle::Array array1 = seen_by_oracle(*handle1);
        const oracle::Array array2 = seen_by_oracle(*handle2);
        for (const double tol : tolerances) {
            for (const bool any_type : {true, false}) {
                oracle::State state;
                const bool same = oracle::same(state, tol, any_type, array1, array2);
                calls_.push_back({tol, any_type ? 1 : 0, handle1, handle2, same ? 1 : 0,
                                  oracle::equivalent(array1, array2) ? 1 : 0});
            }
        }
    }

    std::deque<AnyArray> arrays_; // a deque does not move them
    std::vector<PreparedCall> calls_;
};
