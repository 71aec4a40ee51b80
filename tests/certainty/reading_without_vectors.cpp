// What the loops read without vectors: nothing after the first pair that is not the same.

#include "support/loops.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#if defined(__SANITIZE_ADDRESS__)
#    include <sanitizer/asan_interface.h>
#endif

namespace {

void set_poisoned([[maybe_unused]] const bool poisoned, [[maybe_unused]] unsigned char* const begin,
                  [[maybe_unused]] const std::size_t size) {
#if defined(__SANITIZE_ADDRESS__)
    (poisoned ? __asan_poison_memory_region : __asan_unpoison_memory_region)(begin, size);
#endif
}

// Elements after a pair that differs, which a sanitizer forbids reading.
class Poison {
  public:
    Poison(unsigned char* const begin, unsigned char* const end)
        : begin_(begin), size_(static_cast<std::size_t>(end - begin)) {
        set_poisoned(true, begin_, size_);
    }
    Poison(const Poison&) = delete;
    Poison& operator=(const Poison&) = delete;
    ~Poison() { set_poisoned(false, begin_, size_); }

  private:
    unsigned char* begin_;
    std::size_t size_;
};

TEST(Loops, WithoutVectorsReadNothingAfterTheFirstDifference) {
    if (!address_sanitizer) {
        GTEST_SKIP() << "NOT TESTED: only a sanitizer notices single bytes that are read";
    }
    constexpr std::size_t count = 70;
    for_each_pair_with_a_loop([&](const Pair& pair) {
        const auto plain =
            std::find_if(pair.loops.begin(), pair.loops.end(),
                         [](const LoopOfSets& loop) { return loop.sets == without_vectors; });
        ASSERT_NE(plain, pair.loops.end());
        std::vector<unsigned char> data1 = sevens(pair.type1, count);
        std::vector<unsigned char> data2 = sevens(pair.type2, count);
        for (const double tol : {-1.0, 10.0}) {
            for (std::size_t index = 0; index < count; ++index) {
                unsigned char* const element2 = data2.data() + index * pair.type2.size;
                pair.type2.store(element2, 9);
                {
                    const Poison after1(data1.data() + (index + 1) * pair.type1.size,
                                        data1.data() + data1.size());
                    const Poison after2(element2 + pair.type2.size, data2.data() + data2.size());
                    remember(factors_of(tol));
                    EXPECT_FALSE(plain->loop(tol, data1.data(), data2.data(), count)) << index;
                }
                pair.type2.store(element2, 7);
            }
        }
    });
}

} // namespace
