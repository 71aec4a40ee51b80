// Which pairs the vectors of every instruction set, and the test without vectors, call certainly
// the same: only those that the element test finds the same, and all of those that are beyond
// doubt.

#include "support/module_templates.h"

#include "support/checked_calls.h"
#include "support/loops.h"
#include "support/random_arrays.h"
#include "support/type_pairs.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <type_traits>

namespace {

// Equal pairs, among which one drawn pair is put.
template <typename T1, typename T2>
class Sevens {
  public:
    static constexpr std::size_t most = 64;

    Sevens() {
        for (std::size_t i = 0; i < most; ++i) {
            reset(i);
        }
    }

    void reset(const std::size_t index) {
        data1_[index] = 7;
        data2_[index] = 7;
    }

    void draw(oracle::Random& random, const double tol, const std::size_t index) {
        oracle::draw_elements(random, tol, element_type_id<T1>, element_type_id<T2>,
                              !random.one_in(4), &data1_[index], &data2_[index]);
    }

    const T1* data1() const { return data1_; }
    const T2* data2() const { return data2_; }

  private:
    // Each in one page.
    alignas(2048) T1 data1_[most] = {};
    alignas(2048) T2 data2_[most] = {};
};

// Whether a pair is the same by the element rule, and if so, whether every set must be certain of
// it.
struct Ruling {
    bool same;
    bool beyond_doubt;
};

// Whether the ruling allows a set to be certain, or in doubt, as it was. Compiled once, unlike the
// loops, which are compiled for each pair of types.
bool follows_rule(const Ruling& ruling, const char* const set, const bool certain) {
    const bool follows = certain ? ruling.same : !(ruling.same && ruling.beyond_doubt);
    EXPECT_TRUE(follows) << set << " is " << (certain ? "certain" : "in doubt")
                         << " of a pair that is " << (ruling.same ? "" : "not ") << "the same";
    return follows;
}

// The index of the drawn pair among `count` pairs.
struct Place {
    std::size_t index, count;
};

// Integers are passed over only by vectors.
template <typename Set, typename Bound, typename T1, typename T2>
bool as_ruled_by(const Ruling& ruling, const Bound bound, const Sevens<T1, T2>& sevens,
                 const Place& place) {
    if constexpr (std::is_floating_point_v<talnumericarray::comparison_t<
                      T1, T2>> || Set::template has_loop<Bound, T1, T2>) {
        if (Set::supported()) {
            const std::size_t passed = talnumericarray::certain_prefix_by_best_set(
                type_list<Set>{}, bound, sevens.data1(), sevens.data2(), place.count);
            EXPECT_LE(passed, place.count);
            return follows_rule(ruling, Set::name, passed > place.index);
        }
    }
    return true;
}

template <typename Bound, typename T1, typename T2, typename... Sets>
bool as_ruled(type_list<Sets...> /*sets*/, const Ruling& ruling, const Bound bound,
              const Sevens<T1, T2>& sevens, const Place& place) {
    return as_ruled_by<talnumericarray::none>(ruling, bound, sevens, place)
           && (... && as_ruled_by<Sets>(ruling, bound, sevens, place));
}

// Whether two finite numbers of one sign are no further from each other than a quarter of the
// tolerance's limit, so that rounding plays no part.
template <typename T>
bool clearly_near(const T x, const T y, const double factor) {
    return std::isfinite(x) && std::isfinite(y) && (x < 0) == (y < 0)
           && std::fabs(static_cast<long double>(x) - static_cast<long double>(y))
                  <= static_cast<long double>(std::fabs(y)) * static_cast<long double>(factor) / 4;
}

double drawn_tolerance(oracle::Random& random, const int bits) {
    const double marks[] = {-1,         0,           1e-46,
                            0.5,        10.5,        bits - 0.5,
                            1.0 * bits, bits + 10.0, std::numeric_limits<double>::quiet_NaN()};
    switch (random.below(4)) {
    case 0:
        return random.pick(marks);
    case 1:
        return bits - 1 + random.unit();
    case 2:
        return bits * random.unit();
    default:
        return random.between(1, bits - 1);
    }
}

template <typename T1, typename T2>
class CertaintyRuns {
  public:
    explicit CertaintyRuns(oracle::Random& random) : random_(random) {}

