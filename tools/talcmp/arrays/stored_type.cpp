#include "stored_type.h"

#include "widest_vectors.h"

#include <algorithm>
#include <cstdint>
#include <cstring>

namespace talcmp {
namespace {

// ---- Byte order

[[gnu::always_inline]] inline std::uint16_t reversed(const std::uint16_t bits) {
    return __builtin_bswap16(bits);
}
[[gnu::always_inline]] inline std::uint32_t reversed(const std::uint32_t bits) {
    return __builtin_bswap32(bits);
}
[[gnu::always_inline]] inline std::uint64_t reversed(const std::uint64_t bits) {
    return __builtin_bswap64(bits);
}

template <typename Bits>
[[gnu::always_inline]] inline void reverse_each_as(unsigned char* const parts,
                                                   const std::size_t bytes) {
    for (std::size_t i = 0; i < bytes; i += sizeof(Bits)) {
        Bits part = 0;
        std::memcpy(&part, parts + i, sizeof part);
        part = reversed(part);
        std::memcpy(parts + i, &part, sizeof part);
    }
}

// SSE2 cannot reverse a whole vector by one instruction.
struct ReverseEach {
    [[gnu::always_inline]] void operator()(unsigned char* const parts, const std::size_t bytes,
                                           const std::size_t part_size) const {
        static_assert(largest_element_size == 2 * sizeof(std::uint64_t),
                      "there is a case for each size");
        switch (part_size) {
        case sizeof(std::uint16_t):
            return reverse_each_as<std::uint16_t>(parts, bytes);
        case sizeof(std::uint32_t):
            return reverse_each_as<std::uint32_t>(parts, bytes);
        default:
            return reverse_each_as<std::uint64_t>(parts, bytes);
        }
    }
};

// ---- Types that the module does not have

constexpr std::size_t size_of_half = 2;

// Whatever is not 0 is true, as in C and in NumPy.
void widen_booleans(void* const elements, const std::size_t count) {
    auto* const booleans = static_cast<unsigned char*>(elements);
    std::transform(booleans, booleans + count, booleans,
                   [](const unsigned char byte) { return byte != 0 ? 1 : 0; });
}

// The bits of the single with the value of a half, and of a NaN with its sign and its significand.
std::uint32_t widened(const std::uint16_t half) {
    constexpr std::uint32_t exponent_of_infinity = 0x1F;
    constexpr std::uint32_t rebias = 127 - 15;
    const std::uint32_t sign = std::uint32_t{half & 0x8000U} << 16U;
    std::uint32_t exponent = (half >> 10U) & 0x1FU;
    std::uint32_t significand = half & 0x3FFU;
    if (exponent == exponent_of_infinity) {
        return sign | 0x7F800000U | significand << 13U;
    }
    if (exponent == 0) {
        if (significand == 0) {
            return sign;
        }
        // Subnormal halves are normal singles: the highest bit moves to where it is implied.
        const auto shift = static_cast<unsigned>(__builtin_clz(significand)) - 21U;
        significand = significand << shift & 0x3FFU;
        exponent = 1 - shift;
    }
    return sign | (exponent + rebias) << 23U | significand << 13U;
}

// From the first to the last: no single is written over a half that is still to be read.
void widen_halves(void* const elements, const std::size_t count) {
    auto* const singles = static_cast<unsigned char*>(elements);
    const unsigned char* const halves = singles + count * (sizeof(float) - size_of_half);
    for (std::size_t i = 0; i < count; ++i) {
        std::uint16_t half = 0;
        std::memcpy(&half, halves + i * size_of_half, sizeof half);
        const std::uint32_t single = widened(half);
        std::memcpy(singles + i * sizeof single, &single, sizeof single);
    }
}

} // namespace

std::optional<StoredType> stored_type(const char kind, const std::size_t size,
                                      const bool bytes_swapped) {
    if (kind == 'b' && size == 1) {
        const ElementType& type = element_type(element_type_id<std::uint8_t>);
        return StoredType{"bool", &type, size, false, widen_booleans};
    }
    if (kind == 'f' && size == size_of_half) {
        const ElementType& type = element_type(element_type_id<float>);
        return StoredType{"float16", &type, size, bytes_swapped, widen_halves};
    }
    const auto& types = element_types();
    const auto type = std::find_if(types.begin(), types.end(), [&](const ElementType& each) {
        return kind == each.kind && size == each.size;
    });
    if (type == types.end()) {
        return std::nullopt;
    }
    return StoredType{type->name, type, size, bytes_swapped && size != 1, nullptr};
}

void* room_for_stored(const StoredType& type, void* const elements, const std::size_t count) {
    return static_cast<unsigned char*>(elements) + count * (type.type->size - type.size);
}

void decode(const StoredType& type, void* const elements, const std::size_t count) {
    if (type.bytes_swapped) {
        const std::size_t part_size = std::min(type.size, type.type->part_size);
        in_widest_vectors(ReverseEach(),
                          static_cast<unsigned char*>(room_for_stored(type, elements, count)),
                          count * type.size, part_size);
    }
    if (type.widen != nullptr) {
        type.widen(elements, count);
    }
}

} // namespace talcmp
