// One call of each predicate with any two records, over short or long arrays, against the oracle.

#include "checked_call.h"
#include "input_draws.h"
#include "random_arrays.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

namespace {

using fuzz::InputDraws;
using fuzz::Operand;

constexpr std::size_t largest_element = 16;
constexpr talint largest_int = std::numeric_limits<talint>::max();

int drawn_type(InputDraws& draws) {
    // Neighbours of the range, and numbers whose lowest byte alone would be a type.
    constexpr int unknown[] = {0, 13, -1, 256 + 5, std::numeric_limits<int>::min()};
    return draws.rarely(32) ? draws.pick(unknown) : draws.between(1, 12);
}

// Blocks are of 128 pairs, or 64 of complex numbers; of the elements between them 16256 are judged
// before the stretches cease to grow.
talint drawn_length(InputDraws& draws) {
    const std::size_t way = draws.index(64);
    if (way < 40) {
        return draws.between(0, 8);
    }
    if (way < 60) {
        const talint blocks = 64 * draws.between(1, 8);
        return blocks + draws.between(-3, 3);
    }
    return draws.between(0, way < 63 ? 2000 : 20000);
}

std::vector<talint> drawn_dimensions(InputDraws& draws) {
    std::vector<talint> dimensions(draws.rarely(4) ? draws.index(8) : 1, 1);
    if (dimensions.empty()) {
        return dimensions;
    }
    talint length = drawn_length(draws);
    for (std::size_t i = 0; i + 1 < dimensions.size(); ++i) {
        dimensions[i] = draws.pick({1, 2, 3, 7, 0});
        length = dimensions[i] == 0 ? largest_int : length / dimensions[i];
    }
    dimensions.back() = length;
    return dimensions;
}

talint product(const std::vector<talint>& dimensions) {
    talint count = 1;
    for (const talint dimension : dimensions) {
        if (dimension == 0) {
            return 0;
        }
        count = count > largest_int / dimension ? largest_int : count * dimension;
    }
    return count;
}

// Mostly those of the first array.
std::vector<talint> drawn_other_dimensions(InputDraws& draws, std::vector<talint> dimensions) {
    switch (draws.index(32)) {
    case 1:
        dimensions.push_back(draws.pick({1, 0, 2}));
        break;
    case 2:
        if (!dimensions.empty()) {
            dimensions.pop_back();
        }
        break;
    case 3:
        if (!dimensions.empty()) {
            dimensions[draws.index(dimensions.size())] ^= 1;
        }
        break;
    default:
        break;
    }
    return dimensions;
}

// At the beginnings of blocks and between blocks as often as anywhere.
std::size_t drawn_place(InputDraws& draws, const std::size_t count) {
    if (draws.one_in(2)) {
        return draws.index(count);
    }
    const std::size_t block = 64 * draws.index(12);
    return std::min(block + draws.index(3), count - 1);
}

// A few pairs of elements over and over, then single ones anywhere.
void fill(InputDraws& draws, const double tolerance, Operand& first, Operand& second,
          const std::size_t count) {
    struct Pair {
        std::array<unsigned char, largest_element> first;
        std::array<unsigned char, largest_element> second;
    };
    const auto drawn_pair = [&] {
        Pair pair = {};
        oracle::draw_elements(draws, tolerance, first.array().type_id, second.array().type_id,
                              !draws.rarely(4), pair.first.data(), pair.second.data());
        return pair;
    };
    const auto store = [&](const std::size_t index, const Pair& pair) {
        std::memcpy(first.element(index), pair.first.data(), first.element_size());
        std::memcpy(second.element(index), pair.second.data(), second.element_size());
    };
    std::vector<Pair> pattern(1 + draws.index(4));
    for (Pair& pair : pattern) {
        pair = drawn_pair();
    }
    for (std::size_t i = 0; i < count; ++i) {
        store(i, pattern[i % pattern.size()]);
    }
    for (std::size_t singles = draws.index(5); singles > 0; --singles) {
        const std::size_t place = drawn_place(draws, count);
        store(place, drawn_pair());
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, const std::size_t size) {
    InputDraws draws(bytes, size);
    const double tolerance = oracle::random_tolerance(draws);
    const int compare_different_types =
        draws.pick({1, 1, 1, -1, 256, 0, std::numeric_limits<int>::min()});
    const int first_type = drawn_type(draws);
    const int second_type = draws.rarely(4) ? first_type : drawn_type(draws);
    const std::vector<talint> dimensions = drawn_dimensions(draws);
    const talint count = product(dimensions);
    const std::size_t first_place = draws.index(Operand::page_bytes);
    const std::size_t second_place = draws.index(Operand::page_bytes);

    Operand first(first_type, dimensions, count, first_place);
    Operand second(second_type, drawn_other_dimensions(draws, dimensions), count, second_place);
    if (draws.rarely(4)) {
        second.record().nelems =
            static_cast<talint>(draws.index(static_cast<std::size_t>(largest_int) + 1));
    }
    if (count > 0 && fuzz::is_known(first_type) && fuzz::is_known(second_type)) {
        fill(draws, tolerance, first, second, static_cast<std::size_t>(count));
    }
    oracle::State state = fuzz::known_state();
    fuzz::check_call(state, tolerance, compare_different_types, first, second);
    return 0;
}
