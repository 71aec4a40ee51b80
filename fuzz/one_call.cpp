// One call of each predicate with any two records, over arrays short or long, against the oracle.

#include "checked_call.h"
#include "draws.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

namespace {

using fuzz::Draws;
using fuzz::Operand;

constexpr talint largest_int = std::numeric_limits<talint>::max();

int drawn_type(Draws& draws) {
    // Outside 1 to 12 stand neighbours of the range, and what one byte of an int would make a type.
    constexpr std::array<int, 5> unknown = {0, 13, -1, 256 + 5, std::numeric_limits<int>::min()};
    return fuzz::one_in(draws, 32) ? draws.PickValueInArray(unknown)
                                   : draws.ConsumeIntegralInRange(1, 12);
}

// Blocks are of 128 pairs, or 64 of complex numbers; of the elements between them 16256 are judged
// before the stretches cease to grow.
talint drawn_length(Draws& draws) {
    const std::size_t way = fuzz::drawn_index(draws, 64);
    if (way < 40) {
        return draws.ConsumeIntegralInRange(0, 8);
    }
    if (way < 60) {
        const talint blocks = 64 * draws.ConsumeIntegralInRange(1, 8);
        return blocks + draws.ConsumeIntegralInRange(-3, 3);
    }
    return draws.ConsumeIntegralInRange(0, way < 63 ? 2000 : 20000);
}

std::vector<talint> drawn_dimensions(Draws& draws) {
    std::vector<talint> dimensions(fuzz::one_in(draws, 4) ? fuzz::drawn_index(draws, 8) : 1, 1);
    if (dimensions.empty()) {
        return dimensions;
    }
    talint length = drawn_length(draws);
    for (std::size_t i = 0; i + 1 < dimensions.size(); ++i) {
        dimensions[i] = draws.PickValueInArray({1, 2, 3, 7, 0});
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
std::vector<talint> drawn_other_dimensions(Draws& draws, std::vector<talint> dimensions) {
    switch (fuzz::drawn_index(draws, 32)) {
    case 1:
        dimensions.push_back(draws.PickValueInArray({1, 0, 2}));
        break;
    case 2:
        if (!dimensions.empty()) {
            dimensions.pop_back();
        }
        break;
    case 3:
        if (!dimensions.empty()) {
            dimensions[fuzz::drawn_index(draws, dimensions.size())] ^= 1;
        }
        break;
    default:
        break;
    }
    return dimensions;
}

// Where blocks begin, and the elements between them, as often as anywhere.
std::size_t drawn_place(Draws& draws, const std::size_t count) {
    if (draws.ConsumeBool()) {
        return fuzz::drawn_index(draws, count);
    }
    const std::size_t block = 64 * fuzz::drawn_index(draws, 12);
    return std::min(block + fuzz::drawn_index(draws, 3), count - 1);
}

// A few pairs of elements over and over, and then single ones at any place.
void fill(Draws& draws, const double tolerance, Operand& first, Operand& second,
          const std::size_t count) {
    struct Pair {
        std::array<unsigned char, fuzz::largest_element> first;
        std::array<unsigned char, fuzz::largest_element> second;
    };
    const auto drawn_pair = [&] {
        Pair pair = {};
        fuzz::draw_elements(draws, tolerance, first.array().type_id, second.array().type_id,
                            pair.first.data(), pair.second.data());
        return pair;
    };
    const auto store = [&](const std::size_t index, const Pair& pair) {
        std::memcpy(first.element(index), pair.first.data(), first.element_size());
        std::memcpy(second.element(index), pair.second.data(), second.element_size());
    };
    std::vector<Pair> pattern(1 + fuzz::drawn_index(draws, 4));
    for (Pair& pair : pattern) {
        pair = drawn_pair();
    }
    for (std::size_t i = 0; i < count; ++i) {
        store(i, pattern[i % pattern.size()]);
    }
    for (std::size_t singles = fuzz::drawn_index(draws, 5); singles > 0; --singles) {
        const std::size_t place = drawn_place(draws, count);
        store(place, drawn_pair());
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, const std::size_t size) {
    Draws draws(bytes, size);
    const double tolerance = fuzz::drawn_tolerance(draws);
    const int compare_different_types =
        draws.PickValueInArray({1, 1, 1, -1, 256, 0, std::numeric_limits<int>::min()});
    const int first_type = drawn_type(draws);
    const int second_type = fuzz::one_in(draws, 4) ? first_type : drawn_type(draws);
    const std::vector<talint> dimensions = drawn_dimensions(draws);
    const talint count = product(dimensions);
    const std::size_t first_place = fuzz::drawn_index(draws, Operand::page_bytes);
    const std::size_t second_place = fuzz::drawn_index(draws, Operand::page_bytes);

    Operand first(first_type, dimensions, count, first_place);
    Operand second(second_type, drawn_other_dimensions(draws, dimensions), count, second_place);
    if (fuzz::one_in(draws, 4)) {
        second.record().nelems = draws.ConsumeIntegralInRange(0, largest_int);
    }
    if (count > 0 && fuzz::is_known(first_type) && fuzz::is_known(second_type)) {
        fill(draws, tolerance, first, second, static_cast<std::size_t>(count));
    }
    oracle::State state = fuzz::known_state();
    fuzz::check_call(state, tolerance, compare_different_types, first, second);
    return 0;
}
