// What is passed over as certainly the same, by vectors of every instruction set that the build has
// and the processor supports and one by one, against the plain loop over the element test: the same
// answers, and the same factor remembered after them.

#include "talnumericarray_sameq_impl.h"

#include "support/checked_calls.h"
#include "support/element_types.h"
#include "support/emulation.h"
#include "support/floating_point_modes.h"
#include "support/hard_pairs.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <iostream>
#include <limits>
#include <string>
#include <vector>

#if defined(__SANITIZE_ADDRESS__)
#    include <sanitizer/asan_interface.h>
#endif

namespace {

using talnumericarray::instruction_sets;
using talnumericarray::none;

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// ---- The instruction sets

struct SetOfBuild {
    std::string name;
    bool supported;
};

template <typename... Sets>
std::vector<SetOfBuild> sets_in(type_list<Sets...> /*sets*/) {
    return {SetOfBuild{Sets::name, Sets::supported()}...};
}

TEST(InstructionSets, StandBestFirst) {
    const char* const best_first[] = {"AVX-512", "AVX-512 in plain code", "AVX2", "baseline",
                                      "none"};
    const auto* expected = std::begin(best_first);
    int supported = 0;
    for (const SetOfBuild& set : sets_in(instruction_sets{})) {
        std::cout << "vectors of " << set.name << ": "
                  << (set.supported ? "tested here" : "NOT TESTED, not supported here")
                  << std::endl;
        RecordProperty(set.name, set.supported ? "tested" : "NOT TESTED");
        expected = std::find(expected, std::end(best_first), set.name);
        ASSERT_NE(expected, std::end(best_first)) << set.name << " is not expected here";
        ++expected;
        supported += set.supported ? 1 : 0;
    }
    if (supported == 0) {
        GTEST_SKIP() << "NOT TESTED: this processor supports no set of this build";
    }
}

// Skipped where it is not so, which CTest reports after all tests.
TEST(InstructionSets, AreAllTested) {
    std::string untested;
    for (const SetOfBuild& set : sets_in(instruction_sets{})) {
        untested += set.supported ? "" : " " + set.name;
    }
    if (!untested.empty()) {
        GTEST_SKIP() << "NOT TESTED:" << untested;
    }
}

// ---- What a thread remembers

struct Remembered {
    nesk::detail::remembered_factor<float> of_singles;
    nesk::detail::remembered_factor<double> of_doubles;
};

template <typename T>
nesk::detail::remembered_factor<T> remembered_of() {
    const nesk::detail::factor_cache<T>& cache = nesk::detail::factor_cache_of_thread<T>();
    const auto& kept = cache.factors[cache.place(cache.changes)];
    return {kept.lasttol, kept.tolfactor};
}

Remembered remembered() {
    return {remembered_of<float>(), remembered_of<double>()};
}

void remember(const Remembered& factors) {
    nesk::detail::remember_factor(factors.of_singles);
    nesk::detail::remember_factor(factors.of_doubles);
}

template <typename T>
nesk::detail::remembered_factor<T> factor_of(const double tol) {
    constexpr int bits = std::numeric_limits<T>::digits;
    const T rounded = static_cast<T>(tol);
    return rounded > 0 && rounded < bits
               ? nesk::detail::remembered_factor<T>{rounded, nesk::ToleranceShiftFactor(rounded)}
               : nesk::detail::remembered_factor<T>{bits, 1};
}

Remembered factors_of(const double tol) {
    return {factor_of<float>(tol), factor_of<double>(tol)};
}

template <typename T>
bool same_factor(const nesk::detail::remembered_factor<T>& factor1,
                 const nesk::detail::remembered_factor<T>& factor2) {
    const auto same = [](const T x, const T y) {
        return x == y || (std::isnan(x) && std::isnan(y));
    };
    return same(factor1.lasttol, factor2.lasttol) && same(factor1.tolfactor, factor2.tolfactor);
}

bool same_factors(const Remembered& factors1, const Remembered& factors2) {
    return same_factor(factors1.of_singles, factors2.of_singles)
           && same_factor(factors1.of_doubles, factors2.of_doubles);
}

// ---- The loops of every ordered pair of element types

using Loop = bool (*)(double tol, const void* data1, const void* data2, talint count);

template <typename T1, typename T2>
bool element_loop(const double tol, const void* data1, const void* data2, const talint count) {
    return talnumericarray::each_sameQ(tol, static_cast<const T1*>(data1),
                                       static_cast<const T2*>(data2), count)
           == 1;
}

template <typename Sets, typename T1, typename T2>
bool loop_of_sets(const double tol, const void* data1, const void* data2, const talint count) {
    return talnumericarray::elements_sameQ<Sets>(tol, static_cast<const T1*>(data1),
                                                 static_cast<const T2*>(data2), count)
           == 1;
}

struct LoopOfSets {
    const char* sets;
    Loop loop;
};

// By all sets together, by each of them alone, and without vectors.
template <typename T1, typename T2, typename... Sets>
std::vector<LoopOfSets> loops_of_sets(type_list<Sets...> all) {
    std::vector<LoopOfSets> loops = {{"all sets", loop_of_sets<decltype(all), T1, T2>},
                                     {none::name, loop_of_sets<type_list<none>, T1, T2>}};
    if constexpr (sizeof...(Sets) > 1) {
        (void)(..., (Sets::supported()
                         ? loops.push_back({Sets::name, loop_of_sets<type_list<Sets>, T1, T2>})
                         : void()));
    }
    return loops;
}

// One side of a pair.
struct Side {
    std::size_t size;
    std::size_t alignment;
    bool is_complex;
    bool is_signed;
    bool is_floating;
    bool has_comparison_type; // its parts need no conversion
    void (*store)(void* element, double real, double imaginary);
};

// Integers stand in for what they do not hold.
template <typename T>
T part_of(const double value) {
    if constexpr (std::is_integral_v<T>) {
        return std::isfinite(value) ? static_cast<T>(static_cast<std::int64_t>(value)) : T{1};
    } else {
        return static_cast<T>(value);
    }
}

template <typename T>
void store_parts(void* element, const double real, const double imaginary) {
    using Part = to_real_type_t<T>;
    const Part parts[] = {part_of<Part>(real), part_of<Part>(imaginary)};
    std::memcpy(element, parts, sizeof(T));
}

template <typename T, typename Comparison>
constexpr Side side_of() {
    using Part = to_real_type_t<T>;
    return {sizeof(T),
            alignof(T),
            is_complex_v<T>,
            std::is_signed_v<Part>,
            std::is_floating_point_v<Part>,
            std::is_same_v<Part, Comparison>,
            store_parts<T>};
}

struct Pair {
    std::string name;
    Side side1, side2;
    int bits; // of the reals that are compared; 0 for integers
    Loop element_loop;
    std::vector<LoopOfSets> loops;
    void (*draw)(oracle::Random& random, double share, void* element1, void* element2);
};

template <typename T1, typename T2>
void append_pair(std::vector<Pair>& pairs) {
    using T = talnumericarray::comparison_t<T1, T2>;
    // Two arrays of one integer type are compared as bytes.
    if constexpr (!(std::is_same_v<T1, T2> && std::is_integral_v<T1>)) {
        pairs.push_back({"element types " + std::to_string(element_type_id<T1>) + " and "
                             + std::to_string(element_type_id<T2>),
                         side_of<T1, T>(), side_of<T2, T>(),
                         std::is_integral_v<T> ? 0 : std::numeric_limits<T>::digits,
                         element_loop<T1, T2>, loops_of_sets<T1, T2>(instruction_sets{}),
                         draw_elements<T1, T2>});
    }
}

template <typename T1, typename... Types>
void append_row(std::vector<Pair>& pairs, type_list<Types...> /*types*/) {
    (append_pair<T1, Types>(pairs), ...);
}

template <typename... Types>
std::vector<Pair> make_pairs(type_list<Types...> types) {
    std::vector<Pair> pairs;
    (append_row<Types>(pairs, types), ...);
    return pairs;
}

// Calls `check(pair)` for all ordered pairs that have a loop.
template <typename Check>
void for_each_pair_with_a_loop(const Check& check) {
    const std::vector<Pair> pairs = make_pairs(element_type_list{});
    EXPECT_EQ(pairs.size(), 136U);
    for (const Pair& pair : pairs) {
        SCOPED_TRACE(pair.name);
        check(pair);
    }
}

std::vector<double> tolerances_of(const Pair& pair) {
    if (pair.bits == 0) {
        return {0.0};
    }
    const double bits = pair.bits;
    return {-1, 0, 1e-46, 0.5, 1, 10, 10.5, bits - 1, bits - 0.5, bits, bits + 10, nan};
}

// ---- Arrays with one pair of elements that is not like the others

struct Element {
    double real, imaginary;
};

struct Planted {
    const char* name;
    Element element1, element2;
};

// A greater number than 7, by the share `share` of it or, if that is nothing, the next one.
double above_seven(const int bits, const double share) {
    if (bits == std::numeric_limits<float>::digits) {
        constexpr float seven = 7;
        return std::max(std::nextafter(seven, 8.0F), static_cast<float>(7 + 7 * share));
    }
    return std::max(std::nextafter(7.0, 8.0), 7 + 7 * share);
}

// 7 and another number, on the side that can hold it.
Planted seven_and(const char* name, const Pair& pair, const double other) {
    return pair.side2.has_comparison_type ? Planted{name, {7, 0}, {other, 0}}
                                          : Planted{name, {other, 0}, {7, 0}};
}

// Where there are no reals in between, the pair is one of different integers.
Planted near_pair(const Pair& pair, const double tol) {
    const double share = tol > 0 ? std::exp2(std::min<double>(tol, pair.bits) - pair.bits) : 0;
    return seven_and("near", pair, pair.bits == 0 ? 6 : above_seven(pair.bits, share / 2));
}

Planted beyond_pair(const Pair& pair, const double tol) {
    const double share = tol > 0 ? std::exp2(std::min<double>(tol, pair.bits) - pair.bits) : 0;
    return seven_and("beyond", pair,
                     pair.bits == 0 ? 8 : above_seven(pair.bits, share * 2 / (1 - share / 2)));
}

std::vector<Planted> planted_pairs(const Pair& pair, const double tol) {
    const double least = pair.bits == std::numeric_limits<float>::digits
                             ? std::numeric_limits<float>::denorm_min()
                             : std::numeric_limits<double>::denorm_min();
    return {
        {"nothing", {7, 0}, {7, 0}},
        near_pair(pair, tol),
        beyond_pair(pair, tol),
        {"a zero", {7, 0}, {0, 0}},
        {"another zero", {0, 0}, {7, 0}},
        {"NaNs", {nan, 0}, {nan, 0}},
        {"a NaN", {nan, 0}, {7, 0}},
        {"infinities", {infinity, 0}, {infinity, 0}},
        {"an infinity", {infinity, 0}, {7, 0}},
        {"zeros of both signs", {0.0, 0}, {-0.0, 0}},
        {"subnormals", {3 * least, 0}, {4 * least, 0}},
        {"a subnormal and a zero", {least, 0}, {0, 0}},
        {"all bits of an integer", {-1, 0}, {-1, 0}},
        {"imaginary zeros of both signs", {7, -0.0}, {7, 0.0}},
        {"imaginary subnormals", {7, least}, {7, least}},
        {"an imaginary subnormal and a zero", {7, least}, {7, 0}},
    };
}

constexpr std::size_t page = 4096;

// The elements of one side, which can be copied to any place in a page.
class Elements {
  public:
    Elements(const Side& side, const std::size_t longest)
        : side_(side), elements_(longest * side.size), memory_(2 * page + longest * side.size) {}

