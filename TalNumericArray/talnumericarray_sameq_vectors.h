// Certainty by vectors: how many leading elements of two arrays are certainly the same.
//
// Each set of instructions includes this once, in a namespace and under the target of its own, so
// that a template of one set is no template of another. It has defined `vector_bytes`, the length
// of its longest vectors, and `operations` on those and on what is half as long.

// What is done with vectors for `lanes` of `T`.
template <typename T, std::size_t lanes>
using operations_on = operations<vector_of<T, lanes>::bytes>;

// `lanes` integers, widened to the size of a `T` with their signs.
template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> widened(const From* const from) noexcept {
    return reinterpret_cast<vector<T, lanes>>(
        operations_on<T, lanes>::template widened<sizeof(T), lanes>(from));
}

// ---- Conversion to the type of comparison

// 32-bit integers as reals.
template <typename T, std::size_t lanes>
inline vector<T, lanes> reals(const vector<std::int32_t, lanes>& numbers) noexcept {
    using Bits = typename operations_on<std::int32_t, lanes>::Bits;
    return reinterpret_cast<vector<T, lanes>>(
        operations_on<T, lanes>::template reals<T>(reinterpret_cast<Bits>(numbers)));
}

// Where there is no instruction for it. Each of these rounds once, in its last addition, so that it
// gives what the conversion of one number does in any direction of rounding, but for the sign of a
// zero.

template <std::size_t lanes>
inline vector<double, lanes>
from_32_unsigned_bits(const vector<std::uint64_t, lanes>& numbers) noexcept {
    // In the lowest bits of 2^52.
    constexpr std::uint64_t base = 0x4330000000000000;
    return reinterpret_cast<vector<double, lanes>>(numbers | base) - 0x1p52;
}

template <std::size_t lanes>
inline vector<float, lanes>
from_32_unsigned_bits(const vector<std::uint32_t, lanes>& numbers) noexcept {
    using Integers = vector<std::int32_t, lanes>;
    const auto high = reals<float, lanes>(reinterpret_cast<Integers>(numbers >> 16));
    const auto low = reals<float, lanes>(reinterpret_cast<Integers>(numbers & 0xffffU));
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
    const auto upper =
        reinterpret_cast<vector<double, lanes>>((numbers >> 32) ^ (upper_base | sign));
    const auto lower =
        reinterpret_cast<vector<double, lanes>>((numbers & 0xffffffffU) | lower_base);
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
    using Operations = operations_on<T, lanes>;
    if constexpr (std::is_integral_v<T> || std::is_same_v<T, From>) {
        return widened<T, lanes>(from);
    } else if constexpr (std::is_floating_point_v<From>) {
        return reinterpret_cast<vector<T, lanes>>(Operations::template doubles<lanes>(from));
    } else if constexpr (Operations::template converts<T, From>) {
        return reinterpret_cast<vector<T, lanes>>(Operations::template converted<T, lanes>(from));
    } else if constexpr (sizeof(From) == 8 && std::is_same_v<T, float>) {
        return one_by_one<T, lanes>(from);
    } else if constexpr (sizeof(From) == 8) {
        return from_64_bits<std::is_signed_v<From>, lanes>(widened<std::uint64_t, lanes>(from));
    } else if constexpr (std::is_same_v<From, std::uint32_t>) {
        return from_32_unsigned_bits<lanes>(widened<unsigned_of_size<sizeof(T)>, lanes>(from));
    } else {
        return reals<T, lanes>(widened<std::int32_t, lanes>(from));
    }
}

// Reals laid out as complex numbers are: with a zero behind each.
template <typename T, std::size_t lanes, typename From>
inline vector<T, lanes> load_as_complex(const From* const from) noexcept {
    return reinterpret_cast<vector<T, lanes>>(
        operations_on<T, lanes>::template with_zeros_between<T>(load<T, lanes / 2>(from)));
}

// ---- Doubts about the lanes of vectors, gathered over several

// Two integers of types `T1` and `T2`, widened: the bits that differ.
template <typename T, std::size_t lanes, typename T1, typename T2>
class DoubtsAboutIntegers {
  public:
    void add(equality /*bound*/, const vector<T, lanes>& x, const vector<T, lanes>& y) noexcept {
        bits_ |= reinterpret_cast<Bits>(x) ^ reinterpret_cast<Bits>(y);
        // Equal bits are different numbers where a negative one meets an unsigned one as wide.
        if constexpr (std::is_signed_v<
                          T1> != std::is_signed_v<T2> && sizeof(Unsigned) == sizeof(T)) {
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

// ---- The walk

template <typename T1, typename T2, std::size_t lanes>
using Doubts = std::conditional_t<std::is_integral_v<comparison_t<T1, T2>>,
                                  DoubtsAboutIntegers<comparison_t<T1, T2>, lanes, T1, T2>,
                                  DoubtsAboutReals<comparison_t<T1, T2>, lanes>>;

// One vector of each array's elements. A real stands for a complex number whose imaginary part is
// zero, and is laid out as one beside complex numbers.
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
inline bool certain_of(const Bound bound, const T1* const data1, const T2* const data2) noexcept {
    constexpr std::size_t elements = is_complex_v<T2> ? lanes / 2 : lanes;
    Doubts<T1, T2, lanes> doubts;
    for (std::size_t k = 0; k < vectors; ++k) {
        add_doubts<lanes>(doubts, bound, data1 + k * elements, data2 + k * elements);
    }
    return doubts.none();
}

// What a set is to have besides a name and a way to know whether the processor has it.
struct loops {
    template <typename Bound, typename T1, typename T2>
    static constexpr bool has_loop = true;

    // The elements that a vector takes of two arrays.
    template <typename T1, typename T2>
    static constexpr std::size_t elements = vector_bytes / sizeof(comparison_t<T1, T2>)
                                            / (is_complex_v<T2> ? 2 : 1);

    // The number of leading elements of two arrays of `len` that are found to be certainly the
    // same. `end` is the number of those before the first end of a page, and enough for a vector.
    //
    // Nothing is read in another page than that of the first element that has not been passed yet,
    // so that no page is touched that a program could tell is behind the first pair that differs.
    // The last vector in front of a page's end begins, if need be, among elements that have been
    // passed already.
    template <typename Bound, typename T1, typename T2>
    [[gnu::noinline]] static std::size_t
    leading_certainly_same(const Bound bound, const T1* const data1, const T2* const data2,
                           std::size_t end, const std::size_t len) noexcept {
        constexpr std::size_t step = elements<T1, T2>;
        constexpr std::size_t lanes = is_complex_v<T2> ? 2 * step : step;
        constexpr std::size_t step_of_group = vectors_together * step;
        for (std::size_t passed = 0;;) {
            while (end - passed >= step_of_group
                   && certain_of<lanes, vectors_together>(bound, data1 + passed, data2 + passed)) {
                passed += step_of_group;
            }
            while (passed < end) {
                const std::size_t begin = std::min(passed, end - step);
                if (!certain_of<lanes, 1>(bound, data1 + begin, data2 + begin)) {
                    return passed;
                }
                passed = begin + step;
            }
            end += elements_before_page_end(data1 + passed, data2 + passed, len - passed);
            // Here are both ends; and a complex number may lie in two pages.
            if (end == passed) {
                return passed;
            }
        }
    }
};
