// What the predicates read: nothing behind the arrays, nothing behind the first pair that is not
// the same, and never with a write.

#include "talnumericarray_compare.h"

#include "support/element_pairs.h"
#include "support/protected_memory.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <limits>

namespace {

// Equal and different values, tolerances that compare elements in every way there is.
constexpr double tolerances[] = {0.0, -1.0, 10.0, 10.5, 53.0};

// Room for the longest arrays below, of 134 elements, of the widest type.
constexpr std::size_t longest_bytes = 4096;

template <typename T>
T* fill(T* elements, const std::size_t count, const T value) {
    std::fill_n(elements, count, value);
    return elements;
}

template <typename T>
st_TalDataArray record_of(T* elements, talint* dimensions) {
    st_TalDataArray record = {};
    record.dims = dimensions;
    record.rank = 1;
    record.data_type = element_type_id<T>;
    record.nelems = dimensions[0];
    record.data = elements;
    return record;
}

TEST(Reading, EndsWithTheArrays) {
    constexpr talint longest = 70;
    const ProtectedMemory memory1(longest_bytes);
    const ProtectedMemory memory2(longest_bytes);
    for_each_pair([&](const auto tag1, const auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        for (talint count = 1; count <= longest; ++count) {
            const auto size = static_cast<std::size_t>(count);
            auto* const data1 = static_cast<T1*>(memory1.before_end(size * sizeof(T1)));
            auto* const data2 = static_cast<T2*>(memory2.before_end(size * sizeof(T2)));
            auto record1 = record_of(fill(data1, size, T1(3)), &count);
            auto record2 = record_of(fill(data2, size, T2(3)), &count);
            for (const double tol : tolerances) {
                EXPECT_EQ(TalNumericArray_sameQ(tol, 1, &record1, &record2), 1) << count;
            }
        }
    });
}

// The first pair that is not the same lies at the end of the readable memory, on one side or both;
// the arrays go on behind it.
template <typename T1, typename T2>
void expect_to_stop_at(const talint position, const ProtectedMemory& memory1,
                       const ProtectedMemory& memory2) {
    constexpr std::size_t behind = 64;
    const auto readable = static_cast<std::size_t>(position) + 1;
    struct Lengths {
        std::size_t behind1, behind2;
    };
    for (const auto& [behind1, behind2] : {Lengths{0, 0}, Lengths{behind, 0}, Lengths{0, behind}}) {
        const std::size_t length1 = readable + behind1;
        const std::size_t length2 = readable + behind2;
        auto* const data1 = static_cast<T1*>(memory1.before_end(length1 * sizeof(T1)));
        auto* const data2 = static_cast<T2*>(memory2.before_end(length2 * sizeof(T2)));
        fill(data1, length1, T1(3));
        fill(data2, length2, T2(3));
        data1[position] = T1(0);
        talint count = position + 100;
        auto record1 = record_of(data1, &count);
        auto record2 = record_of(data2, &count);
        for (const double tol : tolerances) {
            if (std::is_same_v<T1, T2> && tol == 0.0) {
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
    for_each_pair([&](const auto tag1, const auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        if constexpr (!(std::is_same_v<T1, T2> && std::is_integral_v<T1>)) {
            for (talint position = 0; position < positions; ++position) {
                expect_to_stop_at<T1, T2>(position, memory1, memory2);
            }
            ++pairs_with_a_loop;
        }
    });
    EXPECT_EQ(pairs_with_a_loop, 136) << "all but the integer types against themselves";
}

// Records, dimensions and elements, all in memory that cannot be written.
TEST(Reading, WritesNothing) {
    constexpr talint count = 40;
    for_each_pair([&](const auto tag1, const auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        const ProtectedMemory memory(4096);
        auto* const records = static_cast<st_TalDataArray*>(memory.before_end(4096));
        auto* const dimensions = static_cast<talint*>(memory.before_end(3072));
        auto* const data1 = static_cast<T1*>(memory.before_end(2048));
        auto* const data2 = static_cast<T2*>(memory.before_end(1024));
        dimensions[0] = count;
        dimensions[1] = count;
        records[0] = record_of(fill(data1, count, T1(3)), dimensions);
        records[1] = record_of(fill(data2, count, T2(3)), dimensions + 1);
        data2[count - 1] = T2(0);
        memory.make_read_only();
        for (const double tol : tolerances) {
            EXPECT_EQ(TalNumericArray_sameQ(tol, 1, &records[0], &records[1]), 0);
            EXPECT_EQ(TalNumericArray_sameQ(tol, 0, &records[0], &records[0]), 1);
        }
        EXPECT_EQ(TalNumericArray_equivalentQ(&records[0], &records[1]),
                  (std::is_same_v<T1, T2> ? 1 : 0));
    });
}

// Answers that need no element read none, and none that needs no dimension reads any.
TEST(Reading, LooksAtNothingThatIsNotNeeded) {
    const ProtectedMemory memory(1);
    auto* const unreadable = static_cast<unsigned char*>(memory.before_end(0));
    talint dimensions[] = {4};
    talint other_dimensions[] = {5};
    auto record1 = record_of(unreadable, dimensions);
    auto record2 = record_of(unreadable, other_dimensions);
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
