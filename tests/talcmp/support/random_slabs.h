// Parts of arrays, drawn by chance.

#pragma once

#include "array_source.h"
#include "indices.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <random>
#include <string>
#include <vector>

// What the environment says, or another one each time; a test that fails has to say which.
inline std::uint64_t drawn_seed() {
    const char* const text = std::getenv("TALNUMERICARRAY_SEED");
    const std::uint64_t seed =
        text != nullptr ? std::strtoull(text, nullptr, 10) : std::random_device()();
    std::cout << "seed " << seed << '\n';
    return seed;
}

inline talcmp::Slab random_slab(const talcmp::Shape& shape, std::mt19937_64& random) {
    const auto below = [&random](const std::uint64_t end) { return random() % end; };
    talcmp::Slab slab;
    for (const std::uint64_t extent : shape) {
        const std::uint64_t begin = below(extent);
        const std::uint64_t step = 1 + below(3);
        slab.axes.push_back({begin, 1 + below((extent - begin - 1) / step + 1), step});
    }
    return slab;
}

// The positions of its elements in an array of that shape, in C order.
inline std::vector<std::size_t> positions_of(const talcmp::Slab& slab, const talcmp::Shape& shape) {
    talcmp::Shape part;
    for (const talcmp::Slab::Axis& axis : slab.axes) {
        part.push_back(axis.extent);
    }
    std::vector<std::size_t> positions;
    for (const talcmp::Shape& index : indices_of(part)) {
        std::uint64_t position = 0;
        for (std::size_t i = 0; i < shape.size(); ++i) {
            position = position * shape[i] + slab.axes[i].begin + index[i] * slab.axes[i].step;
        }
        positions.push_back(static_cast<std::size_t>(position));
    }
    return positions;
}
