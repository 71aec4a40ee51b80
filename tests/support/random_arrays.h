// Random tolerances and pairs of arrays that are hard to compare: most positions hold the same
// number, and the others lie within a few units of the last place of the limit.

#ifndef TALNUMERICARRAY_TESTS_RANDOM_ARRAYS_H
#define TALNUMERICARRAY_TESTS_RANDOM_ARRAYS_H

#include <array>
#include <cstddef>
#include <cstdint>
#include <random>

namespace oracle {

// Draws that are alike with every standard library, unlike those of its distributions.
class Random {
  public:
    explicit Random(std::uint64_t seed) : engine_(seed) {}

    std::uint64_t bits() { return engine_(); }
    std::uint32_t below(std::uint32_t bound) {
        return static_cast<std::uint32_t>(bits() >> 32) % bound;
    }
    bool one_in(std::uint32_t bound) { return below(bound) == 0; }
    int between(int low, int high) {
        return low + static_cast<int>(below(static_cast<std::uint32_t>(high - low + 1)));
    }
    double unit() { return static_cast<double>(bits() >> 11) * 0x1p-53; }

    template <typename T, std::size_t size>
    T pick(const T (&values)[size]) {
        return values[below(static_cast<std::uint32_t>(size))];
    }

  private:
    std::mt19937_64 engine_;
};

// Returns to its last tolerances more often than not, so that cached factors are met again.
class RandomTolerances {
  public:
    double next(Random& random);

  private:
    std::array<double, 4> recent_{{53, 24, 52.5, 23.5}};
};

double random_tolerance(Random& random);

// 1..largest_count, mostly short.
constexpr std::int32_t largest_count = 200;
std::int32_t random_count(Random& random);

// Writes `count` elements of each type. The blocks may have any alignment.
void fill_arrays(Random& random, double tolerance, int first_id, int second_id, std::int32_t count,
                 void* first, void* second);

} // namespace oracle

#endif
