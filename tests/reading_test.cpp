// What the predicates read: nothing behind the arrays, nothing behind the first pair that is not
// the same, and never with a write.

#include "talnumericarray_compare.h"

#include "support/element_types.h"
#include "support/protected_memory.h"

#include <gtest/gtest.h>

namespace {

// Tolerances that compare elements in every way there is.
constexpr double tolerances[] = {0.0, -1.0, 10.0, 10.5, 53.0};

// Room for the longest arrays below, of 134 elements, of the widest type.
constexpr std::size_t longest_bytes = 4096;

// `count` threes that end where the memory does.
unsigned char* threes_before_end(const ProtectedMemory& memory, const ElementType& type,
                                 const std::size_t count) {
    auto* const data = static_cast<unsigned char*>(memory.before_end(count * type.size));
    for (std::size_t i = 0; i < count; ++i) {
        type.store(data + i * type.size, 3);
    }
    return data;
}

st_TalDataArray record_of(const ElementType& type, void* data, talint* dimensions) {
    st_TalDataArray record = {};
    record.dims = dimensions;
    record.rank = 1;
    record.data_type = type.id;
    record.nelems = dimensions[0];
    record.data = data;
    return record;
}

TEST(Reading, EndsWithTheArrays) {
    constexpr talint longest = 70;
    const ProtectedMemory memory1(longest_bytes);
    const ProtectedMemory memory2(longest_bytes);
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        for (talint count = 1; count <= longest; ++count) {
            const auto size = static_cast<std::size_t>(count);
            auto record1 = record_of(type1, threes_before_end(memory1, type1, size), &count);
            auto record2 = record_of(type2, threes_before_end(memory2, type2, size), &count);
            for (const double tol : tolerances) {
                EXPECT_EQ(TalNumericArray_sameQ(tol, 1, &record1, &record2), 1) << count;
            }
        }
    });
}

// How many elements of each array can be read behind the first pair that is not the same.
struct Behind {
    std::size_t elements1, elements2;
};

// The arrays go on behind the readable memory.
void expect_to_stop_at(const talint position, const ElementType& type1, const ElementType& type2,
                       const ProtectedMemory& memory1, const ProtectedMemory& memory2) {
    const auto index = static_cast<std::size_t>(position);
    for (const Behind& behind : {Behind{0, 0}, Behind{64, 0}, Behind{0, 64}}) {
        auto* const data1 = threes_before_end(memory1, type1, index + 1 + behind.elements1);
        auto* const data2 = threes_before_end(memory2, type2, index + 1 + behind.elements2);
        type1.store(data1 + index * type1.size, 0);
        talint count = position + 100;
        auto record1 = record_of(type1, data1, &count);
        auto record2 = record_of(type2, data2, &count);
        for (const double tol : tolerances) {
            if (type1.id == type2.id && tol == 0.0) {
                continue; // compared as bytes, of which memcmp may read all
            }
            EXPECT_EQ(TalNumericArray_sameQ(tol, 1, &record1, &record2), 0)
                << "position " << position << ", tolerance " << tol;
        }
    }
}

TEST(Reading, StopsAtTheFirstPairThatIsNotTheSame) {
    constexpr talint positions = 70;
    const ProtectedMemory memory1(longest_bytes);
    const ProtectedMemory memory2(longest_bytes);
    int pairs_with_a_loop = 0;
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        if (type1.id == type2.id && type1.is_integer) {
            return; // compared as bytes under every tolerance
        }
        for (talint position = 0; position < positions; ++position) {
            expect_to_stop_at(position, type1, type2, memory1, memory2);
        }
        ++pairs_with_a_loop;
    });
    EXPECT_EQ(pairs_with_a_loop, 136);
}

// Records, dimensions and elements, all in memory that cannot be written.
TEST(Reading, WritesNothing) {
    constexpr talint count = 40;
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        const ProtectedMemory records_memory(longest_bytes);
        const ProtectedMemory memory1(longest_bytes);
        const ProtectedMemory memory2(longest_bytes);
        auto* const data1 = threes_before_end(memory1, type1, count);
        auto* const data2 = threes_before_end(memory2, type2, count);
        type2.store(data2 + (count - 1) * type2.size, 0);
        auto* const records = static_cast<st_TalDataArray*>(records_memory.before_end(2048));
        auto* const dimensions = static_cast<talint*>(records_memory.before_end(1024));
        dimensions[0] = count;
        dimensions[1] = count;
        records[0] = record_of(type1, data1, dimensions);
        records[1] = record_of(type2, data2, dimensions + 1);
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

// Answers that need no element read none, and none that needs no dimension reads any.
TEST(Reading, LooksAtNothingThatIsNotNeeded) {
    const ProtectedMemory memory(1);
    auto* const unreadable = static_cast<unsigned char*>(memory.before_end(0));
    talint dimensions[] = {4};
    talint other_dimensions[] = {5};
    auto record1 = record_of(element_types[0], unreadable, dimensions);
    auto record2 = record_of(element_types[0], unreadable, other_dimensions);
    EXPECT_EQ(TalNumericArray_sameQ(0, 1, &record1, &record2), 0);
    record2.dims = dimensions;
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
