// The rule of both predicates, written a second time and as naively as possible: every element is
// decoded at run time into a plain number, and nothing is shared with the module under test.

#ifndef TALNUMERICARRAY_TESTS_ORACLE_H
#define TALNUMERICARRAY_TESTS_ORACLE_H

#include <cstddef>
#include <cstdint>
#include <vector>

namespace oracle {

// The one tolerance whose factor is held, and that factor. Singles are exact in a double.
struct FactorCache {
    double last_tolerance;
    double factor;
};

// What a thread remembers from call to call; a new State is that of a new thread.
struct State {
    FactorCache of_singles{24, 1};
    FactorCache of_doubles{53, 1};
};

// The rank is the number of dimensions. The data may have any alignment.
struct Array {
    int type_id;
    std::vector<std::int32_t> dimensions;
    std::int32_t element_count;
    const void* data;
};

bool same(State& state, double tolerance, bool compare_different_types, const Array& first,
          const Array& second);

bool equivalent(const Array& first, const Array& second);

// Three-way results: -1, 0 (the same) or +1.
int compare_doubles(State& state, double tolerance, double x, double y);
int compare_singles(State& state, float tolerance, float x, float y);

// 2^(tolerance - 53) and 2^(tolerance - 24), for a finite tolerance or a NaN.
double double_factor(double tolerance);
float single_factor(float tolerance);

// Bytes of one element of a type id in 1..12.
std::size_t element_size(int type_id);

} // namespace oracle

#endif
