// The types of vectors, and how far they may read. The operations on vectors are in a file for each
// instruction set.

#ifndef TALNUMERICARRAY_VECTORS_H
#define TALNUMERICARRAY_VECTORS_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <type_traits>

// Widening depends on the byte order.
#if (defined(__SSE2__) || defined(__ARM_NEON)) && __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__
#    define TALNUMERICARRAY_HAS_VECTORS 1
#else
#    define TALNUMERICARRAY_HAS_VECTORS 0
#endif

#pragma GCC visibility push(hidden)

namespace talnumericarray {

// The smallest page of any platform; larger ones are multiples of it.
inline constexpr std::size_t page_bytes = 4096;

// How many whole elements there are from `data` to the end of its page.
template <typename T>
inline std::size_t elements_before_page_end(const T* const data) noexcept {
    const std::size_t offset = reinterpret_cast<std::uintptr_t>(data) % page_bytes;
    return (page_bytes - offset) / sizeof(T);
}

// The least of `len` and that number for each of two arrays.
template <typename T1, typename T2>
inline std::size_t elements_before_page_end(const T1* const data1, const T2* const data2,
                                            const std::size_t len) noexcept {
    return std::min({len, elements_before_page_end(data1), elements_before_page_end(data2)});
}

// ---- Integers by size

template <std::size_t size>
using unsigned_of_size = std::conditional_t<
    size == 1, std::uint8_t,
    std::conditional_t<size == 2, std::uint16_t,
                       std::conditional_t<size == 4, std::uint32_t, std::uint64_t>>>;

template <std::size_t size>
using signed_of_size = std::make_signed_t<unsigned_of_size<size>>;

template <typename T>
using twice_as_wide_t = std::conditional_t<std::is_signed_v<T>, signed_of_size<2 * sizeof(T)>,
                                           unsigned_of_size<2 * sizeof(T)>>;

// ---- Vectors

// A vector for `lanes` of `T`. No vector is shorter than 16 bytes. If only the first 2, 4 or 8
// bytes are in use, the other lanes are zero on both sides, and so the same.
template <typename T, std::size_t lanes>
struct vector_of {
    static constexpr std::size_t bytes = std::max<std::size_t>(16, lanes * sizeof(T));
    using type [[gnu::vector_size(bytes)]] = T;
};

template <typename T, std::size_t lanes>
using vector = typename vector_of<T, lanes>::type;

// A vector of `bytes` bytes that holds whole `T`.
template <typename T, std::size_t bytes>
using vector_of_bytes = vector<T, bytes / sizeof(T)>;

// How many vectors a block has; one test judges them all. On 32-bit ARM a test takes as long as
// comparing two vectors.
#if defined(__arm__)
inline constexpr std::size_t vectors_per_block = 8;
#else
inline constexpr std::size_t vectors_per_block = 4;
#endif

// The leading integers of a vector, widened to `size` bytes with their signs, by doubling.
template <typename Operations, std::size_t size, typename From>
inline typename Operations::Bits widened(const typename Operations::Bits numbers) noexcept {
    if constexpr (sizeof(From) < size) {
        return widened<Operations, size, twice_as_wide_t<From>>(
            Operations::template twice_as_wide<From>(numbers));
    } else {
        return numbers;
    }
}

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
