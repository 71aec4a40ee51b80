// The element tests: whether an element of one array and one of the other are the same.
//
// The two parts of a complex number are compared separately, each under the full tolerance. An
// integer or a real counts as a complex number whose imaginary part is zero.

#ifndef TALNUMERICARRAY_SAMEQ_ELEMENTS_H
#define TALNUMERICARRAY_SAMEQ_ELEMENTS_H

#include "compare.h"
#include "to_type.h"
#include "type_properties.h"

#include <complex>
#include <type_traits>

#pragma GCC visibility push(hidden)
NESK_STRICT_SINGLES_BEGIN

namespace talnumericarray {

// The parts of a complex number, by reference, so that only a part that is tested is read. Members
// of std::complex would not be inlined on 32-bit ARM: they are compiled for other features.
template <typename T>
inline const T& real_part(const std::complex<T>& number) noexcept {
    return reinterpret_cast<const T(&)[2]>(number)[0];
}

template <typename T>
inline const T& imaginary_part(const std::complex<T>& number) noexcept {
    return reinterpret_cast<const T(&)[2]>(number)[1];
}

} // namespace talnumericarray

// Integer or real against integer or real.
template <typename T1, typename T2,
          std::enable_if_t<!is_complex_v<T1> && !is_complex_v<T2>, int> = 0>
NESK_FORCE_INLINE bool sameQ_test(const talreal& tol, const T1& data1, const T2& data2) noexcept {
    return nesk::compare(tol, data1, data2) == 0;
}

// Integer or real against complex. No tolerance makes a nonzero value the same as zero, so the
// imaginary part is simply tested for zero.
template <typename T1, typename T2,
          std::enable_if_t<!is_complex_v<T1> && is_complex_v<T2>, int> = 0>
NESK_FORCE_INLINE bool sameQ_test(const talreal& tol, const T1& data1, const T2& data2) noexcept {
    const T1& rdata1 = data1;
    const to_real_type_t<T2>& rdata2 = talnumericarray::real_part(data2);
    const to_real_type_t<T2>& idata2 = talnumericarray::imaginary_part(data2);
    return sameQ_test(tol, rdata1, rdata2) && idata2 == 0;
}

// Complex against integer or real.
template <typename T1, typename T2,
          std::enable_if_t<is_complex_v<T1> && !is_complex_v<T2>, int> = 0>
NESK_FORCE_INLINE bool sameQ_test(const talreal& tol, const T1& data1, const T2& data2) noexcept {
    const to_real_type_t<T1>& rdata1 = talnumericarray::real_part(data1);
    const to_real_type_t<T1>& idata1 = talnumericarray::imaginary_part(data1);
    const T2& rdata2 = data2;
    return sameQ_test(tol, rdata1, rdata2) && idata1 == 0;
}

// Complex against complex.
template <typename T1, typename T2, std::enable_if_t<is_complex_v<T1> && is_complex_v<T2>, int> = 0>
NESK_FORCE_INLINE bool sameQ_test(const talreal& tol, const T1& data1, const T2& data2) noexcept {
    const to_real_type_t<T1>& rdata1 = talnumericarray::real_part(data1);
    const to_real_type_t<T1>& idata1 = talnumericarray::imaginary_part(data1);
    const to_real_type_t<T2>& rdata2 = talnumericarray::real_part(data2);
    const to_real_type_t<T2>& idata2 = talnumericarray::imaginary_part(data2);
    return sameQ_test(tol, rdata1, rdata2) && sameQ_test(tol, idata1, idata2);
}

NESK_STRICT_SINGLES_END
#pragma GCC visibility pop

#endif