    void set(const std::size_t index, const Element& element) {
        side_.store(elements_.data() + index * side_.size, element.real, element.imaginary);
    }

    // The first `count` elements in the `place`-th place of a page, `planted` being among them.
    void* placed(const std::size_t place, const std::size_t count, const std::size_t index,
                 const Element& planted) {
        const auto to_page = (page - reinterpret_cast<std::uintptr_t>(memory_.data()) % page);
        unsigned char* const data = memory_.data() + to_page + place * side_.alignment % page;
        std::memcpy(data, elements_.data(), count * side_.size);
        if (index < count) {
            side_.store(data + index * side_.size, planted.real, planted.imaginary);
        }
        return data;
    }

  private:
    Side side_;
    std::vector<unsigned char> elements_;
    std::vector<unsigned char> memory_;
};

// Whether all other loops of the pair answer and remember as the element loop does.
bool as_element_loop(const Pair& pair, const Remembered& before, const double tol,
                     const void* data1, const void* data2, const std::size_t count) {
    const auto length = static_cast<talint>(count);
    remember(before);
    const bool expected = pair.element_loop(tol, data1, data2, length);
    const Remembered expected_after = remembered();
    const auto as_expected = [&](const LoopOfSets& other) {
        remember(before);
        const bool answer = other.loop(tol, data1, data2, length);
        const bool same_memory = same_factors(remembered(), expected_after);
        if (answer != expected || !same_memory) {
            ADD_FAILURE() << other.sets << " answers " << answer << " instead of " << expected
                          << (same_memory ? "" : " and remembers another factor") << "; tolerance "
                          << tol << ", " << count << " elements, remembered before: tolerance "
                          << before.of_singles.lasttol << " of singles, "
                          << before.of_doubles.lasttol << " of doubles";
        }
        return answer == expected && same_memory;
    };
    return std::all_of(pair.loops.begin(), pair.loops.end(), as_expected);
}

// Long enough for every step of the loops: four of the longest vectors of the smallest elements,
// and ends behind them.
constexpr std::size_t longest = 300;

// One pair of types under one tolerance. Any `step` tolerances in a row have all lengths and the
// planted pair at every place of the longest arrays, each of them at another share of these.
class PlantedRuns {
  public:
    PlantedRuns(const Pair& pair, const double tol, const std::size_t turn, const std::size_t step)
        : pair_(pair), tol_(tol), first_(turn % step), step_(step), elements1_(pair.side1, longest),
          elements2_(pair.side2, longest),
          planted_(planted_pairs(pair, tol)), states_{factors_of(0), factors_of(tol),
                                                      factors_of(pair.bits - 0.75)} {}

