// Each operation on vectors that the library uses, by itself: applied to memory, so that what its
// translation gives can be held against the processor. `vectors.py` does this, and knows the types
// from the functions' parameters. Operations with immediates have those that the library uses.

#include <immintrin.h>

#include <cstdint>

#define OPERATION_1(name, A, Result, ...)                                                          \
    void apply##name(const A* const at_a, Result* const result) {                                  \
        const A a = *at_a;                                                                         \
        *result = __VA_ARGS__;                                                                     \
    }

#define OPERATION_2(name, A, B, Result, ...)                                                       \
    void apply##name(const A* const at_a, const B* const at_b, Result* const result) {             \
        const A a = *at_a;                                                                         \
        const B b = *at_b;                                                                         \
        *result = __VA_ARGS__;                                                                     \
    }

#define OPERATION_3(name, A, B, C, Result, ...)                                                    \
    void apply##name(const A* const at_a, const B* const at_b, const C* const at_c,                \
                     Result* const result) {                                                       \
        const A a = *at_a;                                                                         \
        const B b = *at_b;                                                                         \
        const C c = *at_c;                                                                         \
        *result = __VA_ARGS__;                                                                     \
    }

// What is written with operators, on vectors of so many bytes.
#define BUILTINS(bytes)                                                                            \
    using singles [[gnu::vector_size(bytes)]] = float;                                             \
    using doubles [[gnu::vector_size(bytes)]] = double;                                            \
    using integers32 [[gnu::vector_size(bytes)]] = std::uint32_t;                                  \
    using integers64 [[gnu::vector_size(bytes)]] = std::uint64_t;                                  \
    OPERATIONS_ON_REALS(singles, integers32, 0x7fffffff)                                           \
    OPERATIONS_ON_REALS(doubles, integers64, 0x7fffffffffffffff)                                   \
    OPERATIONS_ON_INTEGERS(integers32, 0x7fffffff, 16)                                             \
    OPERATIONS_ON_INTEGERS(integers64, 0x4330000000000000, 32)

