// Places in two arrays, with what stands there.

#ifndef TALCMP_PLACES_H
#define TALCMP_PLACES_H

#include "pairs.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

namespace talcmp {

// A pair of elements. The values are kept, as an array may come but once.
struct Place {
    std::uint64_t order = 0;    // position in row-major order, in the first array
    std::uint64_t position = 0; // in the first array as it is stored
    std::array<unsigned char, 16> element1 = {};
    std::array<unsigned char, 16> element2 = {};
};

inline Place place_of(const Pairs& pairs, const std::size_t i, const std::uint64_t order,
                      const std::uint64_t position) {
    Place place;
    place.order = order;
    place.position = position;
    std::memcpy(place.element1.data(), pairs.element1(i), pairs.type1().size);
    std::memcpy(place.element2.data(), pairs.element2(i), pairs.type2().size);
    return place;
}

// The first places of those that are shown to it, in row-major order.
class FirstPlaces {
  public:
    explicit FirstPlaces(const std::size_t limit) : limit_(limit) {}

    // Only places below it can still be among the first.
    std::uint64_t bound() const {
        return places_.size() < limit_ ? std::numeric_limits<std::uint64_t>::max()
               : limit_ == 0           ? 0
                                       : places_.front().order;
    }

    // Returns whether the place is among the first so far.
    bool add(const Place& place) {
        if (place.order >= bound()) {
            return false;
        }
        if (places_.size() == limit_) {
            std::pop_heap(places_.begin(), places_.end(), earlier);
            places_.pop_back();
        }
        places_.push_back(place);
        std::push_heap(places_.begin(), places_.end(), earlier);
        return true;
    }

    void add(const FirstPlaces& others) {
        for (const Place& place : others.places_) {
            add(place);
        }
    }

    std::vector<Place> in_order() const {
        std::vector<Place> sorted = places_;
        std::sort_heap(sorted.begin(), sorted.end(), earlier);
        return sorted;
    }

  private:
    static bool earlier(const Place& one, const Place& other) { return one.order < other.order; }

    std::size_t limit_;
    std::vector<Place> places_; // a heap, the last place at the front
};

} // namespace talcmp

#endif
