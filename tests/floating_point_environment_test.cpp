// What a comparison changes in the floating-point environment: it may raise status flags, and
// changes nothing else. Nor does it touch errno.

#include "support/arrays.h"
#include "support/child_process.h"
#include "support/floating_point_modes.h"
#include "support/prepared_calls.h"
#include "support/random_arrays.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cfenv>
#include <cmath>
#include <csignal>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <functional>
#include <limits>
#include <vector>

namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();
constexpr double largest = std::numeric_limits<double>::max();
constexpr double subnormal = 1e-310;

std::uint64_t modes() {
    return control_word() & ~status_flags;
}

// ---- What the arithmetic obeys

void expect_modes_kept(const PreparedCalls& prepared) {
    const std::uint64_t modes_before = modes();
    const int rounding_before = std::fegetround();
    const int traps_before = ::fegetexcept();
    EXPECT_EQ(prepared.wrong_answers(), 0);
    EXPECT_EQ(modes(), modes_before);
    EXPECT_EQ(std::fegetround(), rounding_before);
    EXPECT_EQ(::fegetexcept(), traps_before);
}

TEST(FloatingPointModes, AreKept) {
    const PreparedCalls prepared;
    for (const Rounding& rounding : roundings) {
        SCOPED_TRACE(rounding.name);
        const RoundingScope scope(rounding);
        expect_modes_kept(prepared);
        const FlushingScope flushing_scope;
        expect_modes_kept(prepared);
    }
}

// No comparison divides by zero. A processor without traps sets none.
TEST(FloatingPointModes, AreKeptWithATrapSet) {
    const PreparedCalls prepared;
    ::feenableexcept(FE_DIVBYZERO);
    expect_modes_kept(prepared);
    ::fedisableexcept(FE_DIVBYZERO);
}

TEST(Errno, IsKept) {
    const PreparedCalls prepared;
    for (const int before : {0, ERANGE, EDOM}) {
        errno = before;
        const int wrong = prepared.wrong_answers();
        EXPECT_EQ(errno, before);
        EXPECT_EQ(wrong, 0);
    }
}

// ---- Status flags

TEST(StatusFlags, AreNeverCleared) {
    const PreparedCalls prepared;
    for (const PreparedCall& call : prepared.calls()) {
        std::feraiseexcept(FE_ALL_EXCEPT);
        wrong_answers_to(call);
        ASSERT_EQ(std::fetestexcept(FE_ALL_EXCEPT), FE_ALL_EXCEPT);
        std::feclearexcept(FE_ALL_EXCEPT);
    }
}

// The flags that a new thread's first comparison raises, for arrays of `count` elements.
using FlagsOf = std::function<int(std::size_t count)>;

// The flags for two arrays that hold one value each.
template <typename T1, typename T2>
FlagsOf flags_of(const double tol, const T1 value1, const T2 value2) {
    return [=](const std::size_t count) {
        const Array<T1> array1({static_cast<talint>(count)}, std::vector<T1>(count, value1));
        const Array<T2> array2({static_cast<talint>(count)}, std::vector<T2>(count, value2));
        int flags = 0;
        in_new_thread([&] {
            std::feclearexcept(FE_ALL_EXCEPT);
            sameQ(tol, array1, array2);
            flags = std::fetestexcept(FE_ALL_EXCEPT);
        });
        return flags;
    };
}

// Clang's comparison instructions find nothing invalid in a NaN, except in code that it vectorises.
#if defined(__clang__)
constexpr int invalid_of_nan = 0;
#else
constexpr int invalid_of_nan = FE_INVALID;
#endif

struct FlagCase {
    const char* name;
    FlagsOf flags_of;
    int always;
    int at_most;         // by a single element
    int at_most_in_many; // and by many, which are compared in blocks
};

constexpr int inexact = FE_INEXACT;
constexpr int invalid = FE_INVALID | FE_INEXACT;
constexpr int too_large = FE_OVERFLOW | FE_INEXACT;
constexpr int too_small = FE_UNDERFLOW | FE_INEXACT;

const FlagCase flag_cases[] = {
    {"integers", flags_of(10, 5, std::int64_t{6}), 0, 0, 0},
    {"bits", flags_of(0, nan, nan), 0, 0, 0},
    {"equal", flags_of(10, 1.0, 1.0), 0, 0, inexact},
    {"zero", flags_of(10, 0.0, 1.0), 0, 0, inexact},
    {"near", flags_of(10, 1.0, 1 + 0x1p-44), 0, 0, inexact},
    {"near, fractional tolerance", flags_of(10.5, 1.0, 1 + 0x1p-44), inexact, inexact, inexact},
    {"vanishing beside the other", flags_of(10, 1.0, 1e-17), inexact, inexact, inexact},
    {"integer beside a single", flags_of(10, 16777217, 16777216.0F), inexact, inexact, inexact},
    {"largest, of both signs", flags_of(10, largest, -largest), 0, 0, too_large},
    {"subnormal", flags_of(10, subnormal, subnormal), 0, 0, inexact},
    {"subnormal difference, fractional tolerance",
     flags_of(10.5, 0x1p-1022, 0x1.0000000000003p-1022), 0, too_small, too_small},
    {"tolerance beyond singles", flags_of(1e300, 1.0F, 2.0F), too_large, too_large, too_large},
    {"tolerance below singles", flags_of(1e-300, 1.0F, 2.0F), too_small, too_small, too_small},
    {"infinities", flags_of(53, infinity, infinity), 0, 0, invalid},
    {"NaN", flags_of(10, nan, 1.0), invalid_of_nan, invalid, invalid},
    {"NaN as tolerance", flags_of(nan, 1.0, 1.25), invalid_of_nan, invalid, invalid},
};

