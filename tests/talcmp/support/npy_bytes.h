// The bytes of .npy files, well-formed or not.

#pragma once

#include "to_type.h"

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <string>
#include <type_traits>
#include <vector>

namespace npy {

constexpr const char* magic = "\x93NUMPY";

// This machine's byte order, in which elements are written unless the other is asked for.
constexpr char native = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__ ? '<' : '>';
constexpr char swapped = native == '<' ? '>' : '<';

// The lowest `width` bytes of `value`.
inline std::string little_endian(std::uint64_t value, const std::size_t width) {
    std::string bytes;
    for (; bytes.size() < width; value >>= 8U) {
        bytes += static_cast<char>(value & 0xFFU);
    }
    return bytes;
}

// The dictionary as NumPy writes it, from three Python literals.
inline std::string dictionary(const std::string& descr, const std::string& fortran_order,
                              const std::string& shape) {
    return "{'descr': " + descr + ", 'fortran_order': " + fortran_order + ", 'shape': " + shape
           + ", }";
}

inline std::string version(const int major, const int minor) {
    return {static_cast<char>(major), static_cast<char>(minor)};
}

// Everything before the elements.
inline std::string header(const std::string& dictionary, const int major = 1) {
    return magic + version(major, 0) + little_endian(dictionary.size(), major == 1 ? 2 : 4)
           + dictionary;
}

// The literal for elements of `size` bytes: '<f8', '|i1'.
inline std::string descr_of(const char kind, const std::size_t size,
                            const char byte_order = native) {
    return std::string{'\'', size == 1 ? '|' : byte_order, kind} + std::to_string(size) + "'";
}

template <typename T>
std::string descr(const char byte_order = native) {
    constexpr bool real = std::is_floating_point_v<T>;
    return descr_of(is_complex_v<T>       ? 'c'
                    : real                ? 'f'
                    : std::is_signed_v<T> ? 'i'
                                          : 'u',
                    sizeof(T), byte_order);
}

template <typename T>
std::string element(const T value, const char byte_order = native) {
    if constexpr (is_complex_v<T>) {
        return element(value.real(), byte_order) + element(value.imag(), byte_order);
    } else {
        std::conditional_t<sizeof(T) == 8, std::uint64_t, std::uint32_t> bits = 0;
        if constexpr (std::is_integral_v<T>) {
            bits = static_cast<decltype(bits)>(value);
        } else {
            std::memcpy(&bits, &value, sizeof value);
        }
        std::string bytes = little_endian(bits, sizeof value);
        if (byte_order == '>') {
            std::reverse(bytes.begin(), bytes.end());
        }
        return bytes;
    }
}

template <typename T>
std::string elements(const std::vector<T>& values, const char byte_order = native) {
    std::string bytes;
    for (const T value : values) {
        bytes += element(value, byte_order);
    }
    return bytes;
}

// A whole file.
template <typename T>
std::string array(const std::string& shape, const std::vector<T>& values, const int major = 1) {
    return header(dictionary(descr<T>(), "False", shape), major) + elements(values);
}

// Of rank 1.
template <typename T>
std::string row(const std::vector<T>& values) {
    return array("(" + std::to_string(values.size()) + ",)", values);
}

} // namespace npy