    // Returns how many pairs were drawn, or 0 after a failure.
    std::uint64_t run_all() {
        constexpr std::uint64_t tolerances = 100;
        constexpr std::uint64_t draws = 600;
        for (std::uint64_t i = 0; i < tolerances; ++i) {
            const double tol = is_real ? drawn_tolerance(random_, bits) : 0;
            const Remembered factors = factors_of(tol);
            remember(factors);
            const double share = factor_of_reals(bits, factors);
            for (std::uint64_t draw = 0; draw < draws; ++draw) {
                if (!run(tol, share)) {
                    return 0;
                }
            }
            EXPECT_TRUE(same_factors(remembered(), factors)) << tol;
        }
        return tolerances * draws;
    }

  private:
    using T = talnumericarray::comparison_t<T1, T2>;
    static constexpr bool is_real = std::is_floating_point_v<T>;
    static constexpr int bits = std::numeric_limits<T>::digits;

    bool run(const double tol, const double share) {
        // `most` pairs fill the vectors of every set, and leave none to the element rule.
        const std::size_t most = Sevens<T1, T2>::most;
        const std::size_t count = random_.one_in(2) ? most : 1 + random_.below(most);
        const Place place = {random_.below(static_cast<std::uint32_t>(count)), count};
        sevens_.draw(random_, tol, place.index);
        const T1& element1 = sevens_.data1()[place.index];
        const T2& element2 = sevens_.data2()[place.index];
        const auto x = static_cast<T>(element1);
        const auto y = static_cast<T>(reinterpret_cast<const to_real_type_t<T2>&>(element2));
        const bool equal = sameQ_test(-1.0, element1, element2);
        // Vectors that compare only bits may be in doubt about infinities and zeros.
        const bool bits_alone = x == 0 || std::isinf(static_cast<double>(x));
        bool followed =
            as_ruled(talnumericarray::instruction_sets{}, {equal, !bits_alone && count == most},
                     talnumericarray::equality{}, sevens_, place);
        if constexpr (is_real) {
            const T divisor = talnumericarray::certain_divisor(static_cast<T>(tol));
            if (divisor != 0) {
                const bool clear = clearly_near(x, y, divisor == 1 ? 1 : share);
                followed =
                    followed
                    && as_ruled(talnumericarray::instruction_sets{},
                                {sameQ_test(tol, element1, element2), clear && count == most},
                                talnumericarray::nearness<T>{divisor}, sevens_, place);
            }
        }
        if (!followed) {
            ADD_FAILURE() << testing::PrintToString(element1) << " and "
                          << testing::PrintToString(element2) << ", tolerance " << tol << ", at "
                          << place.index << " of " << count;
        }
        sevens_.reset(place.index);
        return followed;
    }

    oracle::Random& random_;
    Sevens<T1, T2> sevens_;
};

struct Drawn {
    int pairs_of_types = 0;
    std::uint64_t integers = 0;
    std::uint64_t singles = 0;
    std::uint64_t doubles = 0;
};

// The order of the two types does not matter, and complex numbers are only seen as reals when they
// come second.
template <typename T1, typename T2>
constexpr bool is_run =
    have_loop<T1, T2>&& element_type_id<T1> <= element_type_id<T2> && !is_complex_v<T1>;

TEST(Certainty, IsOnlyOfWhatTheElementTestFindsTheSame) {
    oracle::Random random(oracle::printed_seed());
    Drawn drawn;
    for_each_pair_of_types([&](auto tag1, auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        if constexpr (is_run<T1, T2>) {
            using T = talnumericarray::comparison_t<T1, T2>;
            SCOPED_TRACE("element types " + std::to_string(element_type_id<T1>) + " and "
                         + std::to_string(element_type_id<T2>));
            auto& drawn_of_type = std::is_integral_v<T>      ? drawn.integers
                                  : std::is_same_v<T, float> ? drawn.singles
                                                             : drawn.doubles;
            drawn_of_type += CertaintyRuns<T1, T2>(random).run_all();
            ++drawn.pairs_of_types;
        }
    });
    EXPECT_EQ(drawn.pairs_of_types, 67);
    EXPECT_GE(drawn.integers, 1000000U);
    EXPECT_GE(drawn.singles, 1000000U);
    EXPECT_GE(drawn.doubles, 1000000U);
}

} // namespace