TEST(StatusFlags, AreRaisedAsDocumented) {
    constexpr std::size_t one = 1;
    constexpr std::size_t many = 300;
    for (const FlagCase& flag_case : flag_cases) {
        for (const std::size_t count : {one, many}) {
            const int flags = flag_case.flags_of(count);
            const int at_most = count == one ? flag_case.at_most : flag_case.at_most_in_many;
            EXPECT_EQ(flags & flag_case.always, flag_case.always) << flag_case.name << ' ' << count;
            EXPECT_EQ(flags & ~at_most, 0) << flag_case.name << ' ' << count;
        }
    }
}

template <typename T>
bool are_finite_parts(const unsigned char* bytes, const std::size_t size) {
    T part = 0;
    for (std::size_t offset = 0; offset < size; offset += sizeof part) {
        std::memcpy(&part, bytes + offset, sizeof part);
        if (!std::isfinite(part)) {
            return false;
        }
    }
    return true;
}

bool are_finite(const ElementType& type, AnyArray& array, const talint count) {
    const std::size_t size = static_cast<std::size_t>(count) * type.size;
    return type.is_integer
           || (type.holds_doubles() ? are_finite_parts<double>(array.bytes(), size)
                                    : are_finite_parts<float>(array.bytes(), size));
}

const ElementType& random_type(oracle::Random& random) {
    return element_types[random.below(static_cast<std::uint32_t>(element_types.size()))];
}

TEST(StatusFlags, NeverSayDivisionByZeroNorInvalidOfFiniteNumbers) {
    constexpr int calls = 100000;
    constexpr std::uint64_t seed = 1;
    oracle::Random random(seed);
    int raised_of_finite = 0;
    int raised_of_others = 0;
    for (int call = 0; call < calls; ++call) {
        const double tol = oracle::random_tolerance(random);
        const ElementType& type1 = random_type(random);
        const ElementType& type2 = random_type(random);
        const talint count = random.one_in(8) ? oracle::largest_count : random.between(1, 5);
        AnyArray array1(type1, std::vector<int>(static_cast<std::size_t>(count)));
        AnyArray array2(type2, std::vector<int>(static_cast<std::size_t>(count)));
        oracle::fill_arrays(random, tol, type1.id, type2.id, count, array1.bytes(), array2.bytes());
        std::feclearexcept(FE_ALL_EXCEPT);
        TalNumericArray_sameQ(tol, 1, array1.handle(), array2.handle());
        const int flags = std::fetestexcept(FE_ALL_EXCEPT);
        const bool all_finite = !std::isnan(tol) && are_finite(type1, array1, count)
                                && are_finite(type2, array2, count);
        (all_finite ? raised_of_finite : raised_of_others) |= flags;
    }
    EXPECT_EQ(raised_of_finite, FE_OVERFLOW | FE_UNDERFLOW | FE_INEXACT);
    EXPECT_EQ(raised_of_others, FE_INVALID | FE_OVERFLOW | FE_UNDERFLOW | FE_INEXACT);
}

// ---- Traps

class Traps : public testing::Test {
  protected:
    void SetUp() override {
        const auto divide_by_zero = [] {
            const volatile double zero = 0;
            const volatile double quotient = 1 / zero;
            return std::isinf(quotient) ? 0 : 1;
        };
        if (!(with_traps(FE_DIVBYZERO, divide_by_zero) == killed_by(SIGFPE))) {
            GTEST_SKIP() << "NOT TESTED: floating-point arithmetic does not trap here";
        }
    }

    template <typename Body>
    static ChildEnd with_traps(const int flags, const Body& body) {
        return in_child([&]() -> int {
            std::signal(SIGFPE, SIG_DFL); // sanitizers catch it
            std::feclearexcept(FE_ALL_EXCEPT);
            ::feenableexcept(flags);
            return body();
        });
    }
};

TEST_F(Traps, FindNothingButInexactResultsAmongOrdinaryNumbers) {
    const PreparedCalls prepared;
    const auto compare = [&prepared] {
        int wrong = 0;
        for (const PreparedCall& call : prepared.calls()) {
            wrong += std::isnan(call.tol) ? 0 : wrong_answers_to(call);
        }
        return wrong == 0 ? 0 : 1;
    };
    EXPECT_EQ(with_traps(FE_INVALID | FE_DIVBYZERO | FE_OVERFLOW | FE_UNDERFLOW, compare), success);
    EXPECT_EQ(with_traps(FE_INEXACT, compare), killed_by(SIGFPE));
}

TEST_F(Traps, FindANaNWhereItIsInvalid) {
    const Array<double> array1{nan};
    const Array<double> array2{1};
    const auto compare = [&] { return sameQ(10, array1, array2); };
    const ChildEnd end = with_traps(FE_INVALID, compare);
    EXPECT_TRUE(end == killed_by(SIGFPE) || (invalid_of_nan == 0 && end == success)) << end;
    EXPECT_EQ(with_traps(FE_DIVBYZERO, compare), success);
}

} // namespace
