// The loops that find, with vectors, the certain prefix of two arrays: the leading elements that
// are certainly the same.
//
// Each instruction set includes this once, in its own namespace and for its own target, so the sets
// share no templates. Before that it defines `vector_bytes`, the length of its longest vectors, and
// `operations<bytes>` on those and on vectors of half that length. `talnumericarray_sse2.h`
// describes the operations. A set whose comparisons give masks has, instead of `all_ones`,
// `if_equal` and `if_at_least`, as in `talnumericarray_avx512.h`.

// The operations on a vector for `lanes` of `T`.
template <typename T, std::size_t lanes>
using operations_on = operations<vector_of<T, lanes>::bytes>;

// `lanes` numbers; integers are widened to the size of a `T` with their signs.
template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> load_widened(const From* const from) noexcept {
    return reinterpret_cast<vector<T, lanes>>(
        operations_on<T, lanes>::template load_widened<sizeof(T), lanes>(from));
}

// ---- Conversion to the type of comparison

template <typename T, std::size_t lanes>
inline vector<T, lanes> int32_to_real(const vector<std::int32_t, lanes>& numbers) noexcept {
    using Bits = typename operations_on<std::int32_t, lanes>::Bits;
    return reinterpret_cast<vector<T, lanes>>(
        operations_on<T, lanes>::template int32_to_real<T>(reinterpret_cast<Bits>(numbers)));
}

// For conversions that no instruction does. Each of these rounds once, in its last addition. So it
// gives the result of a scalar conversion in any direction of rounding, except for the sign of
// zero.

template <std::size_t lanes>
inline vector<double, lanes> uint32_to_real(const vector<std::uint64_t, lanes>& numbers) noexcept {
    // The number goes into the lowest bits of 2^52.
    constexpr std::uint64_t base = 0x4330000000000000;
    return reinterpret_cast<vector<double, lanes>>(numbers | base) - 0x1p52;
}

template <std::size_t lanes>
inline vector<float, lanes> uint32_to_real(const vector<std::uint32_t, lanes>& numbers) noexcept {
    using Integers = vector<std::int32_t, lanes>;
    const auto high = int32_to_real<float, lanes>(reinterpret_cast<Integers>(numbers >> 16));
    const auto low = int32_to_real<float, lanes>(reinterpret_cast<Integers>(numbers & 0xffffU));
    return high * 0x1p16F + low;
}

template <bool is_signed, std::size_t lanes>
inline vector<double, lanes> int64_to_double(const vector<std::uint64_t, lanes>& numbers) noexcept {
    // The upper half goes into the lowest bits of 2^84, too large by 2^31 if it is signed; the
    // lower half into those of 2^52.
    constexpr std::uint64_t upper_base = 0x4530000000000000;
    constexpr std::uint64_t lower_base = 0x4330000000000000;
    constexpr std::uint64_t sign = is_signed ? 0x80000000 : 0;
    constexpr double both_bases = 0x1p84 + 0x1p52 + (is_signed ? 0x1p63 : 0);
    const auto upper =
        reinterpret_cast<vector<double, lanes>>((numbers >> 32) ^ (upper_base | sign));
    const auto lower =
        reinterpret_cast<vector<double, lanes>>((numbers & 0xffffffffU) | lower_base);
    return (upper - both_bases) + lower;
}

template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> load_one_by_one(const From* const from) noexcept {
    vector<T, lanes> result = {};
    for (std::size_t k = 0; k < lanes; ++k) {
        result[k] = static_cast<T>(from[k]);
    }
    return result;
}

// `lanes` numbers, converted to `T`.
template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> load(const From* const from) noexcept {
    using Operations = operations_on<T, lanes>;
    if constexpr (std::is_integral_v<T> || std::is_same_v<T, From>) {
        return load_widened<T, lanes>(from);
    } else if constexpr (std::is_floating_point_v<From>) {
        return reinterpret_cast<vector<T, lanes>>(
            Operations::template load_floats_as_doubles<lanes>(from));
    } else if constexpr (Operations::template can_load_converted<T, From>) {
        return reinterpret_cast<vector<T, lanes>>(
            Operations::template load_converted<T, lanes>(from));
    } else if constexpr (sizeof(From) == 8 && std::is_same_v<T, float>) {
        return load_one_by_one<T, lanes>(from);
    } else if constexpr (sizeof(From) == 8) {
        return int64_to_double<std::is_signed_v<From>, lanes>(
            load_widened<std::uint64_t, lanes>(from));
    } else if constexpr (std::is_same_v<From, std::uint32_t>) {
        return uint32_to_real<lanes>(load_widened<unsigned_of_size<sizeof(T)>, lanes>(from));
    } else {
        return int32_to_real<T, lanes>(load_widened<std::int32_t, lanes>(from));
    }
}

