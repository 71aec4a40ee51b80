#include "element_type.h"

#include "number_text.h"
#include "to_type.h"

#include <cmath>
#include <cstdint>
#include <cstring>
#include <type_traits>

namespace talcmp {
namespace {

constexpr int hexadecimal = 16;

template <typename T>
std::string value_text(const T value) {
    if constexpr (std::is_floating_point_v<T>) {
        if (std::isnan(value)) {
            std::conditional_t<sizeof(T) == 4, std::uint32_t, std::uint64_t> bits = 0;
            std::memcpy(&bits, &value, sizeof bits);
            return "nan(0x" + number_text(bits, hexadecimal) + ")";
        }
    }
    return number_text(value);
}

template <typename T>
std::string part_text(const T value, const bool as_doubles) {
    if constexpr (std::is_same_v<T, float>) {
        if (as_doubles && !std::isnan(value)) {
            return value_text(static_cast<double>(value));
        }
    }
    return value_text(value);
}

template <typename T>
std::string element_text(const void* element, const bool as_doubles) {
    T value = {};
    std::memcpy(&value, element, sizeof value);
    if constexpr (is_complex_v<T>) {
        const std::string imaginary = part_text(value.imag(), as_doubles);
        const char* const sign = imaginary.front() == '-' ? "" : "+";
        return part_text(value.real(), as_doubles) + sign + imaginary + "j";
    } else {
        return part_text(value, as_doubles);
    }
}

template <typename T>
std::array<double, 2> element_parts(const void* element) {
    T value = {};
    std::memcpy(&value, element, sizeof value);
    if constexpr (is_complex_v<T>) {
        return {value.real(), value.imag()};
    } else {
        return {static_cast<double>(value), 0};
    }
}

template <typename T>
ElementType describe() {
    constexpr bool real = std::is_floating_point_v<T>;
    constexpr char kind = is_complex_v<T> ? 'c' : real ? 'f' : std::is_signed_v<T> ? 'i' : 'u';
    constexpr const char* family = is_complex_v<T>       ? "complex"
                                   : real                ? "float"
                                   : std::is_signed_v<T> ? "int"
                                                         : "uint";
    return {element_type_id<T>, kind,
            sizeof(T),          sizeof(to_real_type_t<T>),
            alignof(T),         family + std::to_string(8 * sizeof(T)),
            element_text<T>,    element_parts<T>};
}

template <typename... Types>
std::array<ElementType, sizeof...(Types)> describe_all(type_list<Types...> /*types*/) {
    return {describe<Types>()...};
}

} // namespace

const std::array<ElementType, element_type_list::size>& element_types() {
    static const auto types = describe_all(element_type_list{});
    return types;
}

const ElementType& element_type(const type_t id) {
    return element_types().at(static_cast<std::size_t>(id - 1));
}

} // namespace talcmp
