// The module's AVX-512 loops again, as a separate instruction set: plain code replaces the
// instructions, so that any processor with AVX2 can run them.
//
// The files of operations and loops are included in a namespace where functions written here bear
// the names of the intrinsics and are found before the compiler's. An intrinsic that is missing
// here is the compiler's own, which the compiler refuses under a target without AVX-512.

#pragma once

#pragma GCC visibility push(hidden)
namespace talnumericarray {
struct avx512_in_plain_code;
}
#pragma GCC visibility pop

// The program's only set.
#define TALNUMERICARRAY_INSTRUCTION_SETS avx512_in_plain_code
#include "talnumericarray_instruction_sets.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>

// Compilers define intrinsics that take a constant as macros, some of them only without
// optimisation.
#undef _mm512_insertf32x8
#undef _mm512_mask_cmp_pd_mask
#undef _mm512_mask_cmp_ps_mask

#pragma GCC visibility push(hidden)
#if defined(__clang__)
#    pragma clang attribute push(__attribute__((target("avx2,fma"))), apply_to = function)
#else
#    pragma GCC push_options
#    pragma GCC target("avx2,fma")
#endif

namespace talnumericarray {

// ---- Lane by lane

namespace plain {

template <typename T, typename Vector>
using lanes_in = std::array<T, sizeof(Vector) / sizeof(T)>;

template <typename T, typename Vector>
inline lanes_in<T, Vector> lanes_of(const Vector& vector) noexcept {
    lanes_in<T, Vector> lanes = {};
    std::memcpy(lanes.data(), &vector, sizeof(vector));
    return lanes;
}

template <typename Vector, typename T>
inline Vector vector_of(const lanes_in<T, Vector>& lanes) noexcept {
    Vector vector;
    std::memcpy(&vector, lanes.data(), sizeof(vector));
    return vector;
}

template <typename Vector>
inline Vector loaded(const void* const from) noexcept {
    Vector vector;
    std::memcpy(&vector, from, sizeof(vector));
    return vector;
}

template <typename Vector, typename T>
inline Vector filled_with(const T number) noexcept {
    lanes_in<T, Vector> lanes;
    lanes.fill(number);
    return vector_of<Vector, T>(lanes);
}

// The upper part, which the instruction leaves undefined, gets bits that no test accepts as right.
template <typename Vector, typename Half>
inline Vector with_anything_above(const Half& half) noexcept {
    auto vector = filled_with<Vector, unsigned char>(0xa5);
    std::memcpy(&vector, &half, sizeof(half));
    return vector;
}

template <typename Vector, typename T, typename Half>
inline Vector with_half(const Vector& vector, const Half& half, const int place) noexcept {
    auto lanes = lanes_of<T>(vector);
    const auto inserted = lanes_of<T>(half);
    const std::size_t first = place % 2 == 0 ? 0 : inserted.size();
    for (std::size_t k = 0; k < inserted.size(); ++k) {
        lanes[first + k] = inserted[k];
    }
    return vector_of<Vector, T>(lanes);
}

// Converts all numbers, or the first ones of 16 bytes; integers are widened.
template <typename To, typename From, typename Result, typename Vector>
inline Result converted(const Vector& vector) noexcept {
    const auto numbers = lanes_of<From>(vector);
    lanes_in<To, Result> results = {};
    static_assert(results.size() == numbers.size() || sizeof(Vector) == sizeof(__m128i));
    for (std::size_t k = 0; k < results.size(); ++k) {
        results[k] = static_cast<To>(numbers[k]);
    }
    return vector_of<Result, To>(results);
}

// Widens integers, which fill half a vector or only some of the 16 bytes of the shortest one.
template <typename To, typename From>
constexpr auto widened() noexcept {
    if constexpr (sizeof(To) == 2 * sizeof(From)) {
        return converted<To, From, __m512i, __m256i>;
    } else {
        return converted<To, From, __m512i, __m128i>;
    }
}

template <typename T, typename Mask, typename Vector>
inline Vector permuted(const Mask mask, const Vector& places, const Vector& vector) noexcept {
    const auto from = lanes_of<T>(places);
    const auto numbers = lanes_of<T>(vector);
    lanes_in<T, Vector> results = {};
    for (std::size_t k = 0; k < results.size(); ++k) {
        results[k] = (mask >> k & 1) != 0 ? numbers[from[k] % numbers.size()] : 0;
    }
    return vector_of<Vector, T>(results);
}

// c - a * b, rounded once.
template <typename T, typename Vector>
inline Vector product_subtracted(const Vector& a, const Vector& b, const Vector& c) noexcept {
    const auto factors1 = lanes_of<T>(a);
    const auto factors2 = lanes_of<T>(b);
    auto results = lanes_of<T>(c);
    for (std::size_t k = 0; k < results.size(); ++k) {
        results[k] = std::fma(-factors1[k], factors2[k], results[k]);
    }
    return vector_of<Vector, T>(results);
}

template <typename Mask, typename T, typename Vector>
inline Mask some_bits_in_both(const Vector& vector1, const Vector& vector2) noexcept {
    const auto x = lanes_of<T>(vector1);
    const auto y = lanes_of<T>(vector2);
    unsigned mask = 0;
    for (std::size_t k = 0; k < x.size(); ++k) {
        mask |= ((x[k] & y[k]) != 0 ? 1U : 0U) << k;
    }
    return static_cast<Mask>(mask);
}

template <typename T>
inline bool holds(const int predicate, const T x, const T y) noexcept {
    switch (predicate) {
    case _CMP_EQ_OQ:
        return x == y;
    case _CMP_GE_OQ:
        return x >= y;
    default:
        std::abort(); // to be written when the module asks for it
    }
}

template <typename T, typename Mask, typename Vector>
inline Mask compared(const Mask mask, const Vector& vector1, const Vector& vector2,
                     const int predicate) noexcept {
    const auto x = lanes_of<T>(vector1);
    const auto y = lanes_of<T>(vector2);
    unsigned result = 0;
    for (std::size_t k = 0; k < x.size(); ++k) {
        const bool asked = (mask >> k & 1) != 0;
        result |= (asked && holds(predicate, x[k], y[k]) ? 1U : 0U) << k;
    }
    return static_cast<Mask>(result);
}

} // namespace plain

namespace for_avx512_in_plain_code {

// ---- The intrinsics

inline constexpr auto _mm512_cvtepi8_epi16 = plain::widened<std::int16_t, std::int8_t>();
inline constexpr auto _mm512_cvtepi8_epi32 = plain::widened<std::int32_t, std::int8_t>();
inline constexpr auto _mm512_cvtepi8_epi64 = plain::widened<std::int64_t, std::int8_t>();
inline constexpr auto _mm512_cvtepi16_epi32 = plain::widened<std::int32_t, std::int16_t>();
inline constexpr auto _mm512_cvtepi16_epi64 = plain::widened<std::int64_t, std::int16_t>();
inline constexpr auto _mm512_cvtepi32_epi64 = plain::widened<std::int64_t, std::int32_t>();
inline constexpr auto _mm512_cvtepu8_epi16 = plain::widened<std::uint16_t, std::uint8_t>();
inline constexpr auto _mm512_cvtepu8_epi32 = plain::widened<std::uint32_t, std::uint8_t>();
inline constexpr auto _mm512_cvtepu8_epi64 = plain::widened<std::uint64_t, std::uint8_t>();
inline constexpr auto _mm512_cvtepu16_epi32 = plain::widened<std::uint32_t, std::uint16_t>();
inline constexpr auto _mm512_cvtepu16_epi64 = plain::widened<std::uint64_t, std::uint16_t>();
inline constexpr auto _mm512_cvtepu32_epi64 = plain::widened<std::uint64_t, std::uint32_t>();

inline constexpr auto _mm512_cvtepi32_ps = plain::converted<float, std::int32_t, __m512, __m512i>;
inline constexpr auto _mm512_cvtepu32_ps = plain::converted<float, std::uint32_t, __m512, __m512i>;
inline constexpr auto _mm512_cvtepi64_ps = plain::converted<float, std::int64_t, __m256, __m512i>;
inline constexpr auto _mm512_cvtepu64_ps = plain::converted<float, std::uint64_t, __m256, __m512i>;
inline constexpr auto _mm512_cvtepi32_pd = plain::converted<double, std::int32_t, __m512d, __m256i>;
inline constexpr auto _mm512_cvtepu32_pd =
    plain::converted<double, std::uint32_t, __m512d, __m256i>;
inline constexpr auto _mm512_cvtepi64_pd = plain::converted<double, std::int64_t, __m512d, __m512i>;
inline constexpr auto _mm512_cvtepu64_pd =
    plain::converted<double, std::uint64_t, __m512d, __m512i>;
inline constexpr auto _mm512_cvtps_pd = plain::converted<double, float, __m512d, __m256>;

inline constexpr auto _mm512_loadu_si512 = plain::loaded<__m512i>;
inline constexpr auto _mm512_set1_ps = plain::filled_with<__m512, float>;
inline constexpr auto _mm512_set1_pd = plain::filled_with<__m512d, double>;
inline constexpr auto _mm512_castsi256_si512 = plain::with_anything_above<__m512i, __m256i>;
inline constexpr auto _mm512_castps256_ps512 = plain::with_anything_above<__m512, __m256>;
inline constexpr auto _mm512_insertf32x8 = plain::with_half<__m512, float, __m256>;
inline constexpr auto _mm512_maskz_permutexvar_epi64 =
    plain::permuted<std::uint64_t, __mmask8, __m512i>;
inline constexpr auto _mm512_fnmadd_ps = plain::product_subtracted<float, __m512>;
inline constexpr auto _mm512_fnmadd_pd = plain::product_subtracted<double, __m512d>;
inline constexpr auto _mm512_test_epi64_mask =
    plain::some_bits_in_both<__mmask8, std::uint64_t, __m512i>;
inline constexpr auto _mm512_mask_cmp_ps_mask = plain::compared<float, __mmask16, __m512>;
inline constexpr auto _mm512_mask_cmp_pd_mask = plain::compared<double, __mmask8, __m512d>;

// The arguments go from the last lane to the first.
template <typename... Numbers>
inline __m512i _mm512_set_epi64(const Numbers... numbers) noexcept {
    std::array<std::int64_t, 8> lanes = {numbers...};
    static_assert(sizeof...(numbers) == lanes.size());
    std::reverse(lanes.begin(), lanes.end());
    return plain::vector_of<__m512i, std::int64_t>(lanes);
}

// ---- The loops

inline constexpr std::size_t vector_bytes = 64;
#include "talnumericarray_avx512.h"
#include "talnumericarray_sameq_vectors.h"

} // namespace for_avx512_in_plain_code

} // namespace talnumericarray

#if defined(__clang__)
#    pragma clang attribute pop
#else
#    pragma GCC pop_options
#endif

namespace talnumericarray {

struct avx512_in_plain_code : for_avx512_in_plain_code::loops {
    static constexpr const char* name = "AVX-512 in plain code";

    static bool supported() noexcept { return avx2::supported(); }
};

} // namespace talnumericarray

#pragma GCC visibility pop