// Reals as complex numbers: each is followed by a zero.
template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> load_as_complex(const From* const from) noexcept {
    return reinterpret_cast<vector<T, lanes>>(
        operations_on<T, lanes>::template interleaved_with_zeros<T>(load<T, lanes / 2>(from)));
}

// ---- Doubts: whether any lane of several vectors is not certainly the same

// Integers of types `T1` and `T2`, widened: the bits that differ.
template <typename T, std::size_t lanes, typename T1, typename T2>
class DoubtsAboutIntegers {
  public:
    void add(equality /*bound*/, const vector<T, lanes>& x, const vector<T, lanes>& y) noexcept {
        bits_ |= reinterpret_cast<Bits>(x) ^ reinterpret_cast<Bits>(y);
        // Equal bits are different numbers if one is negative and the other unsigned and as wide.
        constexpr bool one_is_signed = std::is_signed_v<T1> != std::is_signed_v<T2>;
        if constexpr (one_is_signed && sizeof(Unsigned) == sizeof(T)) {
            constexpr Lane sign = static_cast<Lane>(Lane{1} << (8 * sizeof(Lane) - 1));
            bits_ |= reinterpret_cast<Bits>(x) & sign;
        }
    }

    bool none() const noexcept {
        using Operations = operations_on<T, lanes>;
        return Operations::all_zeros(reinterpret_cast<typename Operations::Bits>(bits_));
    }

  private:
    using Unsigned = std::conditional_t<std::is_signed_v<T1>, T2, T1>;
    using Lane = unsigned_of_size<sizeof(T)>;
    using Bits = vector<Lane, lanes>;

    Bits bits_ = {};
};

#if defined(__arm__)

template <typename T, std::size_t /*lanes*/>
using DoubtsAboutReals = DoubtsAboutBits<T>;

#else

template <typename T, std::size_t lanes>
class DoubtsAboutReals {
  public:
    using Values = vector<T, lanes>;

    void add(equality /*bound*/, const Values& x, const Values& y) noexcept {
        if constexpr (Operations::has_masks) {
            certain_ = Operations::if_equal(certain_, x, y);
        } else {
            certain_ &= reinterpret_cast<Answers>(x == y);
        }
    }

    void add(const nearness<T> bound, const Values& x, const Values& y) noexcept {
        const Values d = magnitude(x - y);
        const Values left = Operations::minus_product(magnitude(y), bound.divisor, d);
        if constexpr (Operations::has_masks) {
            certain_ = Operations::if_at_least(certain_, left, d);
        } else {
            certain_ &= reinterpret_cast<Answers>(left >= d);
        }
    }

    bool none() const noexcept {
        if constexpr (Operations::has_masks) {
            return certain_ == all;
        } else {
            return Operations::all_ones(reinterpret_cast<typename Operations::Bits>(certain_));
        }
    }

  private:
    using Operations = operations_on<T, lanes>;
    using Lane = unsigned_of_size<sizeof(T)>;
    using Bits = vector<Lane, lanes>;
    using Answers = std::conditional_t<Operations::has_masks, unsigned_of_size<lanes / 8>, Bits>;

    static constexpr Answers all = static_cast<Answers>(~Answers{});

    static Values magnitude(const Values& reals) noexcept {
        constexpr Lane all_but_sign = std::numeric_limits<Lane>::max() / 2;
        return reinterpret_cast<Values>(reinterpret_cast<Bits>(reals) & all_but_sign);
    }

    Answers certain_ = all;
};

#endif

// ---- The loops

template <typename T1, typename T2, std::size_t lanes>
using Doubts = std::conditional_t<std::is_integral_v<comparison_t<T1, T2>>,
                                  DoubtsAboutIntegers<comparison_t<T1, T2>, lanes, T1, T2>,
                                  DoubtsAboutReals<comparison_t<T1, T2>, lanes>>;

