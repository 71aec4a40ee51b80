// Pairs of elements that were found, by where they are.

#pragma once

#include "digits.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <limits>
#include <optional>
#include <vector>

namespace talcmp {

// Room for an element of any type.
using Element = std::array<unsigned char, largest_element_size>;

// The values are kept, as an array may be readable only once; as they are stored, without what is
// allowed beside the tolerance.
struct FoundPair {
    std::uint64_t number = 0; // of the element in the first array, in row-major order
    Element element1 = {};
    Element element2 = {};
    std::optional<Sameness> sameness = {}; // if it is already known
};

inline FoundPair found_pair(const Pairs& pairs, const std::size_t i, const std::uint64_t number) {
    FoundPair pair;
    pair.number = number;
    std::memcpy(pair.element1.data(), pairs.element1(i), pairs.type1().size);
    std::memcpy(pair.element2.data(), pairs.element2(i), pairs.type2().size);
    return pair;
}

// The first of the pairs that are added, by their numbers.
class FirstPairs {
  public:
    explicit FirstPairs(const std::size_t limit) : limit_(limit) {}

    // Only pairs with numbers below this can still be among the first.
    std::uint64_t bound() const {
        return pairs_.size() < limit_ ? std::numeric_limits<std::uint64_t>::max()
               : limit_ == 0          ? 0
                                      : pairs_.front().number;
    }

    // Returns whether the pair is among the first so far.
    bool add(const FoundPair& pair) {
        if (pair.number >= bound()) {
            return false;
        }
        if (pairs_.size() == limit_) {
            std::pop_heap(pairs_.begin(), pairs_.end(), earlier);
            pairs_.pop_back();
        }
        pairs_.push_back(pair);
        std::push_heap(pairs_.begin(), pairs_.end(), earlier);
        return true;
    }

    void add(const FirstPairs& others) {
        for (const FoundPair& pair : others.pairs_) {
            add(pair);
        }
    }

    std::size_t limit() const { return limit_; }

    std::vector<FoundPair> in_order() const {
        std::vector<FoundPair> sorted = pairs_;
        std::sort_heap(sorted.begin(), sorted.end(), earlier);
        return sorted;
    }

  private:
    static bool earlier(const FoundPair& one, const FoundPair& other) {
        return one.number < other.number;
    }

    std::size_t limit_;
    std::vector<FoundPair> pairs_; // a heap, the last pair at the front
};

} // namespace talcmp
