// One pair of elements planted among others, at every place and in arrays of every length: the
// loops answer and remember as the element loop does.

#include "support/emulation.h"
#include "support/loops.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <vector>

namespace {

constexpr double infinity = std::numeric_limits<double>::infinity();
constexpr double nan = std::numeric_limits<double>::quiet_NaN();

// Exceeds 7 by `share` of it, and is at least the next real.
double above_seven(const int digits, const double share) {
    if (digits == std::numeric_limits<float>::digits) {
        constexpr float seven = 7;
        return std::max(std::nextafter(seven, 8.0F), static_cast<float>(7 + 7 * share));
    }
    return std::max(std::nextafter(7.0, 8.0), 7 + 7 * share);
}

Planted seven_and(const char* name, const Pair& pair, const double other) {
    const auto [value1, value2] = usual_and(pair.type1, pair.type2, 7, other);
    return {name, {value1, 0}, {value2, 0}};
}

// The share of the larger number by which two numbers may differ.
double allowed_share(const Pair& pair, const double tol) {
    return tol > 0 ? std::exp2(std::min<double>(tol, pair.digits) - pair.digits) : 0;
}

// Types that are compared as integers get two different integers.
Planted near_pair(const Pair& pair, const double tol) {
    const double share = allowed_share(pair, tol) / 2;
    return seven_and("near", pair, pair.digits == 0 ? 6 : above_seven(pair.digits, share));
}

Planted beyond_pair(const Pair& pair, const double tol) {
    const double share = allowed_share(pair, tol);
    return seven_and("beyond", pair,
                     pair.digits == 0 ? 8 : above_seven(pair.digits, share * 2 / (1 - share / 2)));
}

std::vector<Planted> planted_pairs(const Pair& pair, const double tol) {
    const double least = least_subnormal(pair);
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
    explicit Elements(const ElementType& side)
        : side_(side), elements_(longest * side.size), memory_(2 * page + longest * side.size) {}

    void set(const std::size_t index, const Element& element) {
        side_.store(elements_.data() + index * side_.size, element.real, element.imaginary);
    }

    // The first `count` elements, with `planted` at `index`, in the `place`-th place of a page.
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
    const ElementType& side_;
    std::vector<unsigned char> elements_;
    std::vector<unsigned char> memory_;
};

// One pair of types under one tolerance. Any `step` tolerances in a row cover all lengths and, in
// the longest arrays, every place of the planted pair; each tolerance covers another share of them.
class PlantedRuns {
  public:
    PlantedRuns(const Pair& pair, const double tol, const std::size_t turn, const std::size_t step)
        : pair_(pair), tol_(tol), first_(turn % step), step_(step), elements1_(pair.type1),
          elements2_(pair.type2),
          planted_(planted_pairs(pair, tol)), states_{factors_of(0), factors_of(tol),
                                                      factors_of(pair.digits - 0.75)} {}

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
    // Multiples of the pair by powers of two, in which the two numbers are as near as in the pair.
    void fill(const Planted& pair) {
        for (std::size_t i = 0; i < longest; ++i) {
            const bool negative = i % 2 == 1 && pair_.type1.is_signed && pair_.type2.is_signed;
            const double scale = (negative ? -1 : 1) * std::exp2(i % 5);
            elements1_.set(i, scaled(pair.element1, scale));
            elements2_.set(i, scaled(pair.element2, scale));
        }
    }

    Element scaled(const Element& element, const double scale) const {
        const double real = scale * element.real;
        const bool both_complex = pair_.type1.is_complex() && pair_.type2.is_complex();
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
        const bool swap = pair_.type1.is_complex() && pair_.type2.is_complex() && runs_ % 2 == 1;
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
    // 80 pairs of types are compared as reals. Under eight of the tolerances 7 is the same as the
    // number that is planted near it.
    EXPECT_EQ(near_fills, 80 * 8);
}

} // namespace