    bool run_all() {
        fill({"the same", {7, 0}, {7, 0}});
        bool as_expected = run_among_these();
        const Planted near = near_pair(pair_, tol_);
        fill(near);
        const void* const data1 = elements1_.placed(0, longest, longest, {});
        const void* const data2 = elements2_.placed(0, longest, longest, {});
        remember(states_[1]);
        if (as_expected && pair_.element_loop(tol_, data1, data2, static_cast<talint>(longest))) {
            ++near_fills_;
            as_expected = run_among_these();
        }
        return as_expected;
    }

    int near_fills() const { return near_fills_; }

  private:
    // Multiples of the pair by powers of two, which are as near to each other as the pair is.
    void fill(const Planted& pair) {
        for (std::size_t i = 0; i < longest; ++i) {
            const bool negative = i % 2 == 1 && pair_.side1.is_signed && pair_.side2.is_signed;
            const double scale = (negative ? -1 : 1) * std::exp2(i % 5);
            elements1_.set(i, scaled(pair.element1, scale));
            elements2_.set(i, scaled(pair.element2, scale));
        }
    }

    Element scaled(const Element& element, const double scale) const {
        const double real = scale * element.real;
        const bool both_complex = pair_.side1.is_complex && pair_.side2.is_complex;
        return {real, both_complex ? real : scale * 0};
    }

