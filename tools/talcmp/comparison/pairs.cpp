#include "pairs.h"

#include "talnumericarray_compare.h"

#include <algorithm>
#include <limits>

namespace talcmp {
namespace {

st_TalDataArray record(const type_t type, const void* const elements, talint& count) {
    st_TalDataArray record = {};
    record.dims = &count;
    record.rank = 1;
    record.data_type = type;
    record.nelems = count;
    record.data = const_cast<void*>(elements); // the predicates only read
    return record;
}

template <typename Real>
void compare_neighbours(const talreal tolerance) {
    const Real one = 1;
    const Real next = one + std::numeric_limits<Real>::epsilon();
    const ElementType& type = element_type(element_type_id<Real>);
    Pairs(type, &one, type, &next, 1).same(tolerance, 0);
}

} // namespace

bool Pairs::same(const talreal tolerance, const std::size_t begin, const std::size_t count) const {
    constexpr int compare_different_types = 1;
    auto length = static_cast<talint>(count);
    st_TalDataArray record1 = record(type1_.id, element1(begin), length);
    st_TalDataArray record2 = record(type2_.id, element2(begin), length);
    return TalNumericArray_sameQ(tolerance, compare_different_types, &record1, &record2) != 0;
}

std::size_t Pairs::find_different(const talreal tolerance, std::size_t begin) const {
    // In growing steps, so that finding a pair takes about as long as reading up to it.
    std::size_t step = 1;
    while (begin < count_ && same(tolerance, begin, std::min(step, count_ - begin))) {
        begin += std::min(step, count_ - begin);
        step *= 2;
    }
    step = std::min(step, count_ - begin);
    while (step > 1) {
        const std::size_t half = step / 2;
        if (same(tolerance, begin, half)) {
            begin += half;
            step -= half;
        } else {
            step = half;
        }
    }
    return begin;
}

void remember_factor_of(const talreal tolerance) {
    // They differ too little for the comparison to answer without the factor.
    compare_neighbours<float>(tolerance);
    compare_neighbours<double>(tolerance);
}

} // namespace talcmp
