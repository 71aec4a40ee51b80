// Certainty by vectors: how many leading elements of two arrays are certainly the same.
//
// `talnumericarray_instruction_sets.h` includes this once for each instruction set, in a namespace
// and under the target of its own, so that a template of one set is no template of another. A set
// is known here by the bytes of its longest vector alone, TALNUMERICARRAY_VECTOR_BYTES. Shorter
// vectors serve the ends of arrays: every set has those of 16 bytes, of which the first 2, 4 or 8
// may be all that is in use; the other lanes are zeros on both sides, and as such the same.

inline constexpr std::size_t vector_bytes = TALNUMERICARRAY_VECTOR_BYTES;

// A vector for `lanes` of `T`.
template <typename T, std::size_t lanes>
struct vector_of {
    static constexpr std::size_t bytes = std::max<std::size_t>(16, lanes * sizeof(T));
    using type [[gnu::vector_size(bytes)]] = T;
};

template <typename T, std::size_t lanes>
using vector = typename vector_of<T, lanes>::type;

// The same bits as another vector of the size.
template <typename To, typename From>
inline To bits_as(const From& from) noexcept {
    static_assert(sizeof(To) == sizeof(From));
    return (To)from;
}

// ---- Loading

#if defined(__SSE2__)
using bits_16 = __m128i;
#else
using bits_16 = vector<std::uint64_t, 2>;
#endif

// The first `bytes` of a vector, zeros behind them.
template <std::size_t bytes>
inline bits_16 load_16(const void* const from) noexcept {
    if constexpr (bytes == 16) {
        bits_16 all;
        std::memcpy(&all, from, bytes);
        return all;
    } else {
        unsigned_of_size<bytes> number;
        std::memcpy(&number, from, bytes);
        const vector<std::uint64_t, 2> numbers = {number, 0};
        return bits_as<bits_16>(numbers);
    }
}

#if defined(__SSE2__)