    bool run_among_these() {
        for (const Planted& planted : planted_) {
            for (std::size_t length = first_; length <= longest; length += step_) {
                // 7919 has no factor in common with a length here, so that no place is preferred.
                if (!run(planted, length, length == 0 ? 0 : runs_ * 7919 % length)) {
                    return false;
                }
            }
            for (std::size_t index = first_; index < longest; index += step_) {
                if (!run(planted, longest, index)) {
                    return false;
                }
            }
        }
        return true;
    }

    bool run(const Planted& planted, const std::size_t length, const std::size_t index) {
        // In the course of the runs both sides get to every place in a page.
        ++runs_;
        const std::size_t place1 = runs_;
        const std::size_t place2 = runs_ * 5 + runs_ / 64;
        const bool swap = pair_.side1.is_complex && pair_.side2.is_complex && runs_ % 2 == 1;
        const void* const data1 =
            elements1_.placed(place1, length, index, turned(planted.element1, swap));
        const void* const data2 =
            elements2_.placed(place2, length, index, turned(planted.element2, swap));
        if (!as_element_loop(pair_, states_[runs_ % states_.size()], tol_, data1, data2, length)) {
            ADD_FAILURE() << "planted at " << index << ": " << planted.name << "; places " << place1
                          << " and " << place2;
            return false;
        }
        return true;
    }

