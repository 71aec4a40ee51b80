// The operations on vectors of 64 bytes, with AVX-512.
//
// `talnumericarray_instruction_sets.h` includes this in the set's namespace, compiled for the set's
// target.

template <std::size_t bytes>
struct operations : for_avx2::operations<bytes> {};

template <>
struct operations<32> : for_avx2::operations<32> {
    template <typename T, typename From>
    static constexpr bool can_load_converted = sizeof(From) == 8 && std::is_same_v<T, float>;

    template <typename T, std::size_t lanes, typename From>
    static __m256 load_converted(const From* const from) noexcept {
        const __m512i numbers = _mm512_loadu_si512(from);
        return std::is_signed_v<From> ? _mm512_cvtepi64_ps(numbers) : _mm512_cvtepu64_ps(numbers);
    }
};

template <>
struct operations<64> {
    using Bits = __m512i;

    template <std::size_t size, std::size_t lanes, typename From>
    static __m512i load_widened(const From* const from) noexcept {
        static_assert(size * lanes == 64);
        constexpr bool is_signed = std::is_signed_v<From>;
        if constexpr (sizeof(From) == size) {
            return _mm512_loadu_si512(from);
        } else if constexpr (2 * sizeof(From) == size) {
            const __m256i numbers = _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from));
            if constexpr (size == 2) {
                return is_signed ? _mm512_cvtepi8_epi16(numbers) : _mm512_cvtepu8_epi16(numbers);
            } else if constexpr (size == 4) {
                return is_signed ? _mm512_cvtepi16_epi32(numbers) : _mm512_cvtepu16_epi32(numbers);
            } else {
                return is_signed ? _mm512_cvtepi32_epi64(numbers) : _mm512_cvtepu32_epi64(numbers);
            }
        } else {
            const __m128i numbers = operations<16>::load<lanes * sizeof(From)>(from);
            if constexpr (size == 4) {
                return is_signed ? _mm512_cvtepi8_epi32(numbers) : _mm512_cvtepu8_epi32(numbers);
            } else if constexpr (sizeof(From) == 1) {
                return is_signed ? _mm512_cvtepi8_epi64(numbers) : _mm512_cvtepu8_epi64(numbers);
            } else {
                return is_signed ? _mm512_cvtepi16_epi64(numbers) : _mm512_cvtepu16_epi64(numbers);
            }
        }
    }

    template <typename T>
    static __m512 int32_to_real(const __m512i numbers) noexcept {
        return _mm512_cvtepi32_ps(numbers);
    }

    template <typename T>
    static __m512d int32_to_real(const __m256i numbers) noexcept {
        return _mm512_cvtepi32_pd(numbers);
    }

    template <std::size_t lanes>
    static __m512d load_floats_as_doubles(const float* const from) noexcept {
        return _mm512_cvtps_pd(_mm256_loadu_ps(from));
    }

    template <typename T, typename From>
    static constexpr bool can_load_converted = sizeof(From) == 8
                                               || std::is_same_v<From, std::uint32_t>;

    template <typename T, std::size_t lanes, typename From>
    static auto load_converted(const From* const from) noexcept {
        constexpr bool is_signed = std::is_signed_v<From>;
        if constexpr (sizeof(From) == 4 && std::is_same_v<T, float>) {
            return _mm512_cvtepu32_ps(_mm512_loadu_si512(from));
        } else if constexpr (sizeof(From) == 4) {
            return _mm512_cvtepu32_pd(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(from)));
        } else if constexpr (std::is_same_v<T, double>) {
            const __m512i numbers = _mm512_loadu_si512(from);
            return is_signed ? _mm512_cvtepi64_pd(numbers) : _mm512_cvtepu64_pd(numbers);
        } else {
            const __m256 lower = operations<32>::load_converted<T, 8>(from);
            const __m256 upper = operations<32>::load_converted<T, 8>(from + 8);
            return _mm512_insertf32x8(_mm512_castps256_ps512(lower), upper, 1);
        }
    }

    template <typename T>
    static __m512i interleaved_with_zeros(const vector_of_bytes<T, 32> reals) noexcept {
        const auto half = reinterpret_cast<__m256i>(reals);
        if constexpr (std::is_same_v<T, float>) {
            return _mm512_cvtepu32_epi64(half);
        } else {
            const __m512i places = _mm512_set_epi64(3, 3, 2, 2, 1, 1, 0, 0);
            return _mm512_maskz_permutexvar_epi64(0x55, places, _mm512_castsi256_si512(half));
        }
    }

    static __m512 minus_product(const __m512 m, const float factor, const __m512 d) noexcept {
        return _mm512_fnmadd_ps(_mm512_set1_ps(factor), d, m);
    }

    static __m512d minus_product(const __m512d m, const double factor, const __m512d d) noexcept {
        return _mm512_fnmadd_pd(_mm512_set1_pd(factor), d, m);
    }

    static bool all_zeros(const __m512i bits) noexcept {
        return _mm512_test_epi64_mask(bits, bits) == 0;
    }

    // A comparison of reals takes a mask and keeps in it only the lanes for which it holds.
    static constexpr bool has_masks = true;

    static __mmask16 if_equal(const __mmask16 mask, const __m512 x, const __m512 y) noexcept {
        return _mm512_mask_cmp_ps_mask(mask, x, y, _CMP_EQ_OQ);
    }

    static __mmask8 if_equal(const __mmask8 mask, const __m512d x, const __m512d y) noexcept {
        return _mm512_mask_cmp_pd_mask(mask, x, y, _CMP_EQ_OQ);
    }

    static __mmask16 if_at_least(const __mmask16 mask, const __m512 x, const __m512 y) noexcept {
        return _mm512_mask_cmp_ps_mask(mask, x, y, _CMP_GE_OQ);
    }

    static __mmask8 if_at_least(const __mmask8 mask, const __m512d x, const __m512d y) noexcept {
        return _mm512_mask_cmp_pd_mask(mask, x, y, _CMP_GE_OQ);
    }
};
