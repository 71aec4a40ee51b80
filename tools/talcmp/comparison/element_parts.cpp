#include "element_parts.h"

#include "to_type.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <type_traits>

namespace talcmp {
namespace {

template <typename Real, typename T>
const Real* parts_as(const void* const elements, const std::size_t count, const int part,
                     Real* const room) {
    const auto* const values = static_cast<const T*>(elements);
    if constexpr (is_complex_v<T>) {
        const auto* const parts = static_cast<const to_real_type_t<T>*>(elements) + part;
        for (std::size_t i = 0; i < count; ++i) {
            room[i] = static_cast<Real>(parts[2 * i]);
        }
        return room;
    } else if (part == 1) {
        std::fill_n(room, count, Real{0});
        return room;
    } else if constexpr (std::is_same_v<T, Real>) {
        return values;
    } else {
        for (std::size_t i = 0; i < count; ++i) {
            room[i] = static_cast<Real>(values[i]);
        }
        return room;
    }
}

template <typename Real, typename... Types>
const Real* parts(type_list<Types...> /*types*/, const type_t type, const void* const elements,
                  const std::size_t count, const int part, Real* const room) {
    using Convert = const Real* (*)(const void*, std::size_t, int, Real*);
    static constexpr std::array<Convert, sizeof...(Types)> convert = {parts_as<Real, Types>...};
    return convert.at(static_cast<std::size_t>(type - 1))(elements, count, part, room);
}

// Rounding is symmetric, so magnitudes will do. The rounded one may be 2^64, which is 0 modulo
// 2^64, and so is right for the difference.
template <typename Integer>
double rest_of(const Integer value) {
    constexpr double two_to_64 = 18446744073709551616.0;
    const auto bits = static_cast<std::uint64_t>(value);
    const std::uint64_t magnitude = value < 0 ? std::uint64_t{0} - bits : bits;
    const auto rounded = static_cast<double>(magnitude);
    const std::uint64_t subtrahend =
        rounded < two_to_64 ? static_cast<std::uint64_t>(rounded) : std::uint64_t{0};
    const auto rest = static_cast<double>(static_cast<std::int64_t>(magnitude - subtrahend));
    return value < 0 ? -rest : rest;
}

template <typename Integer>
const double* rests_as(const void* const elements, const std::size_t count, double* const room) {
    const auto* const values = static_cast<const Integer*>(elements);
    std::transform(values, values + count, room, rest_of<Integer>);
    return room;
}

} // namespace

template <typename Real>
const Real* parts_of(const ElementType& type, const void* const elements, const std::size_t count,
                     const int part, std::vector<double>& room) {
    room.resize(std::max(room.size(), count));
    return parts<Real>(element_type_list{}, type.id, elements, count, part,
                       reinterpret_cast<Real*>(room.data()));
}

template const float* parts_of<float>(const ElementType&, const void*, std::size_t, int,
                                      std::vector<double>&);
template const double* parts_of<double>(const ElementType&, const void*, std::size_t, int,
                                        std::vector<double>&);

const double* rests_of(const ElementType& type, const void* const elements, const std::size_t count,
                       std::vector<double>& room) {
    if (!is_integer(type) || type.size < sizeof(std::uint64_t)) {
        return nullptr;
    }
    room.resize(std::max(room.size(), count));
    return type.kind == 'i' ? rests_as<std::int64_t>(elements, count, room.data())
                            : rests_as<std::uint64_t>(elements, count, room.data());
}

} // namespace talcmp