// The first half of the `From` in a vector, widened to twice their size.
template <typename From>
inline bits_16 twice_as_wide(const bits_16& numbers) noexcept {
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

#else

// The first half of a vector.
template <typename T>
struct half_of {
    using type [[gnu::vector_size(8)]] = T;
};

template <typename T>
inline typename half_of<T>::type first_half(const bits_16& numbers) noexcept {
    return bits_as<typename half_of<T>::type>(numbers[0]);
}

template <typename From>
inline bits_16 twice_as_wide(const bits_16& numbers) noexcept {
    constexpr std::size_t lanes = 8 / sizeof(From);
    return bits_as<bits_16>(
        __builtin_convertvector(first_half<From>(numbers), vector<wider<From, 2>, lanes>));
}

#endif

template <std::size_t size, std::size_t lanes, typename From>
inline bits_16 widened_16(const From* const from) noexcept {
    bits_16 numbers = load_16<lanes * sizeof(From)>(from);
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
    if constexpr (size == 4 && sizeof(From) == 1) {
        return std::is_signed_v<From> ? _mm_cvtepi8_epi32(numbers) : _mm_cvtepu8_epi32(numbers);
    } else if constexpr (size == 4 && sizeof(From) == 2) {
        return std::is_signed_v<From> ? _mm_cvtepi16_epi32(numbers) : _mm_cvtepu16_epi32(numbers);
    }
#endif
    if constexpr (sizeof(From) < size) {
        numbers = twice_as_wide<From>(numbers);
    }
    if constexpr (2 * sizeof(From) < size) {
        numbers = twice_as_wide<wider<From, 2>>(numbers);
    }
    if constexpr (4 * sizeof(From) < size) {
        numbers = twice_as_wide<wider<From, 4>>(numbers);
    }
    return numbers;
}

#if TALNUMERICARRAY_VECTOR_BYTES >= 32

template <std::size_t size, typename From>
inline __m256i widened_32(const From* const from) noexcept {
    constexpr bool is_signed = std::is_signed_v<From>;
    if constexpr (sizeof(From) == size) {
        return _mm256_loadu_si256(reinterpret_cast<const __m256i*>(from));
    } else {
        const __m128i numbers = load_16<32 / size * sizeof(From)>(from);
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

#endif
#if TALNUMERICARRAY_VECTOR_BYTES >= 64

template <std::size_t size, typename From>
inline __m512i widened_64(const From* const from) noexcept {
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
        const __m128i numbers = load_16<64 / size * sizeof(From)>(from);
        if constexpr (size == 4) {
            return is_signed ? _mm512_cvtepi8_epi32(numbers) : _mm512_cvtepu8_epi32(numbers);
        } else if constexpr (sizeof(From) == 1) {
            return is_signed ? _mm512_cvtepi8_epi64(numbers) : _mm512_cvtepu8_epi64(numbers);
        } else {
            return is_signed ? _mm512_cvtepi16_epi64(numbers) : _mm512_cvtepu16_epi64(numbers);
        }
    }
}

#endif

// `lanes` integers, widened to the size of a `To` with their signs.
template <typename To, std::size_t lanes, typename From>
inline vector<To, lanes> widened(const From* const from) noexcept {
    [[maybe_unused]] constexpr std::size_t bytes = vector_of<To, lanes>::bytes;
#if TALNUMERICARRAY_VECTOR_BYTES >= 64
    if constexpr (bytes == 64) {
        return bits_as<vector<To, lanes>>(widened_64<sizeof(To)>(from));
    } else
#endif
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
        if constexpr (bytes == 32) {
        return bits_as<vector<To, lanes>>(widened_32<sizeof(To)>(from));
    } else
#endif
    {
        return bits_as<vector<To, lanes>>(widened_16<sizeof(To), lanes>(from));
    }
}

// 32-bit integers as singles or doubles; a vector of 16 bytes holds two of the latter.
template <typename To, std::size_t lanes>
inline vector<To, lanes> to_reals(const vector<std::int32_t, lanes>& numbers) noexcept {
    using Result = vector<To, lanes>;
    [[maybe_unused]] constexpr bool singles = std::is_same_v<To, float>;
    [[maybe_unused]] constexpr std::size_t bytes = vector_of<To, lanes>::bytes;
#if TALNUMERICARRAY_VECTOR_BYTES >= 64
    if constexpr (bytes == 64 && singles) {
        return bits_as<Result>(_mm512_cvtepi32_ps(bits_as<__m512i>(numbers)));
    } else if constexpr (bytes == 64) {
        return bits_as<Result>(_mm512_cvtepi32_pd(bits_as<__m256i>(numbers)));
    } else
#endif
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
        if constexpr (bytes == 32 && singles) {
        return bits_as<Result>(_mm256_cvtepi32_ps(bits_as<__m256i>(numbers)));
    } else if constexpr (bytes == 32) {
        return bits_as<Result>(_mm256_cvtepi32_pd(bits_as<__m128i>(numbers)));
    } else
#endif
#if defined(__SSE2__)
        if constexpr (singles) {
        return bits_as<Result>(_mm_cvtepi32_ps(bits_as<__m128i>(numbers)));
    } else {
        return bits_as<Result>(_mm_cvtepi32_pd(bits_as<__m128i>(numbers)));
    }
#else
    if constexpr (singles) {
        return __builtin_convertvector(numbers, Result);
    } else {
        const auto wide = twice_as_wide<std::int32_t>(bits_as<bits_16>(numbers));
        return __builtin_convertvector(bits_as<vector<std::int64_t, 2>>(wide), Result);
    }
#endif
}

template <std::size_t lanes>
inline vector<double, lanes> widened_singles(const float* const from) noexcept {
    using Result = vector<double, lanes>;
    [[maybe_unused]] constexpr std::size_t bytes = vector_of<double, lanes>::bytes;
#if TALNUMERICARRAY_VECTOR_BYTES >= 64
    if constexpr (bytes == 64) {
        return bits_as<Result>(_mm512_cvtps_pd(_mm256_loadu_ps(from)));
    } else
#endif
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
        if constexpr (bytes == 32) {
        return bits_as<Result>(_mm256_cvtps_pd(_mm_loadu_ps(from)));
    } else
#endif
    {
        const bits_16 singles = load_16<lanes * sizeof(float)>(from);
#if defined(__SSE2__)
        return bits_as<Result>(_mm_cvtps_pd(_mm_castsi128_ps(singles)));
#else
        return __builtin_convertvector(first_half<float>(singles), Result);
#endif
    }
}

// Reals with a zero behind each: as parts of complex numbers.
template <typename T, std::size_t lanes, typename Half>
inline vector<T, lanes> with_zeros_between(const Half& reals) noexcept {
    using Result = vector<T, lanes>;
    [[maybe_unused]] constexpr bool singles = std::is_same_v<T, float>;
    [[maybe_unused]] constexpr std::size_t bytes = vector_of<T, lanes>::bytes;
#if TALNUMERICARRAY_VECTOR_BYTES >= 64
    if constexpr (bytes == 64 && singles) {
        return bits_as<Result>(_mm512_cvtepu32_epi64(bits_as<__m256i>(reals)));
    } else if constexpr (bytes == 64) {
        const __m512i places = _mm512_set_epi64(3, 3, 2, 2, 1, 1, 0, 0);
        const __m512i wide = _mm512_castsi256_si512(bits_as<__m256i>(reals));
        return bits_as<Result>(_mm512_maskz_permutexvar_epi64(0x55, places, wide));
    } else
#endif
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
        if constexpr (bytes == 32 && singles) {
        return bits_as<Result>(_mm256_cvtepu32_epi64(bits_as<__m128i>(reals)));
    } else if constexpr (bytes == 32) {
        const __m256i wide = _mm256_castsi128_si256(bits_as<__m128i>(reals));
        const __m256i twice = _mm256_permute4x64_epi64(wide, 0x50);
        return bits_as<Result>(_mm256_blend_epi32(twice, _mm256_setzero_si256(), 0xcc));
    } else
#endif
        if constexpr (singles) {
        return bits_as<Result>(twice_as_wide<std::uint32_t>(bits_as<bits_16>(reals)));
    } else {
        return Result{reals[0], 0};
    }
}

// ---- Conversion to the type of comparison

// Where there is no instruction for it. Each of these rounds once, in its last addition, so that it
// gives what the conversion of one number does in any direction of rounding, but for the sign of a
// zero.

template <std::size_t lanes>
inline vector<double, lanes>
from_32_unsigned_bits(const vector<std::uint64_t, lanes>& numbers) noexcept {
    // In the lowest bits of 2^52.
    constexpr std::uint64_t base = 0x4330000000000000;
    return bits_as<vector<double, lanes>>(numbers | base) - 0x1p52;
}

template <std::size_t lanes>
inline vector<float, lanes>
from_32_unsigned_bits(const vector<std::uint32_t, lanes>& numbers) noexcept {
    using Integers = vector<std::int32_t, lanes>;
    const auto high = to_reals<float, lanes>(bits_as<Integers>(numbers >> 16));
    const auto low = to_reals<float, lanes>(bits_as<Integers>(numbers & 0xffffU));
    return high * 0x1p16F + low;
}

template <bool is_signed, std::size_t lanes>
inline vector<double, lanes> from_64_bits(const vector<std::uint64_t, lanes>& numbers) noexcept {
    // The upper half in the lowest bits of 2^84, by 2^31 too large if it has a sign; the lower one
    // in those of 2^52.
    constexpr std::uint64_t upper_base = 0x4530000000000000;
    constexpr std::uint64_t lower_base = 0x4330000000000000;
    constexpr std::uint64_t sign = is_signed ? 0x80000000 : 0;
    constexpr double both_bases = 0x1p84 + 0x1p52 + (is_signed ? 0x1p63 : 0);
    const auto upper = bits_as<vector<double, lanes>>((numbers >> 32) ^ (upper_base | sign));
    const auto lower = bits_as<vector<double, lanes>>((numbers & 0xffffffffU) | lower_base);
    return (upper - both_bases) + lower;
}

template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> one_by_one(const From* const from) noexcept {
    vector<T, lanes> result = {};
    for (std::size_t k = 0; k < lanes; ++k) {
        result[k] = static_cast<T>(from[k]);
    }
    return result;
}

// `lanes` numbers as those of type `T`.
template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> load(const From* const from) noexcept {
    if constexpr (std::is_integral_v<T> || std::is_same_v<T, From>) {
        return widened<T, lanes>(from);
    } else if constexpr (std::is_floating_point_v<From>) {
        return widened_singles<lanes>(from);
#if TALNUMERICARRAY_VECTOR_BYTES == 64
    } else if constexpr (vector_of<T, lanes>::bytes == 64 && sizeof(From) == 8
                         && std::is_same_v<T, double>) {
        const __m512i numbers = _mm512_loadu_si512(from);
        return bits_as<vector<T, lanes>>(std::is_signed_v<From> ? _mm512_cvtepi64_pd(numbers)
                                                                : _mm512_cvtepu64_pd(numbers));
    } else if constexpr (vector_of<T, lanes>::bytes == 64 && sizeof(From) == 8) {
        const __m512i lower = _mm512_loadu_si512(from);
        const __m512i upper = _mm512_loadu_si512(from + 8);
        const __m256 lower_reals =
            std::is_signed_v<From> ? _mm512_cvtepi64_ps(lower) : _mm512_cvtepu64_ps(lower);
        const __m256 upper_reals =
            std::is_signed_v<From> ? _mm512_cvtepi64_ps(upper) : _mm512_cvtepu64_ps(upper);
        return bits_as<vector<T, lanes>>(
            _mm512_insertf32x8(_mm512_castps256_ps512(lower_reals), upper_reals, 1));
    } else if constexpr (vector_of<T, lanes>::bytes == 64 && std::is_same_v<From, std::uint32_t>) {
        if constexpr (std::is_same_v<T, double>) {
            return bits_as<vector<T, lanes>>(
                _mm512_cvtepu32_pd(_mm256_loadu_si256(reinterpret_cast<const __m256i*>(from))));
        } else {
            return bits_as<vector<T, lanes>>(_mm512_cvtepu32_ps(_mm512_loadu_si512(from)));
        }
#endif
    } else if constexpr (sizeof(From) == 8 && std::is_same_v<T, float>) {
        return one_by_one<T, lanes>(from);
#if defined(__aarch64__)
    } else if constexpr (sizeof(From) == 8) {
        return __builtin_convertvector(load<From, lanes>(from), vector<T, lanes>);
#endif
    } else if constexpr (sizeof(From) == 8) {
        return from_64_bits<std::is_signed_v<From>, lanes>(widened<std::uint64_t, lanes>(from));
    } else if constexpr (std::is_same_v<From, std::uint32_t>) {
        using Bits = std::conditional_t<std::is_same_v<T, double>, std::uint64_t, std::uint32_t>;
        return from_32_unsigned_bits<lanes>(widened<Bits, lanes>(from));
    } else {
        return to_reals<T, lanes>(widened<std::int32_t, lanes>(from));
    }
}

// ---- Doubts about the lanes of vectors, gathered over several

template <typename Bits>
inline bool all_zero(const Bits& bits) noexcept {
#if TALNUMERICARRAY_VECTOR_BYTES >= 64
    if constexpr (sizeof(Bits) == 64) {
        const auto all = bits_as<__m512i>(bits);
        return _mm512_test_epi64_mask(all, all) == 0;
    } else
#endif
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
        if constexpr (sizeof(Bits) == 32) {
        const auto all = bits_as<__m256i>(bits);
        return _mm256_testz_si256(all, all) != 0;
    } else
#endif
    {
#if defined(__SSE2__)
        const __m128i zeros = _mm_cmpeq_epi8(bits_as<__m128i>(bits), _mm_setzero_si128());
        return _mm_movemask_epi8(zeros) == 0xffff;
#else
        const auto halves = bits_as<vector<std::uint64_t, 2>>(bits);
        return (halves[0] | halves[1]) == 0;
#endif
    }
}

// m - divisor * d, see `certain_divisor`.
template <typename T, std::size_t lanes>
inline vector<T, lanes> remainder(const T divisor, const vector<T, lanes>& d,
                                  const vector<T, lanes>& m) noexcept {
#if TALNUMERICARRAY_VECTOR_BYTES >= 32
    using Result = vector<T, lanes>;
    [[maybe_unused]] constexpr std::size_t bytes = vector_of<T, lanes>::bytes;
    [[maybe_unused]] constexpr bool singles = std::is_same_v<T, float>;
#    if TALNUMERICARRAY_VECTOR_BYTES >= 64
    if constexpr (bytes == 64 && singles) {
        return bits_as<Result>(
            _mm512_fnmadd_ps(_mm512_set1_ps(divisor), bits_as<__m512>(d), bits_as<__m512>(m)));
    } else if constexpr (bytes == 64) {
        return bits_as<Result>(
            _mm512_fnmadd_pd(_mm512_set1_pd(divisor), bits_as<__m512d>(d), bits_as<__m512d>(m)));
    } else
#    endif
        if constexpr (bytes == 32 && singles) {
        return bits_as<Result>(
            _mm256_fnmadd_ps(_mm256_set1_ps(divisor), bits_as<__m256>(d), bits_as<__m256>(m)));
    } else if constexpr (bytes == 32) {
        return bits_as<Result>(
            _mm256_fnmadd_pd(_mm256_set1_pd(divisor), bits_as<__m256d>(d), bits_as<__m256d>(m)));
    } else
#endif
    {
        return m - divisor * d;
    }
}

template <typename T, std::size_t lanes>
inline vector<T, lanes> magnitude(const vector<T, lanes>& reals) noexcept {
    using Bits = unsigned_of_size<sizeof(T)>;
    constexpr Bits all_but_sign = std::numeric_limits<Bits>::max() / 2;
    return bits_as<vector<T, lanes>>(bits_as<vector<Bits, lanes>>(reals) & all_but_sign);
}

template <typename T, std::size_t lanes>
class Doubts {
  public:
    using Values = vector<T, lanes>;

    // Two integers, widened: the bits that differ.
    template <typename T1, typename T2>
    void add_integers(const Values& x, const Values& y) noexcept {
        bits_ |= bits_as<Bits>(x) ^ bits_as<Bits>(y);
        // Equal bits are different numbers where a negative one meets an unsigned one as wide.
        if constexpr (
            std::is_signed_v<
                T1> != std::is_signed_v<T2> && sizeof(std::conditional_t<std::is_signed_v<T1>, T2, T1>) == sizeof(T)) {
            constexpr Lane sign = static_cast<Lane>(Lane{1} << (8 * sizeof(Lane) - 1));
            bits_ |= bits_as<Bits>(x) & sign;
        }
    }

#if defined(__arm__)
    // By their bits, and none of them a NaN or an infinity.
    void add(equality /*bound*/, const Values& x, const Values& y) noexcept {
        bits_ |= bits_as<Bits>(x) ^ bits_as<Bits>(y);
        largest_ = vmaxq_u32(largest_, vshlq_n_u32(bits_as<uint32x4_t>(y), 1));
    }
#else
    void add(equality /*bound*/, const Values& x, const Values& y) noexcept {
        bits_ |= ~bits_as<Bits>(x == y);
    }
#endif

    void add(const nearness<T> bound, const Values& x, const Values& y) noexcept {
        const Values d = magnitude<T, lanes>(x - y);
        const Values m = magnitude<T, lanes>(y);
        bits_ |= ~bits_as<Bits>(remainder<T, lanes>(bound.divisor, d, m) >= d);
    }

#if defined(__arm__)
    bool none() const noexcept {
        constexpr bool doubles = std::is_same_v<T, double>;
        constexpr uint32x4_t infinities =
            doubles ? uint32x4_t{0xffffffff, 0xffe00000, 0xffffffff, 0xffe00000}
                    : uint32x4_t{0xff000000, 0xff000000, 0xff000000, 0xff000000};
        return all_zero(bits_as<uint32x4_t>(bits_) | vcgeq_u32(largest_, infinities));
    }
#else
    bool none() const noexcept {
        return all_zero(bits_);
    }
#endif

  private:
    using Lane = unsigned_of_size<sizeof(T)>;
    using Bits = vector<Lane, lanes>;

    Bits bits_ = {};
#if defined(__arm__)
    uint32x4_t largest_ = {}; // twice their bits, whose upper word says whether all are finite
#endif
};

#if TALNUMERICARRAY_VECTOR_BYTES == 64

// A comparison's answer is a mask here.
template <>
class Doubts<float, 16> {
  public:
    using Values = vector<float, 16>;

    void add(equality /*bound*/, const Values& x, const Values& y) noexcept {
        certain_ =
            _mm512_mask_cmp_ps_mask(certain_, bits_as<__m512>(x), bits_as<__m512>(y), _CMP_EQ_OQ);
    }

    void add(const nearness<float> bound, const Values& x, const Values& y) noexcept {
        const Values d = magnitude<float, 16>(x - y);
        const Values m = magnitude<float, 16>(y);
        const Values left = remainder<float, 16>(bound.divisor, d, m);
        certain_ = _mm512_mask_cmp_ps_mask(certain_, bits_as<__m512>(left), bits_as<__m512>(d),
                                           _CMP_GE_OQ);
    }

    bool none() const noexcept { return certain_ == 0xffff; }

  private:
    __mmask16 certain_ = 0xffff;
};

template <>
class Doubts<double, 8> {
  public:
    using Values = vector<double, 8>;

    void add(equality /*bound*/, const Values& x, const Values& y) noexcept {
        certain_ =
            _mm512_mask_cmp_pd_mask(certain_, bits_as<__m512d>(x), bits_as<__m512d>(y), _CMP_EQ_OQ);
    }

    void add(const nearness<double> bound, const Values& x, const Values& y) noexcept {
        const Values d = magnitude<double, 8>(x - y);
        const Values m = magnitude<double, 8>(y);
        const Values left = remainder<double, 8>(bound.divisor, d, m);
        certain_ = _mm512_mask_cmp_pd_mask(certain_, bits_as<__m512d>(left), bits_as<__m512d>(d),
                                           _CMP_GE_OQ);
    }

    bool none() const noexcept { return certain_ == 0xff; }

  private:
    __mmask8 certain_ = 0xff;
};

#endif

// ---- The walk

// Lanes of the longest vector, and the elements of both arrays that it takes.
template <typename T1, typename T2>
inline constexpr std::size_t lanes_of = vector_bytes / sizeof(comparison_t<T1, T2>);

// One vector of each array's elements. A real stands for a complex number whose imaginary part is
// zero, and is laid out as one beside complex numbers.
template <std::size_t lanes, typename Gathered, typename Bound, typename T1, typename T2>
inline void add_doubts(Gathered& doubts, const Bound bound, const T1* const data1,
                       const T2* const data2) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (is_complex_v<T2>) {
        const auto* const parts = reinterpret_cast<const to_real_type_t<T2>*>(data2);
        doubts.add(bound, with_zeros_between<T, lanes>(load<T, lanes / 2>(data1)),
                   load<T, lanes>(parts));
    } else if constexpr (std::is_integral_v<T>) {
        doubts.template add_integers<T1, T2>(load<T, lanes>(data1), load<T, lanes>(data2));
    } else {
        doubts.add(bound, load<T, lanes>(data1), load<T, lanes>(data2));
    }
}

template <std::size_t lanes, std::size_t vectors, typename Bound, typename T1, typename T2>
inline bool certain_of(const Bound bound, const T1* const data1, const T2* const data2) noexcept {
    constexpr std::size_t elements = is_complex_v<T2> ? lanes / 2 : lanes;
    Doubts<comparison_t<T1, T2>, lanes> doubts;
    for (std::size_t k = 0; k < vectors; ++k) {
        add_doubts<lanes>(doubts, bound, data1 + k * elements, data2 + k * elements);
    }
    return doubts.none();
}

// The elements that a vector of the set takes of two arrays.
template <typename T1, typename T2>
inline constexpr std::size_t elements_of_vectors = vector_bytes / sizeof(comparison_t<T1, T2>)
                                                   / (is_complex_v<T2> ? 2 : 1);

// The number of leading elements of two arrays of `len` that are found to be certainly the same.
// `end` is the number of those before the first end of a page, and enough for a vector.
//
// Nothing is read in another page than that of the first element that has not been passed yet, so
// that no page is touched that a program could tell is behind the first pair that differs. The last
// vector in front of a page's end begins, if need be, among elements that have been passed already.
template <typename Bound, typename T1, typename T2>
[[gnu::noinline]] std::size_t leading_certainly_same(const Bound bound, const T1* const data1,
                                                     const T2* const data2, std::size_t end,
                                                     const std::size_t len) noexcept {
    constexpr std::size_t elements = elements_of_vectors<T1, T2>;
    constexpr std::size_t lanes = is_complex_v<T2> ? 2 * elements : elements;
    constexpr std::size_t vectors = 4;
    for (std::size_t passed = 0;;) {
        while (end - passed >= vectors * elements
               && certain_of<lanes, vectors>(bound, data1 + passed, data2 + passed)) {
            passed += vectors * elements;
        }
        while (passed < end) {
            const std::size_t begin = std::min(passed, end - elements);
            if (!certain_of<lanes, 1>(bound, data1 + begin, data2 + begin)) {
                return passed;
            }
            passed = begin + elements;
        }
        end += elements_before_page_end(data1 + passed, data2 + passed, len - passed);
        // Here are both ends; and a complex number may lie in two pages.
        if (end == passed) {
            return passed;
        }
    }
}

#if TALNUMERICARRAY_VECTOR_BYTES == 16

// The same of a few elements, by two vectors of `lanes` that overlap, or by shorter ones.
template <std::size_t lanes, typename Bound, typename T1, typename T2>
inline std::size_t leading_of_few(const Bound bound, const T1* const data1, const T2* const data2,
                                  const std::size_t len) noexcept {
    constexpr std::size_t elements = is_complex_v<T2> ? lanes / 2 : lanes;
    if constexpr (lanes < 2) {
        return 0;
    } else {
        if (len < elements) {
            return leading_of_few<lanes / 2>(bound, data1, data2, len);
        }
        const std::size_t count = std::min(len, 2 * elements);
        Doubts<comparison_t<T1, T2>, lanes> doubts;
        add_doubts<lanes>(doubts, bound, data1, data2);
        add_doubts<lanes>(doubts, bound, data1 + (count - elements), data2 + (count - elements));
        return doubts.none() ? count : 0;
    }
}

// The same for less elements than a vector takes.
template <typename Bound, typename T1, typename T2>
[[gnu::noinline]] std::size_t leading_certainly_same(const Bound bound, const T1* const data1,
                                                     const T2* const data2,
                                                     const std::size_t len) noexcept {
    return leading_of_few<vector_bytes / sizeof(comparison_t<T1, T2>) / 2>(bound, data1, data2,
                                                                           len);
}

#endif