    static Element turned(const Element& element, const bool swap) {
        return swap ? Element{element.imaginary, element.real} : element;
    }

    const Pair& pair_;
    double tol_;
    std::size_t first_;
    std::size_t step_;
    Elements elements1_;
    Elements elements2_;
    std::vector<Planted> planted_;
    std::vector<Remembered> states_;
    std::size_t runs_ = 0;
    int near_fills_ = 0;
};

TEST(Loops, AnswerAndRememberAsTheElementLoop) {
    int near_fills = 0;
    for_each_pair_with_a_loop([&](const Pair& pair) {
        const std::vector<double> tolerances = tolerances_of(pair);
        const std::size_t step = std::min(tolerances.size(), 3 * emulated_stride);
        for (std::size_t turn = 0; turn < tolerances.size(); ++turn) {
            PlantedRuns runs(pair, tolerances[turn], turn, step);
            if (!runs.run_all()) {
                return;
            }
            near_fills += runs.near_fills();
        }
    });
    // 80 pairs of types are compared as reals. Near each other are 7 and the next real, or more,
    // under eight of the tolerances.
    EXPECT_EQ(near_fills, 80 * 8);
}

// ---- What is read without vectors

void set_poisoned([[maybe_unused]] const bool poisoned, [[maybe_unused]] unsigned char* const begin,
                  [[maybe_unused]] const std::size_t size) {
#if defined(__SANITIZE_ADDRESS__)
    (poisoned ? __asan_poison_memory_region : __asan_unpoison_memory_region)(begin, size);
#endif
}

// Elements behind a pair that differs, which a sanitizer says may not be read.
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

std::vector<unsigned char> sevens(const Side& side, const std::size_t count) {
    std::vector<unsigned char> bytes(count * side.size);
    for (std::size_t i = 0; i < count; ++i) {
        side.store(bytes.data() + i * side.size, 7, 0);
    }
    return bytes;
}

TEST(Loops, WithoutVectorsReadNothingBehindTheFirstDifference) {
    if (!address_sanitizer) {
        GTEST_SKIP() << "NOT TESTED: only a sanitizer tells single bytes that are read";
    }
    constexpr std::size_t count = 70;
    for_each_pair_with_a_loop([&](const Pair& pair) {
        const auto without_vectors =
            std::find_if(pair.loops.begin(), pair.loops.end(), [](const LoopOfSets& loop) {
                return std::string(loop.sets) == none::name;
            });
        ASSERT_NE(without_vectors, pair.loops.end());
        std::vector<unsigned char> data1 = sevens(pair.side1, count);
        std::vector<unsigned char> data2 = sevens(pair.side2, count);
        for (const double tol : {-1.0, 10.0}) {
            for (std::size_t index = 0; index < count; ++index) {
                unsigned char* const element2 = data2.data() + index * pair.side2.size;
                pair.side2.store(element2, 9, 0);
                {
                    const Poison behind1(data1.data() + (index + 1) * pair.side1.size,
                                         data1.data() + data1.size());
                    const Poison behind2(element2 + pair.side2.size, data2.data() + data2.size());
                    remember(factors_of(tol));
                    EXPECT_FALSE(without_vectors->loop(tol, data1.data(), data2.data(), count))
                        << index;
                }
                pair.side2.store(element2, 7, 0);
            }
        }
    });
}

// ---- Random pairs among pairs that are the same, in every direction of rounding

double share_of(const int bits, const Remembered& factors) {
    return bits == std::numeric_limits<float>::digits ? factors.of_singles.tolfactor
                                                      : factors.of_doubles.tolfactor;
}

std::uint64_t printed_seed() {
    const std::uint64_t seed = oracle::requested_seed();
    std::cout << "TALNUMERICARRAY_SEED=" << seed << std::endl;
    return seed;
}

// Pairs that are drawn, one at a time, among pairs of sevens.
class DrawnRuns {
  public:
    explicit DrawnRuns(const Pair& pair)
        : pair_(pair), data1_(sevens(pair.side1, longest)), data2_(sevens(pair.side2, longest)) {}