#define OPERATIONS_ON_REALS(reals, integers, all_but_sign)                                         \
    OPERATION_2(_plus_##reals, reals, reals, reals, a + b)                                         \
    OPERATION_2(_minus_##reals, reals, reals, reals, a - b)                                        \
    OPERATION_2(_times_##reals, reals, reals, reals, (a)*b)                                        \
    OPERATION_2(_equal_##reals, reals, reals, integers, reinterpret_cast<integers>(a == b))        \
    OPERATION_2(_at_least_##reals, reals, reals, integers, reinterpret_cast<integers>(a >= b))     \
    OPERATION_1(_magnitude_##reals, reals, reals,                                                  \
                reinterpret_cast<reals>(reinterpret_cast<integers>(a) & (all_but_sign)))

#define OPERATIONS_ON_INTEGERS(integers, number, bits)                                             \
    OPERATION_2(_and_##integers, integers, integers, integers, (a)&b)                              \
    OPERATION_2(_or_##integers, integers, integers, integers, a | b)                               \
    OPERATION_2(_xor_##integers, integers, integers, integers, a ^ b)                              \
    OPERATION_1(_and_number_##integers, integers, integers, a&(number))                            \
    OPERATION_1(_or_number_##integers, integers, integers, a | (number))                           \
    OPERATION_1(_xor_number_##integers, integers, integers, a ^ (number))                          \
    OPERATION_1(_shifted_##integers, integers, integers, a >> (bits))

// ---- SSE2

namespace with_sse2 {

OPERATION_1(_mm_cvtepi32_pd, __m128i, __m128d, _mm_cvtepi32_pd(a))
OPERATION_1(_mm_cvtepi32_ps, __m128i, __m128, _mm_cvtepi32_ps(a))
OPERATION_1(_mm_cvtps_pd, __m128, __m128d, _mm_cvtps_pd(a))
OPERATION_1(_mm_castsi128_ps, __m128i, __m128, _mm_castsi128_ps(a))
OPERATION_2(_mm_cmpeq_epi8, __m128i, __m128i, __m128i, _mm_cmpeq_epi8(a, b))
OPERATION_1(_mm_movemask_epi8, __m128i, int, _mm_movemask_epi8(a))
OPERATION_2(_mm_movemask_epi8_of_both, __m128i, __m128i, int, _mm_movemask_epi8((a)&b))
OPERATION_2(_mm_unpacklo_epi8, __m128i, __m128i, __m128i, _mm_unpacklo_epi8(a, b))
OPERATION_2(_mm_unpacklo_epi16, __m128i, __m128i, __m128i, _mm_unpacklo_epi16(a, b))
OPERATION_2(_mm_unpacklo_epi32, __m128i, __m128i, __m128i, _mm_unpacklo_epi32(a, b))
OPERATION_2(_mm_unpacklo_epi64, __m128i, __m128i, __m128i, _mm_unpacklo_epi64(a, b))
OPERATION_1(_mm_srai_epi16_by_8, __m128i, __m128i, _mm_srai_epi16(a, 8))
OPERATION_1(_mm_srai_epi32_by_16, __m128i, __m128i, _mm_srai_epi32(a, 16))
OPERATION_1(_mm_srai_epi32_by_31, __m128i, __m128i, _mm_srai_epi32(a, 31))
OPERATION_1(_mm_setzero_si128, __m128i, __m128i, ((void)a, _mm_setzero_si128()))
OPERATION_1(_mm_loadu_si128, __m128i, __m128i, _mm_loadu_si128(&a))
BUILTINS(16)

} // namespace with_sse2

// ---- AVX2 and FMA

#if defined(__clang__)
#    pragma clang attribute push(__attribute__((target("avx2,fma"))), apply_to = function)
#else
#    pragma GCC push_options
#    pragma GCC target("avx2,fma")
#endif

namespace with_avx2 {

OPERATION_1(_mm256_cvtepi16_epi32, __m128i, __m256i, _mm256_cvtepi16_epi32(a))
OPERATION_1(_mm256_cvtepi16_epi64, __m128i, __m256i, _mm256_cvtepi16_epi64(a))
OPERATION_1(_mm256_cvtepi32_epi64, __m128i, __m256i, _mm256_cvtepi32_epi64(a))
OPERATION_1(_mm256_cvtepi32_pd, __m128i, __m256d, _mm256_cvtepi32_pd(a))
OPERATION_1(_mm256_cvtepi32_ps, __m256i, __m256, _mm256_cvtepi32_ps(a))
OPERATION_1(_mm256_cvtepi8_epi16, __m128i, __m256i, _mm256_cvtepi8_epi16(a))
OPERATION_1(_mm256_cvtepi8_epi32, __m128i, __m256i, _mm256_cvtepi8_epi32(a))
OPERATION_1(_mm256_cvtepi8_epi64, __m128i, __m256i, _mm256_cvtepi8_epi64(a))
OPERATION_1(_mm256_cvtepu16_epi32, __m128i, __m256i, _mm256_cvtepu16_epi32(a))
OPERATION_1(_mm256_cvtepu16_epi64, __m128i, __m256i, _mm256_cvtepu16_epi64(a))
OPERATION_1(_mm256_cvtepu32_epi64, __m128i, __m256i, _mm256_cvtepu32_epi64(a))
OPERATION_1(_mm256_cvtepu8_epi16, __m128i, __m256i, _mm256_cvtepu8_epi16(a))
OPERATION_1(_mm256_cvtepu8_epi32, __m128i, __m256i, _mm256_cvtepu8_epi32(a))
OPERATION_1(_mm256_cvtepu8_epi64, __m128i, __m256i, _mm256_cvtepu8_epi64(a))
OPERATION_1(_mm256_cvtps_pd, __m128, __m256d, _mm256_cvtps_pd(a))
OPERATION_1(_mm_cvtepi16_epi32, __m128i, __m128i, _mm_cvtepi16_epi32(a))
OPERATION_1(_mm_cvtepi8_epi32, __m128i, __m128i, _mm_cvtepi8_epi32(a))
OPERATION_1(_mm_cvtepu16_epi32, __m128i, __m128i, _mm_cvtepu16_epi32(a))
OPERATION_1(_mm_cvtepu8_epi32, __m128i, __m128i, _mm_cvtepu8_epi32(a))
OPERATION_1(_mm_loadu_ps, __m128, __m128, _mm_loadu_ps(reinterpret_cast<const float*>(&a)))
OPERATION_1(_mm256_loadu_si256, __m256i, __m256i, _mm256_loadu_si256(&a))
OPERATION_1(_mm256_setzero_si256, __m256i, __m256i, ((void)a, _mm256_setzero_si256()))
// What is above the half is not defined.
OPERATION_1(_mm256_castsi128_si256, __m128i, __m128i,
            _mm256_extracti128_si256(_mm256_castsi128_si256(a), 0))
OPERATION_1(_mm256_permute4x64_epi64_0x50, __m256i, __m256i, _mm256_permute4x64_epi64(a, 0x50))
OPERATION_2(_mm256_blend_epi32_0xcc, __m256i, __m256i, __m256i, _mm256_blend_epi32(a, b, 0xcc))
OPERATION_1(_mm256_set1_ps, float, __m256, _mm256_set1_ps(a))
OPERATION_1(_mm256_set1_pd, double, __m256d, _mm256_set1_pd(a))
OPERATION_3(_mm256_fnmadd_ps, __m256, __m256, __m256, __m256, _mm256_fnmadd_ps(a, b, c))
OPERATION_3(_mm256_fnmadd_pd, __m256d, __m256d, __m256d, __m256d, _mm256_fnmadd_pd(a, b, c))
OPERATION_2(_mm256_testz_si256, __m256i, __m256i, int, _mm256_testz_si256(a, b))
OPERATION_1(_mm256_movemask_epi8, __m256i, int, _mm256_movemask_epi8(a))
OPERATION_2(_mm256_movemask_epi8_of_both, __m256i, __m256i, int, _mm256_movemask_epi8((a)&b))
BUILTINS(32)

} // namespace with_avx2

#if defined(__clang__)
#    pragma clang attribute pop
#else
#    pragma GCC pop_options
#endif

// ---- AVX-512

#if defined(__clang__)
#    pragma clang attribute push(                                                                  \
        __attribute__((target("fma,avx512f,avx512bw,avx512dq,avx512vl"))), apply_to = function)
#else
#    pragma GCC push_options
#    pragma GCC target("fma,avx512f,avx512bw,avx512dq,avx512vl")
#endif

namespace with_avx512 {

OPERATION_1(_mm512_cvtepi16_epi32, __m256i, __m512i, _mm512_cvtepi16_epi32(a))
OPERATION_1(_mm512_cvtepi16_epi64, __m128i, __m512i, _mm512_cvtepi16_epi64(a))
OPERATION_1(_mm512_cvtepi32_epi64, __m256i, __m512i, _mm512_cvtepi32_epi64(a))
OPERATION_1(_mm512_cvtepi32_pd, __m256i, __m512d, _mm512_cvtepi32_pd(a))
OPERATION_1(_mm512_cvtepi32_ps, __m512i, __m512, _mm512_cvtepi32_ps(a))
OPERATION_1(_mm512_cvtepi64_pd, __m512i, __m512d, _mm512_cvtepi64_pd(a))
OPERATION_1(_mm512_cvtepi64_ps, __m512i, __m256, _mm512_cvtepi64_ps(a))
OPERATION_1(_mm512_cvtepi8_epi16, __m256i, __m512i, _mm512_cvtepi8_epi16(a))
OPERATION_1(_mm512_cvtepi8_epi32, __m128i, __m512i, _mm512_cvtepi8_epi32(a))
OPERATION_1(_mm512_cvtepi8_epi64, __m128i, __m512i, _mm512_cvtepi8_epi64(a))
OPERATION_1(_mm512_cvtepu16_epi32, __m256i, __m512i, _mm512_cvtepu16_epi32(a))
OPERATION_1(_mm512_cvtepu16_epi64, __m128i, __m512i, _mm512_cvtepu16_epi64(a))
OPERATION_1(_mm512_cvtepu32_epi64, __m256i, __m512i, _mm512_cvtepu32_epi64(a))
OPERATION_1(_mm512_cvtepu32_pd, __m256i, __m512d, _mm512_cvtepu32_pd(a))
OPERATION_1(_mm512_cvtepu32_ps, __m512i, __m512, _mm512_cvtepu32_ps(a))
OPERATION_1(_mm512_cvtepu64_pd, __m512i, __m512d, _mm512_cvtepu64_pd(a))
OPERATION_1(_mm512_cvtepu64_ps, __m512i, __m256, _mm512_cvtepu64_ps(a))
OPERATION_1(_mm512_cvtepu8_epi16, __m256i, __m512i, _mm512_cvtepu8_epi16(a))
OPERATION_1(_mm512_cvtepu8_epi32, __m128i, __m512i, _mm512_cvtepu8_epi32(a))
OPERATION_1(_mm512_cvtepu8_epi64, __m128i, __m512i, _mm512_cvtepu8_epi64(a))
OPERATION_1(_mm512_cvtps_pd, __m256, __m512d, _mm512_cvtps_pd(a))
OPERATION_1(_mm256_loadu_ps, __m256, __m256, _mm256_loadu_ps(reinterpret_cast<const float*>(&a)))
OPERATION_1(_mm512_loadu_si512, __m512i, __m512i, _mm512_loadu_si512(&a))
// What is above the half is not defined.
OPERATION_1(_mm512_castps256_ps512, __m256, __m256,
            _mm512_extractf32x8_ps(_mm512_castps256_ps512(a), 0))
OPERATION_1(_mm512_castsi256_si512, __m256i, __m256i,
            _mm512_extracti64x4_epi64(_mm512_castsi256_si512(a), 0))
OPERATION_2(_mm512_insertf32x8_1, __m512, __m256, __m512, _mm512_insertf32x8(a, b, 1))
OPERATION_1(_mm512_set_epi64_places, __m512i, __m512i,
            ((void)a, _mm512_set_epi64(3, 3, 2, 2, 1, 1, 0, 0)))
OPERATION_1(_mm512_maskz_permutexvar_epi64_0x55, __m512i, __m512i,
            _mm512_maskz_permutexvar_epi64(0x55, _mm512_set_epi64(3, 3, 2, 2, 1, 1, 0, 0), a))
OPERATION_1(_mm512_set1_ps, float, __m512, _mm512_set1_ps(a))
OPERATION_1(_mm512_set1_pd, double, __m512d, _mm512_set1_pd(a))
OPERATION_3(_mm512_fnmadd_ps, __m512, __m512, __m512, __m512, _mm512_fnmadd_ps(a, b, c))
OPERATION_3(_mm512_fnmadd_pd, __m512d, __m512d, __m512d, __m512d, _mm512_fnmadd_pd(a, b, c))
OPERATION_2(_mm512_test_epi64_mask, __m512i, __m512i, __mmask8, _mm512_test_epi64_mask(a, b))
OPERATION_3(_mm512_mask_cmp_ps_mask_eq, __mmask16, __m512, __m512, __mmask16,
            _mm512_mask_cmp_ps_mask(a, b, c, _CMP_EQ_OQ))
OPERATION_3(_mm512_mask_cmp_ps_mask_ge, __mmask16, __m512, __m512, __mmask16,
            _mm512_mask_cmp_ps_mask(a, b, c, _CMP_GE_OQ))
OPERATION_3(_mm512_mask_cmp_pd_mask_eq, __mmask8, __m512d, __m512d, __mmask8,
            _mm512_mask_cmp_pd_mask(a, b, c, _CMP_EQ_OQ))
OPERATION_3(_mm512_mask_cmp_pd_mask_ge, __mmask8, __m512d, __m512d, __mmask8,
            _mm512_mask_cmp_pd_mask(a, b, c, _CMP_GE_OQ))
BUILTINS(64)

} // namespace with_avx512

#if defined(__clang__)
#    pragma clang attribute pop
#else
#    pragma GCC pop_options
#endif
