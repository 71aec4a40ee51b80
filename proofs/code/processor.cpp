// The arithmetic of the processor, that of `evaluate.py` is held against: each function applies one
// operation to rows of three numbers, each in the lowest bits of 64.

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace {

template <typename To, typename From>
To with_bits_of(const From from) {
    To to{};
    std::memcpy(&to, &from, sizeof to < sizeof from ? sizeof to : sizeof from);
    return to;
}

template <typename T, typename Operation>
void apply(const std::uint64_t* const rows, std::uint64_t* const results, const std::size_t count,
           const Operation operation) {
    for (std::size_t k = 0; k < count; ++k) {
        const std::uint64_t* const row = rows + 3 * k;
        results[k] = with_bits_of<std::uint64_t>(
            operation(with_bits_of<T>(row[0]), with_bits_of<T>(row[1]), with_bits_of<T>(row[2])));
    }
}

} // namespace

#define OPERATION(name, T, result)                                                                 \
    extern "C" void name(const std::uint64_t* const rows, std::uint64_t* const results,            \
                         const std::size_t count) {                                                \
        apply<T>(rows, results, count, [](const T a, const T b, const T c) {                       \
            (void)b, (void)c;                                                                      \
            return result;                                                                         \
        });                                                                                        \
    }

#define OPERATIONS(T, Other)                                                                       \
    OPERATION(plus_##T, T, a + b)                                                                  \
    OPERATION(minus_##T, T, a - b)                                                                 \
    OPERATION(times_##T, T, a* b)                                                                  \
    OPERATION(over_##T, T, a / b)                                                                  \
    OPERATION(fused_##T, T, std::fma(a, b, c))                                                     \
    OPERATION(Other##_of_##T, T, static_cast<Other>(a))                                            \
    OPERATION(T##_of_int32, std::int32_t, static_cast<T>(a))                                       \
    OPERATION(T##_of_uint32, std::uint32_t, static_cast<T>(a))                                     \
    OPERATION(T##_of_int64, std::int64_t, static_cast<T>(a))                                       \
    OPERATION(T##_of_uint64, std::uint64_t, static_cast<T>(a))

OPERATIONS(float, double)
OPERATIONS(double, float)
