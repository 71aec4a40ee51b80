// The types of vectors, and how far they may read. What is done with vectors stands in a file for
// each instruction set.

#ifndef TALNUMERICARRAY_VECTORS_H
#define TALNUMERICARRAY_VECTORS_H

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <type_traits>

// The order of bytes matters where numbers are widened.
#if (defined(__SSE2__) || defined(__ARM_NEON)) && __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__
#    define TALNUMERICARRAY_HAS_VECTORS 1
#else
#    define TALNUMERICARRAY_HAS_VECTORS 0
#endif

#pragma GCC visibility push(hidden)

namespace talnumericarray {

// The smallest page of any platform's memory; the larger ones are multiples of it.
inline constexpr std::size_t page_bytes = 4096;

// The number of whole elements from `data` on to the end of its page.
template <typename T>
inline std::size_t elements_before_page_end(const T* const data) noexcept {
    const std::size_t behind = reinterpret_cast<std::uintptr_t>(data) % page_bytes;
    return (page_bytes - behind) / sizeof(T);
}

// The same of both arrays, or `len` if that is less.
template <typename T1, typename T2>
inline std::size_t elements_before_page_end(const T1* const data1, const T2* const data2,
                                            const std::size_t len) noexcept {
    return std::min({len, elements_before_page_end(data1), elements_before_page_end(data2)});
}

// ---- Integers of some size, and what becomes of them when they are widened

template <std::size_t size>
using unsigned_of_size = std::conditional_t<
    size == 1, std::uint8_t,
    std::conditional_t<size == 2, std::uint16_t,
                       std::conditional_t<size == 4, std::uint32_t, std::uint64_t>>>;

template <std::size_t size>
using signed_of_size = std::make_signed_t<unsigned_of_size<size>>;

template <typename T, std::size_t times>
using wider = std::conditional_t<std::is_signed_v<T>, signed_of_size<times * sizeof(T)>,
                                 unsigned_of_size<times * sizeof(T)>>;

// ---- Vectors

// A vector for `lanes` of `T`. No vector is shorter than 16 bytes, of which the first 2, 4 or 8 may
// be all that is in use; the other lanes are zeros on both sides, and as such the same.
template <typename T, std::size_t lanes>
struct vector_of {
    static constexpr std::size_t bytes = std::max<std::size_t>(16, lanes * sizeof(T));
    using type [[gnu::vector_size(bytes)]] = T;
};

template <typename T, std::size_t lanes>
using vector = typename vector_of<T, lanes>::type;

// A vector of `bytes` for whole `T`.
template <typename T, std::size_t bytes>
using vector_of_bytes = vector<T, bytes / sizeof(T)>;

} // namespace talnumericarray

#pragma GCC visibility pop

#endif
