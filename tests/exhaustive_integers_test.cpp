// Integers of up to 16 bits: all values against all values. The suites whose names begin with
// Exhaustive take up to a minute each, those of one type because they call memcmp 2^32 times.

#include "talnumericarray_compare.h"
#include "talnumericarray_sameq_impl.h"

#include "support/array_record.h"
#include "support/type_pairs.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>

namespace {

// Calls `answer` for every pair of values and returns how many answers are wrong.
template <typename T1, typename T2, typename Answer>
std::uint64_t wrong_answers(const Answer& answer) {
    T1 element1 = 0;
    T2 element2 = 0;
    const ArrayRecord array1(element_type_id<T1>, &element1, 1);
    const ArrayRecord array2(element_type_id<T2>, &element2, 1);
    std::uint64_t wrong = 0;
    std::uint64_t answers = 0;
    for (int value1 = std::numeric_limits<T1>::min(); value1 <= std::numeric_limits<T1>::max();
         ++value1) {
        element1 = static_cast<T1>(value1);
        for (int value2 = std::numeric_limits<T2>::min(); value2 <= std::numeric_limits<T2>::max();
             ++value2) {
            element2 = static_cast<T2>(value2);
            const int expected = value1 == value2 ? 1 : 0;
            wrong += answer(array1.handle(), array2.handle()) != expected ? 1U : 0U;
            ++answers;
        }
    }
    EXPECT_EQ(answers, std::uint64_t{1} << (8 * (sizeof(T1) + sizeof(T2))));
    return wrong;
}

using IntegersOf8Bits = type_list<BIT8, UBIT8>;
using IntegersOf16Bits = type_list<BIT16, UBIT16>;

template <typename Types1, typename Types2>
void expect_right_answers(const Types1 types1, const Types2 types2) {
    for_each_type_of(
        [&](auto tag1) {
            for_each_type_of(
                [&](auto tag2) {
                    using T1 = typename decltype(tag1)::type;
                    using T2 = typename decltype(tag2)::type;
                    const auto answer = [](TalNumericArray na1, TalNumericArray na2) {
                        return TalNumericArray_sameQ(10, 1, na1, na2);
                    };
                    EXPECT_EQ((wrong_answers<T1, T2>(answer)), 0U)
                        << element_type_id<T1> << " and " << element_type_id<T2>;
                },
                types2);
        },
        types1);
}

TEST(AllValues, Of8BitsAgainst8Bits) {
    expect_right_answers(IntegersOf8Bits{}, IntegersOf8Bits{});
}

TEST(AllValues, Of8BitsAgainst16Bits) {
    expect_right_answers(IntegersOf8Bits{}, IntegersOf16Bits{});
}

TEST(AllValues, Of16BitsAgainst8Bits) {
    expect_right_answers(IntegersOf16Bits{}, IntegersOf8Bits{});
}

// Below the checks of shape and type, which have no values to try.
template <typename T1, typename T2>
std::uint64_t wrong_answers_of_pair_routine() {
    return wrong_answers<T1, T2>([](TalNumericArray na1, TalNumericArray na2) {
        const talreal tol = 10;
        return TalNumericArray_sameQ_impl<T1, T2>(tol, na1, na2);
    });
}

TEST(ExhaustiveAllValuesOf16Bits, SignedAgainstSigned) {
    EXPECT_EQ((wrong_answers_of_pair_routine<BIT16, BIT16>()), 0U);
}

TEST(ExhaustiveAllValuesOf16Bits, SignedAgainstUnsigned) {
    EXPECT_EQ((wrong_answers_of_pair_routine<BIT16, UBIT16>()), 0U);
}

TEST(ExhaustiveAllValuesOf16Bits, UnsignedAgainstSigned) {
    EXPECT_EQ((wrong_answers_of_pair_routine<UBIT16, BIT16>()), 0U);
}

TEST(ExhaustiveAllValuesOf16Bits, UnsignedAgainstUnsigned) {
    EXPECT_EQ((wrong_answers_of_pair_routine<UBIT16, UBIT16>()), 0U);
}

} // namespace
