// What the predicates read: nothing after the arrays, nothing after the first pair that is not
// the same, and never with a write.

#include "talnumericarray_compare.h"

#include "support/array_record.h"
#include "support/element_types.h"
#include "support/emulation.h"
#include "support/protected_memory.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <iterator>
#include <set>
#include <vector>

namespace {

// Tolerances under which elements are compared in every possible way.
constexpr double tolerances[] = {0.0, -1.0, 10.0, 10.5, 53.0};

constexpr std::size_t page = 4096;
constexpr std::size_t longest_block = 128;

// Writes `count` elements of one value that end `phase` bytes before the end of the memory. Returns
// the end of the last one.
unsigned char* fill_before_end(const ProtectedMemory& memory, const std::size_t phase,
                               const ElementType& type, const std::size_t count,
                               const double value) {
    auto* const data = static_cast<unsigned char*>(memory.before_end(phase + count * type.size));
    for (std::size_t i = 0; i < count; ++i) {
        type.store(data + i * type.size, value);
    }
    return data + count * type.size;
}

// ---- Arrays of one value each

struct Filling {
    double value1, value2;
    std::vector<double> same_under;
};

// Threes, and threes beside numbers near three. With complex numbers zeros too: their parts would
// still be the same if too many were read, or if they were taken for parts of the other type.
std::vector<Filling> fillings(const ElementType& type1, const ElementType& type2) {
    if (type1.is_integer && type2.is_integer) {
        return {{3, 3, {0.0, 10.0}}};
    }
    const auto [near1, near2] = near_threes(type1, type2);
    std::vector<Filling> chosen = {{3, 3, {std::begin(tolerances), std::end(tolerances)}},
                                   {near1, near2, {10, 10.5, 53}}};
    if (type1.is_complex() || type2.is_complex()) {
        chosen.push_back({0, 0, {0.0, 10.0}});
    }
    return chosen;
}

// How many bytes after its last element an array's page may end: complex numbers need only be
// aligned as their parts are, so that one may lie in two pages.
std::vector<std::size_t> phases(const ElementType& type) {
    return type.is_complex() ? std::vector<std::size_t>{0, type.part_size}
                             : std::vector<std::size_t>{0};
}

// All positions up to a little beyond the end of two blocks, those around the ends of two pages,
// and some between.
std::vector<std::size_t> positions(const ElementType& type1, const ElementType& type2) {
    std::set<std::size_t> chosen;
    const auto choose = [&chosen](const std::size_t first, const std::size_t last,
                                  const std::size_t step) {
        for (std::size_t position = first; position <= last; position += step) {
            chosen.insert(position);
        }
    };
    choose(0, 2 * longest_block + 2, 1);
    choose(0, 2 * page / std::min(type1.size, type2.size), 97 * emulated_stride);
    for (const ElementType& type : {type1, type2}) {
        for (const std::size_t edge : {page / type.size, 2 * page / type.size}) {
            choose(edge - 2, edge + 2, 1);
        }
    }
    return {chosen.begin(), chosen.end()};
}

// Room for the longest arrays of the widest type, and for two more pages of elements.
class TwoMemories {
  public:
    // The ends of the arrays' last elements.
    struct Ends {
        unsigned char *end1, *end2;
    };

    // Calls `check(ends, filling)` for both arrays filled up to the end of readable memory in every
    // way, with `count` elements and two pages more.
    template <typename Check>
    void for_each_filling(const ElementType& type1, const ElementType& type2,
                          const std::size_t count, const Check& check) const {
        for (const std::size_t phase1 : phases(type1)) {
            for (const std::size_t phase2 : phases(type2)) {
                for (const Filling& filling : fillings(type1, type2)) {
                    const Ends ends = {
                        fill_before_end(memory1_, phase1, type1, count + 2 * page / type1.size,
                                        filling.value1),
                        fill_before_end(memory2_, phase2, type2, count + 2 * page / type2.size,
                                        filling.value2)};
                    check(ends, filling);
                }
            }
        }
    }

  private:
    static constexpr std::size_t widest = 16;
    static constexpr std::size_t bytes = (2 * page + 3) * widest + 3 * page;