    bool run_all(oracle::Random& random, const double tol) {
        constexpr std::size_t draws = 150 / emulated_stride;
        const Remembered factors = factors_of(tol);
        for (std::size_t draw = 0; draw < draws; ++draw) {
            const std::size_t index = random.below(static_cast<std::uint32_t>(longest));
            unsigned char* const element1 = data1_.data() + index * pair_.side1.size;
            unsigned char* const element2 = data2_.data() + index * pair_.side2.size;
            pair_.draw(random, share_of(pair_.bits, factors), element1, element2);
            if (!as_element_loop(pair_, factors, tol, data1_.data(), data2_.data(), longest)) {
                return false;
            }
            pair_.side1.store(element1, 7, 0);
            pair_.side2.store(element2, 7, 0);
        }
        return true;
    }

  private:
    const Pair& pair_;
    std::vector<unsigned char> data1_;
    std::vector<unsigned char> data2_;
};

TEST(Loops, AnswerAsTheElementLoopInEveryDirectionOfRounding) {
    oracle::Random random(printed_seed());
    for_each_pair_with_a_loop([&](const Pair& pair) {
        DrawnRuns runs(pair);
        for (const Rounding& rounding : roundings) {
            SCOPED_TRACE(rounding.name);
            for (const double tol : tolerances_of(pair)) {
                const RoundingScope scope(rounding);
                if (!runs.run_all(random, tol)) {
                    return;
                }
            }
        }
    });
}

// Results, operands or both.
std::vector<std::uint64_t> parts_of_flushing() {
    std::vector<std::uint64_t> parts = {flushing};
    for (std::uint64_t part = flushing & (flushing - 1); part != 0; part = (part - 1) & flushing) {
        parts.push_back(part);
    }
    return parts;
}

TEST(Loops, AnswerAsTheElementLoopWhereSubnormalNumbersAreTakenForZero) {
    if (flushing == 0) {
        GTEST_SKIP() << "NOT TESTED: this processor takes none for zero";
    }
    oracle::Random random(printed_seed());
    for_each_pair_with_a_loop([&](const Pair& pair) {
        DrawnRuns runs(pair);
        for (const std::uint64_t part : parts_of_flushing()) {
            SCOPED_TRACE(part);
            for (const double tol : tolerances_of(pair)) {
                const FlushingScope scope(part);
                if (!runs.run_all(random, tol)) {
                    return;
                }
            }
        }
    });
}

// Of small numbers of either sign, and zeros, the drawn pairs are few.
TEST(Loops, TellSubnormalNumbersApartWhateverIsTakenForZero) {
    for_each_pair_with_a_loop([&](const Pair& pair) {
        if (pair.bits == 0 || !pair.side1.is_floating || !pair.side2.is_floating) {
            return;
        }
        const double least = pair.bits == std::numeric_limits<float>::digits
                                 ? std::numeric_limits<float>::denorm_min()
                                 : std::numeric_limits<double>::denorm_min();
        std::vector<std::uint64_t> parts = parts_of_flushing();
        parts.push_back(0);
        std::vector<unsigned char> data1 = sevens(pair.side1, longest);
        std::vector<unsigned char> data2 = sevens(pair.side2, longest);
        for (const Planted& planted : {Planted{"signs", {3 * least, 0}, {-5 * least, 0}},
                                       {"a zero", {0, 0}, {3 * least, 0}},
                                       {"another zero", {3 * least, 0}, {0, 0}},
                                       {"an imaginary part", {7, 3 * least}, {7, 3 * least}},
                                       {"another", {7, 3 * least}, {7, -3 * least}}}) {
            SCOPED_TRACE(planted.name);
            constexpr std::size_t index = 200;
            pair.side1.store(data1.data() + index * pair.side1.size, planted.element1.real,
                             planted.element1.imaginary);
            pair.side2.store(data2.data() + index * pair.side2.size, planted.element2.real,
                             planted.element2.imaginary);
            for (const std::uint64_t part : parts) {
                for (const double tol : {7.5, 10.0, pair.bits + 0.0}) {
                    const Remembered factors = factors_of(tol);
                    const FlushingScope scope(part);
                    as_element_loop(pair, factors, tol, data1.data(), data2.data(), longest);
                }
            }
        }
    });
}

template <typename T>
void expect_divisors_large_enough() {
    constexpr int bits = std::numeric_limits<T>::digits;
    constexpr long double epsilon = std::numeric_limits<T>::epsilon();
    for (const Rounding& rounding : roundings) {
        SCOPED_TRACE(rounding.name);
        for (const T tol : {T{0.5}, T{1}, T{10}, T{10.5}, T{bits - 1}, T{bits - 0.5}}) {
            const Remembered factors = factors_of(tol);
            remember(factors);
            const RoundingScope scope(rounding);
            const long double divisor = talnumericarray::certain_divisor(tol);
            const RoundingScope to_nearest(roundings[0]);
            const long double factor = share_of(bits, factors);
            EXPECT_GE(divisor * factor, 1 + factor) << tol;
            EXPECT_GE(divisor * factor, 1 + 4 * epsilon) << tol;
            EXPECT_LE(divisor * factor, (1 + factor) * (1 + 16 * epsilon)) << tol;
        }
    }
}

TEST(CertainDivisor, IsLargeEnoughInEveryDirectionOfRounding) {
    expect_divisors_large_enough<float>();
    expect_divisors_large_enough<double>();
}

// The factor of 20 is.
template <typename T>
void expect_divisors_only_without_need_of_another_factor() {
    constexpr int bits = std::numeric_limits<T>::digits;
    for (const T tol : {T{-1}, T{0}, T{0.5}, T{10}, T{10.5}, T{bits - 1}, static_cast<T>(nan)}) {
        remember(factors_of(20));
        EXPECT_EQ(talnumericarray::certain_divisor(tol), 0) << tol;
    }
    for (const T tol : {T{bits}, T{bits + 10}}) {
        remember(factors_of(20));
        EXPECT_EQ(talnumericarray::certain_divisor(tol), 1) << tol;
    }
}

TEST(CertainDivisor, IsOnlyGivenWhereTheFactorIsRememberedOrNotNeeded) {
    expect_divisors_only_without_need_of_another_factor<float>();
    expect_divisors_only_without_need_of_another_factor<double>();
}

// ---- What is certain

// Pairs that are the same, for one drawn pair to be put among them.
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