// Adds one vector of each array. Beside complex numbers, a real counts as one whose imaginary part
// is zero.
template <std::size_t lanes, typename Bound, typename T1, typename T2>
inline void add_doubts(Doubts<T1, T2, lanes>& doubts, const Bound bound, const T1* const data1,
                       const T2* const data2) noexcept {
    using T = comparison_t<T1, T2>;
    if constexpr (is_complex_v<T2>) {
        const auto* const parts = reinterpret_cast<const to_real_type_t<T2>*>(data2);
        doubts.add(bound, load_as_complex<T, lanes>(data1), load<T, lanes>(parts));
    } else {
        doubts.add(bound, load<T, lanes>(data1), load<T, lanes>(data2));
    }
}

template <std::size_t lanes, std::size_t vectors, typename Bound, typename T1, typename T2>
inline bool certainly_same_block(const Bound bound, const T1* const data1,
                                 const T2* const data2) noexcept {
    constexpr std::size_t elements = is_complex_v<T2> ? lanes / 2 : lanes;
    Doubts<T1, T2, lanes> doubts;
    for (std::size_t k = 0; k < vectors; ++k) {
        add_doubts<lanes>(doubts, bound, data1 + k * elements, data2 + k * elements);
    }
    return doubts.none();
}

// The certain prefix by two vectors of `lanes` that may overlap, or by shorter ones.
template <std::size_t lanes, typename Bound, typename T1, typename T2>
inline std::size_t certain_prefix_by_two(const Bound bound, const T1* const data1,
                                         const T2* const data2, const std::size_t len) noexcept {
    constexpr std::size_t elements = is_complex_v<T2> ? lanes / 2 : lanes;
    if constexpr (lanes < 2) {
        return 0;
    } else {
        if (len < elements) {
            return certain_prefix_by_two<lanes / 2>(bound, data1, data2, len);
        }
        const std::size_t count = std::min(len, 2 * elements);
        Doubts<T1, T2, lanes> doubts;
        add_doubts<lanes>(doubts, bound, data1, data2);
        add_doubts<lanes>(doubts, bound, data1 + (count - elements), data2 + (count - elements));
        return doubts.none() ? count : 0;
    }
}

// The base class of the set.
struct loops {
    template <typename Bound, typename T1, typename T2>
    static constexpr bool has_loop = true;

    // The number of elements that fill a full vector.
    template <typename T1, typename T2>
    static constexpr std::size_t elements = vector_bytes / sizeof(comparison_t<T1, T2>)
                                            / (is_complex_v<T2> ? 2 : 1);

    // The certain prefix of two arrays of `len`, of which `end` elements lie before the first end
    // of a page: enough for a full vector.
    //
    // A block never extends past the page of its first unjudged element, so nothing on a page
    // beyond the first differing pair is read. The last vector before the end of a page may begin
    // with elements that have been judged already.
    template <typename Bound, typename T1, typename T2>
    [[gnu::noinline]] static std::size_t certain_prefix(const Bound bound, const T1* const data1,
                                                        const T2* const data2, std::size_t end,
                                                        const std::size_t len) noexcept {
        constexpr std::size_t step = elements<T1, T2>;
        constexpr std::size_t lanes = is_complex_v<T2> ? 2 * step : step;
        constexpr std::size_t block = vectors_per_block * step;
        for (std::size_t passed = 0;;) {
            while (end - passed >= block
                   && certainly_same_block<lanes, vectors_per_block>(bound, data1 + passed,
                                                                     data2 + passed)) {
                passed += block;
            }
            while (passed < end) {
                const std::size_t begin = std::min(passed, end - step);
                if (!certainly_same_block<lanes, 1>(bound, data1 + begin, data2 + begin)) {
                    return passed;
                }
                passed = begin + step;
            }
            end += elements_before_page_end(data1 + passed, data2 + passed, len - passed);
            // The arrays end here, or a complex number straddles two pages.
            if (end == passed) {
                return passed;
            }
        }
    }

    // The same for elements that do not fill a full vector.
    template <typename Bound, typename T1, typename T2>
    [[gnu::noinline]] static std::size_t
    short_certain_prefix(const Bound bound, const T1* const data1, const T2* const data2,
                         const std::size_t len) noexcept {
        constexpr std::size_t lanes = vector_bytes / sizeof(comparison_t<T1, T2>);
        return certain_prefix_by_two<lanes / 2>(bound, data1, data2, len);
    }
};