    ProtectedMemory memory1_{bytes};
    ProtectedMemory memory2_{bytes};
};

// All tolerances under which the elements are the same; where only some steps are made,
// neighbouring ones take turns.
std::vector<double> tolerances_of_step(const Filling& filling, const std::size_t step) {
    const std::vector<double>& all = filling.same_under;
    const std::size_t stride = std::min(emulated_stride, all.size());
    std::vector<double> chosen;
    for (std::size_t i = step % stride; i < all.size(); i += stride) {
        chosen.push_back(all[i]);
    }
    return chosen;
}

TEST(Reading, EndsWithTheArrays) {
    const TwoMemories memories;
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        const std::vector<std::size_t> counts = positions(type1, type2);
        const auto check = [&](const TwoMemories::Ends& ends, const Filling& filling) {
            for (const std::size_t count : counts) {
                const ArrayRecord array1(type1.id, ends.end1 - count * type1.size, count);
                const ArrayRecord array2(type2.id, ends.end2 - count * type2.size, count);
                for (const double tol : tolerances_of_step(filling, count)) {
                    EXPECT_EQ(TalNumericArray_sameQ(tol, 1, array1.handle(), array2.handle()), 1)
                        << count << " elements, tolerance " << tol;
                }
            }
        };
        memories.for_each_filling(type1, type2, counts.back(), check);
    });
}

// How many elements of each array can be read after the first pair that is not the same.
struct After {
    std::size_t elements1, elements2;
};

// In at least one of the arrays, what can be read ends within the page of that pair. In the course
// of the runs the pair gets to every place in a page.
std::vector<After> readable_after(const ElementType& type1, const ElementType& type2,
                                  const std::size_t run) {
    const std::size_t in_page1 = page / type1.size;
    const std::size_t in_page2 = page / type2.size;
    const std::size_t some1 = run * 5 % in_page1;
    const std::size_t some2 = (run * 11 + run / 64) % in_page2;
    const std::size_t more1 = in_page1 + some1;
    const std::size_t more2 = in_page2 + some2;
    return {{0, 0}, {0, more2}, {more1, 0}, {some1, some2}, {some1, more2}, {more1, some2}};
}

// By their counts, the arrays go on after the readable memory.
void expect_to_stop_at(const std::size_t position, const ElementType& type1,
                       const ElementType& type2, const TwoMemories::Ends& ends,
                       const Filling& filling, const After& readable) {
    unsigned char* const last1 = ends.end1 - (readable.elements1 + 1) * type1.size;
    unsigned char* const last2 = ends.end2 - (readable.elements2 + 1) * type2.size;
    const std::size_t count = position + 4 * page;
    const ArrayRecord array1(type1.id, last1 - position * type1.size, count);
    const ArrayRecord array2(type2.id, last2 - position * type2.size, count);
    type1.store(last1, filling.value1 == 0 ? 3 : 0);
    for (const double tol : tolerances_of_step(filling, position)) {
        if (type1.id == type2.id && tol == 0.0) {
            continue; // compared as bytes, of which memcmp may read all
        }
        EXPECT_EQ(TalNumericArray_sameQ(tol, 1, array1.handle(), array2.handle()), 0)
            << "position " << position << ", tolerance " << tol << ", after it "
            << readable.elements1 << " and " << readable.elements2;
    }
    type1.store(last1, filling.value1);
}

TEST(Reading, StopsAtTheFirstPairThatIsNotTheSame) {
    const TwoMemories memories;
    int pairs_with_a_loop = 0;
    std::size_t runs = 0;
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        if (type1.id == type2.id && type1.is_integer) {
            return; // compared as bytes under every tolerance
        }
        const std::vector<std::size_t> places = positions(type1, type2);
        const auto check = [&](const TwoMemories::Ends& ends, const Filling& filling) {
            for (const std::size_t position : places) {
                const std::vector<After> all = readable_after(type1, type2, runs);
                const std::size_t stride = std::min(emulated_stride, all.size());
                for (std::size_t i = runs % stride; i < all.size(); i += stride) {
                    expect_to_stop_at(position, type1, type2, ends, filling, all[i]);
                }
                ++runs;
            }
        };
        memories.for_each_filling(type1, type2, places.back(), check);
        ++pairs_with_a_loop;
    });
    EXPECT_EQ(pairs_with_a_loop, 136);
}

