#include "value_counts.h"

#include "taldata_array_element_types.h"
#include "to_type.h"
#include "widest_vectors.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <type_traits>

namespace talcmp {
namespace {

template <typename T>
bool is_infinite(const T part) {
    return std::fabs(part) == std::numeric_limits<T>::infinity();
}

template <typename T>
bool is_negative_zero(const T part) {
    return part == 0 && std::signbit(part);
}

// Whether all are finite and nonzero, so that nothing is to be counted.
struct AllOrdinary {
    template <typename T>
    [[gnu::always_inline]] bool operator()(const T* const parts, const std::size_t count) const {
        // Numbers side by side, so that compilers make vector instructions of them.
        constexpr std::size_t lanes = 128 / sizeof(T);
        std::array<T, lanes> special = {};
        const auto is_special = [](const T part) {
            const T magnitude = std::fabs(part);
            return ((magnitude > 0) & (magnitude <= std::numeric_limits<T>::max())) ? T{0} : T{1};
        };
        for (std::size_t i = 0; i < count / lanes; ++i) {
            for (std::size_t lane = 0; lane < lanes; ++lane) {
                special[lane] += is_special(parts[lanes * i + lane]);
            }
        }
        for (std::size_t i = count / lanes * lanes; i < count; ++i) {
            special[0] += is_special(parts[i]);
        }
        return special == std::array<T, lanes>{};
    }
};

template <typename T>
ValueCounts counts_of(const T part) {
    return {std::isnan(part), is_infinite(part), is_negative_zero(part)};
}

template <typename T>
ValueCounts counts_of(const std::complex<T> value) {
    const ValueCounts real = counts_of(value.real());
    const ValueCounts imaginary = counts_of(value.imag());
    return {real.nans | imaginary.nans, real.infinities | imaginary.infinities,
            real.negative_zeros | imaginary.negative_zeros};
}

template <typename T>
ValueCounts count_as(const void* const elements, const std::size_t count) {
    ValueCounts counts;
    if constexpr (!std::is_integral_v<T>) {
        using Part = to_real_type_t<T>;
        constexpr std::size_t stretch = 1024;
        constexpr std::size_t parts_of_each = is_complex_v<T> ? 2 : 1;
        const auto* const values = static_cast<const T*>(elements);
        for (std::size_t begin = 0; begin < count; begin += stretch) {
            const std::size_t end = std::min(count, begin + stretch);
            const auto* const parts = reinterpret_cast<const Part*>(values + begin);
            if (!in_widest_vectors(AllOrdinary(), parts, (end - begin) * parts_of_each)) {
                for (std::size_t i = begin; i < end; ++i) {
                    add(counts, counts_of(values[i]));
                }
            }
        }
    }
    return counts;
}

template <typename... Types>
ValueCounts dispatch(type_list<Types...> /*types*/, const type_t type, const void* const elements,
                     const std::size_t count) {
    using Count = ValueCounts (*)(const void*, std::size_t);
    static constexpr std::array<Count, sizeof...(Types)> counts = {count_as<Types>...};
    return counts.at(static_cast<std::size_t>(type - 1))(elements, count);
}

} // namespace

ValueCounts count_values(const type_t type, const void* const elements, const std::size_t count) {
    return dispatch(element_type_list{}, type, elements, count);
}

} // namespace talcmp
