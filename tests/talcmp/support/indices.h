// All indices of an array.

#pragma once

#include "array_source.h"

#include <cstdint>
#include <utility>
#include <vector>

// In row-major order.
inline std::vector<talcmp::Shape> indices_of(const talcmp::Shape& shape) {
    std::vector<talcmp::Shape> indices = {{}};
    for (const std::uint64_t extent : shape) {
        std::vector<talcmp::Shape> longer;
        for (const talcmp::Shape& index : indices) {
            for (std::uint64_t i = 0; i < extent; ++i) {
                longer.push_back(index);
                longer.back().push_back(i);
            }
        }
        indices = std::move(longer);
    }
    return indices;
}
