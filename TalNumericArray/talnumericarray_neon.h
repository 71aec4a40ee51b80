// The operations on vectors of 16 bytes, with NEON. Most are written with the compilers' vector
// extensions, each of which becomes one instruction.
//
// `talnumericarray_instruction_sets.h` includes this in the set's namespace, compiled for the set's
// target.

template <std::size_t bytes>
struct operations;

template <>
struct operations<16> {
    using Bits = vector<std::uint64_t, 2>;

    // The first `bytes` of a vector; the rest is zero.
    template <std::size_t bytes>
    static Bits load(const void* const from) noexcept {
        if constexpr (bytes == 16) {
            Bits all;
            std::memcpy(&all, from, bytes);
            return all;
        } else {
            unsigned_of_size<bytes> number;
            std::memcpy(&number, from, bytes);
            return Bits{number, 0};
        }
    }

    // `lanes` numbers; integers are widened to `size` bytes with their signs.
    template <std::size_t size, std::size_t lanes, typename From>
    static Bits load_widened(const From* const from) noexcept {
        return widened<operations, size, From>(load<lanes * sizeof(From)>(from));
    }

    // All 32-bit integers as floats, or the first two as doubles.
    template <typename T>
    static vector_of_bytes<T, 16> int32_to_real(const Bits numbers) noexcept {
        if constexpr (std::is_same_v<T, float>) {
            return __builtin_convertvector(reinterpret_cast<vector<std::int32_t, 4>>(numbers),
                                           vector<float, 4>);
        } else {
            const auto wide = twice_as_wide<std::int32_t>(numbers);
            return __builtin_convertvector(reinterpret_cast<vector<std::int64_t, 2>>(wide),
                                           vector<double, 2>);
        }
    }

    template <std::size_t lanes>
    static vector<double, 2> load_floats_as_doubles(const float* const from) noexcept {
        return __builtin_convertvector(first_half<float>(load<lanes * sizeof(float)>(from)),
                                       vector<double, 2>);
    }

    // Whether a single instruction converts integers of type `From`.
    template <typename T, typename From>
#if defined(__aarch64__)
    static constexpr bool can_load_converted = sizeof(From) == sizeof(T);
#else
    static constexpr bool can_load_converted = false;
#endif

    template <typename T, std::size_t lanes, typename From>
    static vector_of_bytes<T, 16> load_converted(const From* const from) noexcept {
        const auto numbers =
            reinterpret_cast<vector_of_bytes<From, 16>>(load<lanes * sizeof(From)>(from));
        return __builtin_convertvector(numbers, vector_of_bytes<T, 16>);
    }

    // The first half of a vector of reals, with a zero after each.
    template <typename T>
    static Bits interleaved_with_zeros(const vector_of_bytes<T, 16> reals) noexcept {
        const auto bits = reinterpret_cast<Bits>(reals);
        return std::is_same_v<T, float> ? twice_as_wide<std::uint32_t>(bits) : Bits{bits[0], 0};
    }

    // m - factor * d.
    template <typename T>
    static vector_of_bytes<T, 16> minus_product(const vector_of_bytes<T, 16> m, const T factor,
                                                const vector_of_bytes<T, 16> d) noexcept {
        return m - factor * d;
    }

    static constexpr bool has_masks = false;

    static bool all_zeros(const Bits bits) noexcept {
#if defined(__arm__)
        // GCC would move each half to the core separately.
        const auto words = reinterpret_cast<uint32x4_t>(bits);
        const uint32x2_t both = vorr_u32(vget_low_u32(words), vget_high_u32(words));
        return vget_lane_u64(vreinterpret_u64_u32(both), 0) == 0;
#else
        return (bits[0] | bits[1]) == 0;
#endif
    }

    static bool all_ones(const Bits bits) noexcept {
        return (bits[0] & bits[1]) == std::numeric_limits<std::uint64_t>::max();
    }

    // The first half of the integers of type `From` in a vector, widened to twice their size.
    template <typename From>
    static Bits twice_as_wide(const Bits numbers) noexcept {
        using Wide = vector<twice_as_wide_t<From>, 8 / sizeof(From)>;
        return reinterpret_cast<Bits>(__builtin_convertvector(first_half<From>(numbers), Wide));
    }

  private:
    template <typename T>
    struct half_of {
        using type [[gnu::vector_size(8)]] = T;
    };

    // The first half of a vector.
    template <typename T>
    static typename half_of<T>::type first_half(const Bits numbers) noexcept {
        return reinterpret_cast<typename half_of<T>::type>(numbers[0]);
    }
};

#if defined(__arm__)

// Doubts about reals, judged by their bits: there are none if the bits are equal and no number is a
// NaN or an infinity.
template <typename T>
class DoubtsAboutBits {
  public:
    using Values = vector_of_bytes<T, 16>;

    void add(equality /*bound*/, const Values& x, const Values& y) noexcept {
        bits_ |= reinterpret_cast<uint32x4_t>(x) ^ reinterpret_cast<uint32x4_t>(y);
        largest_ = vmaxq_u32(largest_, vshlq_n_u32(reinterpret_cast<uint32x4_t>(y), 1));
    }

    bool none() const noexcept {
        constexpr std::uint32_t infinity = std::is_same_v<T, double> ? 0xffe00000 : 0xff000000;
        constexpr std::uint32_t lower = std::is_same_v<T, double> ? 0xffffffff : infinity;
        constexpr uint32x4_t infinities = {lower, infinity, lower, infinity};
        return operations<16>::all_zeros(
            reinterpret_cast<operations<16>::Bits>(bits_ | vcgeq_u32(largest_, infinities)));
    }

  private:
    uint32x4_t bits_ = {};
    uint32x4_t largest_ = {}; // of the words, shifted left by one bit to drop the sign
};

#endif
