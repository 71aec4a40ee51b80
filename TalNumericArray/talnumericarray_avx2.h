// The operations on vectors of 32 bytes, with AVX2 and FMA, and what AVX2 adds for shorter ones.
//
// `talnumericarray_instruction_sets.h` includes this in the set's namespace, compiled for the set's
// target.

template <std::size_t bytes>
struct operations;

template <>
struct operations<16> : for_baseline::operations<16> {
    template <std::size_t size, std::size_t lanes, typename From>
    static __m128i load_widened(const From* const from) noexcept {
        using SSE2 = for_baseline::operations<16>;
        constexpr bool is_signed = std::is_signed_v<From>;
        if constexpr (size == 4 && sizeof(From) == 1) {
            const __m128i numbers = load<lanes * sizeof(From)>(from);
            return is_signed ? _mm_cvtepi8_epi32(numbers) : _mm_cvtepu8_epi32(numbers);
        } else if constexpr (size == 4 && sizeof(From) == 2) {
            const __m128i numbers = load<lanes * sizeof(From)>(from);
            return is_signed ? _mm_cvtepi16_epi32(numbers) : _mm_cvtepu16_epi32(numbers);
        } else {
            return SSE2::load_widened<size, lanes>(from);
        }
    }
};

template <>
struct operations<32> {
    using Bits = __m256i;

    template <std::size_t size, std::size_t lanes, typename From>
    static __m256i load_widened(const From* const from) noexcept {
        static_assert(size * lanes == 32);
        constexpr bool is_signed = std::is_signed_v<From>;
        if constexpr (sizeof(From) == size) {
            return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from));
        } else {
            const __m128i numbers = operations<16>::load<lanes * sizeof(From)>(from);
            if constexpr (sizeof(From) == 1 && size == 2) {
                return is_signed ? _mm256_cvtepi8_epi16(numbers) : _mm256_cvtepu8_epi16(numbers);
            } else if constexpr (sizeof(From) == 1 && size == 4) {
                return is_signed ? _mm256_cvtepi8_epi32(numbers) : _mm256_cvtepu8_epi32(numbers);
            } else if constexpr (sizeof(From) == 1) {
                return is_signed ? _mm256_cvtepi8_epi64(numbers) : _mm256_cvtepu8_epi64(numbers);
            } else if constexpr (sizeof(From) == 2 && size == 4) {
                return is_signed ? _mm256_cvtepi16_epi32(numbers) : _mm256_cvtepu16_epi32(numbers);
            } else if constexpr (sizeof(From) == 2) {
                return is_signed ? _mm256_cvtepi16_epi64(numbers) : _mm256_cvtepu16_epi64(numbers);
            } else {
                return is_signed ? _mm256_cvtepi32_epi64(numbers) : _mm256_cvtepu32_epi64(numbers);
            }
        }
    }

    template <typename T>
    static __m256 int32_to_real(const __m256i numbers) noexcept {
        return _mm256_cvtepi32_ps(numbers);
    }

    template <typename T>
    static __m256d int32_to_real(const __m128i numbers) noexcept {
        return _mm256_cvtepi32_pd(numbers);
    }

    template <std::size_t lanes>
    static __m256d load_floats_as_doubles(const float* const from) noexcept {
        return _mm256_cvtps_pd(_mm_loadu_ps(from));
    }

    template <typename T, typename From>
    static constexpr bool can_load_converted = false;

    template <typename T>
    static __m256i interleaved_with_zeros(const vector_of_bytes<T, 16> reals) noexcept {
        const auto half = reinterpret_cast<__m128i>(reals);
        if constexpr (std::is_same_v<T, float>) {
            return _mm256_cvtepu32_epi64(half);
        } else {
            const __m256i twice = _mm256_permute4x64_epi64(_mm256_castsi128_si256(half), 0x50);
            return _mm256_blend_epi32(twice, _mm256_setzero_si256(), 0xcc);
        }
    }

    static __m256 minus_product(const __m256 m, const float factor, const __m256 d) noexcept {
        return _mm256_fnmadd_ps(_mm256_set1_ps(factor), d, m);
    }

    static __m256d minus_product(const __m256d m, const double factor, const __m256d d) noexcept {
        return _mm256_fnmadd_pd(_mm256_set1_pd(factor), d, m);
    }

    static bool all_zeros(const __m256i bits) noexcept {
        return _mm256_testz_si256(bits, bits) != 0;
    }

    static constexpr bool has_masks = false;

    static bool all_ones(const __m256i bits) noexcept { return _mm256_movemask_epi8(bits) == -1; }
};
