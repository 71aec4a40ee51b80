// Random pairs among pairs that are the same, in every direction of rounding and with subnormal
// numbers treated as zero: the loops answer and remember as the element loop does.

#include "support/checked_calls.h"
#include "support/emulation.h"
#include "support/floating_point_modes.h"
#include "support/loops.h"
#include "support/random_arrays.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <vector>

namespace {

// Pairs that are drawn, one at a time, among pairs of sevens.
class DrawnRuns {
  public:
    explicit DrawnRuns(const Pair& pair)
        : pair_(pair), data1_(sevens(pair.type1, longest)), data2_(sevens(pair.type2, longest)) {}

    bool run_all(oracle::Random& random, const double tol) {
        constexpr std::size_t draws = 150 / emulated_stride;
        const Remembered factors = factors_of(tol);
        for (std::size_t draw = 0; draw < draws; ++draw) {
            const std::size_t index = random.below(static_cast<std::uint32_t>(longest));
            unsigned char* const element1 = data1_.data() + index * pair_.type1.size;
            unsigned char* const element2 = data2_.data() + index * pair_.type2.size;
            oracle::draw_elements(random, tol, pair_.type1.id, pair_.type2.id, true, element1,
                                  element2);
            if (!as_element_loop(pair_, factors, tol, data1_.data(), data2_.data(), longest)) {
                return false;
            }
            pair_.type1.store(element1, 7);
            pair_.type2.store(element2, 7);
        }
        return true;
    }

  private:
    const Pair& pair_;
    std::vector<unsigned char> data1_;
    std::vector<unsigned char> data2_;
};

TEST(Loops, AnswerAsTheElementLoopInEveryDirectionOfRounding) {
    oracle::Random random(oracle::printed_seed());
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

// Every part of `flushing`: for results, operands or both.
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
    oracle::Random random(oracle::printed_seed());
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

// Few of the drawn pairs are of small numbers of either sign, or of zeros.
TEST(Loops, TellSubnormalNumbersApartWhateverIsTakenForZero) {
    for_each_pair_with_a_loop([&](const Pair& pair) {
        if (pair.type1.is_integer || pair.type2.is_integer) {
            return;
        }
        const double least = least_subnormal(pair);
        std::vector<std::uint64_t> parts = parts_of_flushing();
        parts.push_back(0);
        std::vector<unsigned char> data1 = sevens(pair.type1, longest);
        std::vector<unsigned char> data2 = sevens(pair.type2, longest);
        for (const Planted& planted : {Planted{"signs", {3 * least, 0}, {-5 * least, 0}},
                                       {"a zero", {0, 0}, {3 * least, 0}},
                                       {"another zero", {3 * least, 0}, {0, 0}},
                                       {"an imaginary part", {7, 3 * least}, {7, 3 * least}},
                                       {"another", {7, 3 * least}, {7, -3 * least}}}) {
            const auto& [name, element1, element2] = planted;
            SCOPED_TRACE(name);
            constexpr std::size_t index = 200;
            pair.type1.store(&data1[index * pair.type1.size], element1.real, element1.imaginary);
            pair.type2.store(&data2[index * pair.type2.size], element2.real, element2.imaginary);
            for (const std::uint64_t part : parts) {
                for (const double tol : {7.5, 10.0, pair.digits + 0.0}) {
                    const Remembered factors = factors_of(tol);
                    const FlushingScope scope(part);
                    as_element_loop(pair, factors, tol, data1.data(), data2.data(), longest);
                }
            }
        }
    });
}

} // namespace
