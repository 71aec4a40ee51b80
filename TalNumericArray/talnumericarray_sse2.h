// The operations on vectors of 16 bytes, with SSE2.
//
// `talnumericarray_instruction_sets.h` includes this in the set's namespace, compiled for the set's
// target.

template <std::size_t bytes>
struct operations;

template <>
struct operations<16> {
    using Bits = __m128i;

    // The first `bytes` of a vector; the rest is zero.
    template <std::size_t bytes>
    static __m128i load(const void* const from) noexcept {
        if constexpr (bytes == 16) {
            return _mm_loadu_si128(static_cast<const __m128i*>(from));
        } else {
            unsigned_of_size<bytes> number;
            std::memcpy(&number, from, bytes);
            const vector<std::uint64_t, 2> numbers = {number, 0};
            return reinterpret_cast<__m128i>(numbers);
        }
    }

    // `lanes` numbers; integers are widened to `size` bytes with their signs.
    template <std::size_t size, std::size_t lanes, typename From>
    static __m128i load_widened(const From* const from) noexcept {
        return widened<operations, size, From>(load<lanes * sizeof(From)>(from));
    }

    // All 32-bit integers as floats, or the first two as doubles.
    template <typename T>
    static auto int32_to_real(const __m128i numbers) noexcept {
        if constexpr (std::is_same_v<T, float>) {
            return _mm_cvtepi32_ps(numbers);
        } else {
            return _mm_cvtepi32_pd(numbers);
        }
    }

    template <std::size_t lanes>
    static __m128d load_floats_as_doubles(const float* const from) noexcept {
        return _mm_cvtps_pd(_mm_castsi128_ps(load<lanes * sizeof(float)>(from)));
    }

    // Whether a single instruction converts integers of type `From`.
    template <typename T, typename From>
    static constexpr bool can_load_converted = false;

    // The first half of a vector of reals, with a zero after each.
    template <typename T>
    static __m128i interleaved_with_zeros(const vector_of_bytes<T, 16> reals) noexcept {
        const auto bits = reinterpret_cast<__m128i>(reals);
        return std::is_same_v<T, float> ? twice_as_wide<std::uint32_t>(bits)
                                        : _mm_unpacklo_epi64(bits, _mm_setzero_si128());
    }

    // m - factor * d.
    template <typename T>
    static vector_of_bytes<T, 16> minus_product(const vector_of_bytes<T, 16> m, const T factor,
                                                const vector_of_bytes<T, 16> d) noexcept {
        return m - factor * d;
    }

    static constexpr bool has_masks = false;

    static bool all_zeros(const __m128i bits) noexcept {
        return all_ones(_mm_cmpeq_epi8(bits, _mm_setzero_si128()));
    }

    static bool all_ones(const __m128i bits) noexcept { return _mm_movemask_epi8(bits) == 0xffff; }

    // The first half of the integers of type `From` in a vector, widened to twice their size.
    template <typename From>
    static __m128i twice_as_wide(const __m128i numbers) noexcept {
        if constexpr (sizeof(From) == 1) {
            return std::is_signed_v<From> ? _mm_srai_epi16(_mm_unpacklo_epi8(numbers, numbers), 8)
                                          : _mm_unpacklo_epi8(numbers, _mm_setzero_si128());
        } else if constexpr (sizeof(From) == 2) {
            return std::is_signed_v<From> ? _mm_srai_epi32(_mm_unpacklo_epi16(numbers, numbers), 16)
                                          : _mm_unpacklo_epi16(numbers, _mm_setzero_si128());
        } else {
            return _mm_unpacklo_epi32(numbers, std::is_signed_v<From> ? _mm_srai_epi32(numbers, 31)
                                                                      : _mm_setzero_si128());
        }
    }
};