// Sevens everywhere, except for one eight: an element taken from a wrong place is a seven.
TEST(Reading, FindsEachElementOfShortArraysAcrossPages) {
    constexpr talint longest = 16;
    constexpr std::size_t in_page = page / sizeof(float);
    alignas(page) static float memory1[2 * in_page];
    alignas(page) static float memory2[2 * in_page];
    std::fill(std::begin(memory1), std::end(memory1), 7.0F);
    std::fill(std::begin(memory2), std::end(memory2), 7.0F);
    const ElementType& type = element_types[REAL32_TYPE - 1];
    for (talint count = 2; count <= longest; ++count) {
        for (talint before_edge = 0; before_edge <= count; ++before_edge) {
            float* const across = memory1 + in_page - before_edge;
            float* const within = memory2 + in_page / 2;
            auto record1 = record_of(type.id, across, count);
            auto record2 = record_of(type.id, within, count);
            for (talint position = 0; position < count; ++position) {
                within[position] = 8;
                EXPECT_EQ(TalNumericArray_sameQ(10, 1, &record1, &record2), 0)
                    << position << " of " << count << ", " << before_edge << " before the edge";
                EXPECT_EQ(TalNumericArray_sameQ(10, 1, &record2, &record1), 0)
                    << position << " of " << count << ", " << before_edge << " before the edge";
                within[position] = 7;
            }
        }
    }
}

// Records, dimensions and elements, all in memory that cannot be written.
TEST(Reading, WritesNothing) {
    constexpr talint count = 40;
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        const ProtectedMemory records_memory(page);
        const ProtectedMemory memory1(page);
        const ProtectedMemory memory2(page);
        auto* const data1 = fill_before_end(memory1, 0, type1, count, 3) - count * type1.size;
        auto* const data2 = fill_before_end(memory2, 0, type2, count, 3) - count * type2.size;
        type2.store(data2 + (count - 1) * type2.size, 0);
        auto* const records = static_cast<st_TalDataArray*>(records_memory.before_end(2048));
        auto* const lengths = static_cast<talint*>(records_memory.before_end(1024));
        lengths[0] = count;
        lengths[1] = count;
        records[0] = record_of(type1.id, data1, lengths[0]);
        records[1] = record_of(type2.id, data2, lengths[1]);
        for (const ProtectedMemory* memory : {&records_memory, &memory1, &memory2}) {
            memory->make_read_only();
        }
        for (const double tol : tolerances) {
            EXPECT_EQ(TalNumericArray_sameQ(tol, 1, &records[0], &records[1]), 0);
            EXPECT_EQ(TalNumericArray_sameQ(tol, 0, &records[0], &records[0]), 1);
        }
        EXPECT_EQ(TalNumericArray_equivalentQ(&records[0], &records[1]),
                  type1.id == type2.id ? 1 : 0);
    });
}

// Answers that need no element read none, and those that need no dimension read no dimension.
TEST(Reading, LooksAtNothingThatIsNotNeeded) {
    const ProtectedMemory memory(1);
    auto* const unreadable = static_cast<unsigned char*>(memory.before_end(0));
    talint length = 4;
    talint other_length = 5;
    auto record1 = record_of(BIT8_TYPE, unreadable, length);
    auto record2 = record_of(BIT8_TYPE, unreadable, other_length);
    EXPECT_EQ(TalNumericArray_sameQ(0, 1, &record1, &record2), 0);
    record2.dims = &length;
    EXPECT_EQ(TalNumericArray_equivalentQ(&record1, &record2), 1);
    record2.data_type = REAL64_TYPE;
    EXPECT_EQ(TalNumericArray_sameQ(0, 0, &record1, &record2), 0);
    record2.data_type = 13;
    EXPECT_EQ(TalNumericArray_sameQ(0, 1, &record1, &record2), 0);
    record2.dims = reinterpret_cast<talint*>(unreadable);
    EXPECT_EQ(TalNumericArray_equivalentQ(&record1, &record2), 0);
    record2.rank = 2;
    EXPECT_EQ(TalNumericArray_sameQ(0, 1, &record1, &record2), 0);
}

} // namespace
