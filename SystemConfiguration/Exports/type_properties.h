// The runtime's machine types: fixed-width integers, the machine integer `talint`, the machine
// real `talreal` and `type_t`, which holds an element type id.

#ifndef TAL_TYPE_PROPERTIES_H
#define TAL_TYPE_PROPERTIES_H

#include <cstdint>
#include <limits>

using BIT8 = std::int_least8_t;
using BIT16 = std::int_least16_t;
using BIT32 = std::int_least32_t;
using BIT64 = std::int_least64_t;

using UBIT8 = std::uint_least8_t;
using UBIT16 = std::uint_least16_t;
using UBIT32 = std::uint_least32_t;
using UBIT64 = std::uint_least64_t;

// Ranks, dimensions, element counts and loop indices.
using talint = BIT32;

// The tolerance of a comparison.
using talreal = double;

// An element type id; see `TalNumericArrayTypeId`.
using type_t = signed int;

static_assert(sizeof(BIT8) == 1 && sizeof(BIT16) == 2 && sizeof(BIT32) == 4 && sizeof(BIT64) == 8,
              "the least-width integers are the exact-width ones wherever the runtime is built");
static_assert(std::numeric_limits<float>::is_iec559 && std::numeric_limits<double>::is_iec559,
              "reals are IEEE 754 singles and doubles");

#endif