    void draw(oracle::Random& random, const double share, const std::size_t index) {
        draw_elements<T1, T2>(random, share, &data1_[index], &data2_[index]);
    }

    const T1* data1() const { return data1_; }
    const T2* data2() const { return data2_; }

  private:
    // In one page.
    alignas(2048) T1 data1_[most] = {};
    alignas(2048) T2 data2_[most] = {};
};

// What the element rule says of a pair, and whether one that is the same may not be in doubt.
struct Ruling {
    bool same;
    bool beyond_doubt;
};

// Whether a set said what it may; compiled once, where the loops are for each pair of types.
bool follows_rule(const Ruling& ruling, const char* const set, const bool certain) {
    const bool follows = certain ? ruling.same : !(ruling.same && ruling.beyond_doubt);
    EXPECT_TRUE(follows) << set << " is " << (certain ? "certain" : "in doubt")
                         << " of a pair that is " << (ruling.same ? "" : "not ") << "the same";
    return follows;
}

// Where a pair is drawn among `count` others.
struct Place {
    std::size_t index, count;
};

// Integers are passed over by vectors alone.
template <typename Set, typename Bound, typename T1, typename T2>
bool as_ruled_by(const Ruling& ruling, const Bound bound, const Sevens<T1, T2>& sevens,
                 const Place& place) {
    if constexpr (std::is_floating_point_v<talnumericarray::comparison_t<
                      T1, T2>> || Set::template has_loop<Bound, T1, T2>) {
        if (Set::supported()) {
            const std::size_t passed = talnumericarray::by_best_set(
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
    return as_ruled_by<none>(ruling, bound, sevens, place)
           && (... && as_ruled_by<Sets>(ruling, bound, sevens, place));
}

// Two finite numbers, of which one is no further from the other than a quarter of the tolerance's
// factor: rounding plays no part.
template <typename T>
bool clearly_near(const T x, const T y, const double factor) {
    return std::isfinite(x) && std::isfinite(y) && (x < 0) == (y < 0)
           && std::fabs(static_cast<long double>(x) - static_cast<long double>(y))
                  <= static_cast<long double>(std::fabs(y)) * static_cast<long double>(factor) / 4;
}

double drawn_tolerance(oracle::Random& random, const int bits) {
    const double marks[] = {-1, 0, 1e-46, 0.5, 10.5, bits - 0.5, 1.0 * bits, bits + 10.0, nan};
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

    // The number of pairs that were drawn.
    std::uint64_t run_all() {
        constexpr std::uint64_t tolerances = 100;
        constexpr std::uint64_t draws = 600;
        for (std::uint64_t i = 0; i < tolerances; ++i) {
            const double tol = is_real ? drawn_tolerance(random_, bits) : 0;
            const Remembered factors = factors_of(tol);
            remember(factors);
            const double share = share_of(bits, factors);
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
        // The most are enough for a vector of every set, and no part of them is left to the rule.
        const std::size_t most = Sevens<T1, T2>::most;
        const std::size_t count = random_.one_in(2) ? most : 1 + random_.below(most);
        const Place place = {random_.below(static_cast<std::uint32_t>(count)), count};
        sevens_.draw(random_, share, place.index);
        const T1& element1 = sevens_.data1()[place.index];
        const T2& element2 = sevens_.data2()[place.index];
        const auto x = static_cast<T>(element1);
        const auto y = static_cast<T>(reinterpret_cast<const to_real_type_t<T2>&>(element2));
        const bool equal = sameQ_test(-1.0, element1, element2);
        // Vectors that know bits alone are in doubt of infinities and of zeros of both signs.
        const bool bits_alone = x == 0 || std::isinf(static_cast<double>(x));
        bool followed = as_ruled(instruction_sets{}, {equal, !bits_alone && count == most},
                                 talnumericarray::equality{}, sevens_, place);
        if constexpr (is_real) {
            const T divisor = talnumericarray::certain_divisor(static_cast<T>(tol));
            if (divisor != 0) {
                const bool clear = clearly_near(x, y, divisor == 1 ? 1 : share);
                followed =
                    followed
                    && as_ruled(instruction_sets{},
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

// The order of the two does not matter, nor are two complex numbers seen as anything but reals.
template <typename T1, typename T2>
void run_certainty([[maybe_unused]] oracle::Random& random, [[maybe_unused]] Drawn& drawn) {
    constexpr bool has_loop =
        element_type_id<T1> <= element_type_id<
            T2> && !is_complex_v<T1> && !(std::is_same_v<T1, T2> && std::is_integral_v<T1>);
    if constexpr (has_loop) {
        using T = talnumericarray::comparison_t<T1, T2>;
        SCOPED_TRACE("element types " + std::to_string(element_type_id<T1>) + " and "
                     + std::to_string(element_type_id<T2>));
        auto& drawn_of_type = std::is_integral_v<T>      ? drawn.integers
                              : std::is_same_v<T, float> ? drawn.singles
                                                         : drawn.doubles;
        drawn_of_type += CertaintyRuns<T1, T2>(random).run_all();
        ++drawn.pairs_of_types;
    }
}

template <typename T1, typename... Types>
void run_certainty_of_row(oracle::Random& random, Drawn& drawn, type_list<Types...> /*types*/) {
    (run_certainty<T1, Types>(random, drawn), ...);
}

template <typename... Types>
Drawn run_certainty_of_all(oracle::Random& random, type_list<Types...> types) {
    Drawn drawn;
    (run_certainty_of_row<Types>(random, drawn, types), ...);
    return drawn;
}

TEST(Certainty, IsOnlyOfWhatTheElementTestFindsTheSame) {
    oracle::Random random(printed_seed());
    const Drawn drawn = run_certainty_of_all(random, element_type_list{});
    EXPECT_EQ(drawn.pairs_of_types, 67);
    EXPECT_GE(drawn.integers, 1000000U);
    EXPECT_GE(drawn.singles, 1000000U);
    EXPECT_GE(drawn.doubles, 1000000U);
}

} // namespace
