// Tries on singles what the proofs claim: if the fast test passes, the rule finds the pair the same
// and leaves the remembered factor as it is. Here the processor may also flush subnormal results to
// zero, or take subnormal operands for zero.
//
//     proof_flushed          some first operands beside each second one, in seconds
//     proof_flushed --all    all 2^32 of them beside fewer second ones, in half an hour
//
// Prints what was tried, or the first pair that contradicts the claim and fails.

#include "compare.h"
#include "factor_cache.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_certainty.h"
#include "tolerance_shift_factor.h"

#include <algorithm>
#include <cfenv>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <limits>
#include <optional>
#include <type_traits>
#include <vector>

#if defined(__SSE2__)
#    include <xmmintrin.h>
#endif

namespace {

using talnumericarray::equality;
using Nearness = talnumericarray::nearness<float>;
using limits = std::numeric_limits<float>;

// ---- Modes of the processor

struct Direction {
    const char* name;
    int mode;
};

constexpr Direction directions[] = {{"to nearest", FE_TONEAREST},
                                    {"upward", FE_UPWARD},
                                    {"downward", FE_DOWNWARD},
                                    {"toward zero", FE_TOWARDZERO}};

// How subnormal numbers are treated; only x86 can be asked for each part.
struct Treatment {
    const char* name;
    unsigned bits;
    bool only_results;
};

#if defined(__SSE2__)
constexpr unsigned ftz = 0x8000;
constexpr unsigned daz = 0x0040;
constexpr Treatment treatments[] = {{"IEEE", 0, false},
                                    {"results flushed", ftz, true},
                                    {"operands flushed", daz, false},
                                    {"results and operands flushed", ftz | daz, false}};
#else
constexpr Treatment treatments[] = {{"IEEE", 0, false}};
#endif

// In force for as long as it lives. What is computed meanwhile is in functions of their own, as
// compilers move operations across changes of the mode.
class ModeScope {
  public:
    ModeScope(const Direction& direction, const Treatment& treatment) {
        std::fesetround(direction.mode);
        treat(treatment);
    }
    ModeScope(const ModeScope&) = delete;
    ModeScope& operator=(const ModeScope&) = delete;
    ~ModeScope() {
        treat(treatments[0]);
        std::fesetround(FE_TONEAREST);
    }

  private:
    static void treat([[maybe_unused]] const Treatment& treatment) {
#if defined(__SSE2__)
        _mm_setcsr((_mm_getcsr() & ~(ftz | daz)) | treatment.bits);
#endif
    }
};

// ---- What is tried

struct Tolerance {
    float tol;
    bool remembered;
};

constexpr Tolerance tolerances[] = {{0.5F, true},  {1.0F, true},  {7.0F, true},
                                    {10.5F, true}, {22.5F, true}, {23.0F, true},
                                    {23.5F, true}, {24.0F, true}, {10.5F, false}};
constexpr Tolerance tolerances_of_all[] = {
    {0.5F, true}, {10.5F, true}, {23.5F, true}, {24.0F, true}};

float real(const std::uint32_t pattern) {
    float value = 0;
    std::memcpy(&value, &pattern, sizeof value);
    return value;
}

std::uint32_t pattern_of(const float value) {
    std::uint32_t pattern = 0;
    std::memcpy(&pattern, &value, sizeof pattern);
    return pattern;
}

float factor_of(const float tol) {
    return tol < limits::digits ? nesk::ToleranceShiftFactor(tol) : 1.0F;
}

// Those whose differences from numbers at the limit of the tolerance are about the least normal
// number come last.
std::vector<float> second_operands(const float tol) {
    constexpr float least = limits::denorm_min();
    constexpr float least_normal = limits::min();
    std::vector<float> numbers = {0.0F,
                                  least,
                                  2 * least,
                                  3 * least,
                                  least_normal / 2,
                                  least_normal - least,
                                  least_normal,
                                  least_normal + least,
                                  least_normal + 2 * least,
                                  1.25F * least_normal,
                                  2 * least_normal - 2 * least,
                                  2 * least_normal,
                                  3 * least_normal,
                                  5 * least_normal,
                                  0.5F,
                                  1.0F - limits::epsilon() / 2,
                                  1.0F,
                                  1.0F + limits::epsilon(),
                                  1.25F,
                                  limits::max(),
                                  limits::infinity(),
                                  limits::quiet_NaN()};
    const float scaled = least_normal / factor_of(tol);
    for (const float number :
         {std::nextafter(scaled, 0.0F), scaled, std::nextafter(scaled, 1.0F)}) {
        numbers.push_back(number);
    }
    for (const float number : {0.0F, least, least_normal, 1.0F}) {
        numbers.push_back(-number);
    }
    return numbers;
}

std::vector<float> second_operands_of_all(const float tol) {
    constexpr float least_normal = limits::min();
    return {limits::denorm_min(), 1.25F * least_normal, least_normal / factor_of(tol), 1.0F};
}

// The patterns of first operands at which a step of the test or of the rule decides otherwise.
std::vector<std::uint32_t> centres(const float tol, const float y) {
    const float factor = factor_of(tol);
    const float values[] = {y,
                            0.0F,
                            -0.0F,
                            limits::min(),
                            -limits::min(),
                            y - y * factor,
                            y + y * factor,
                            y / (1 + factor),
                            y + limits::min(),
                            y - limits::min(),
                            limits::min() / factor};
    std::vector<std::uint32_t> patterns;
    std::transform(std::begin(values), std::end(values), std::back_inserter(patterns), pattern_of);
    return patterns;
}

// ---- Blocks of first operands

constexpr std::size_t block_size = 4096;

struct Block {
    std::uint32_t first;
    std::uint32_t stride;
    // Whether the loops are asked about all of them, not only about those that pass.
    bool ask_loops;
};

std::vector<Block> thinned_blocks(const float tol, const float y) {
    constexpr std::uint32_t stride = 16411;
    constexpr std::uint32_t size = block_size;
    constexpr std::uint64_t step = std::uint64_t{stride} * size;
    std::vector<Block> blocks;
    for (std::uint64_t first = 0; first < std::uint64_t{1} << 32; first += step) {
        blocks.push_back({static_cast<std::uint32_t>(first), stride, false});
    }
    for (const std::uint32_t centre : centres(tol, y)) {
        blocks.push_back({centre - size, 1, false});
        blocks.push_back({centre, 1, false});
        blocks.push_back({centre - size / 2, 1, true});
    }
    return blocks;
}

// ---- Answers in the mode in force, in functions that are not inlined; see `ModeScope`

[[gnu::noinline]] float divisor_in_mode(const float tol) {
    return talnumericarray::certain_divisor(tol);
}

[[gnu::noinline]] float factor_in_mode(const float tol) {
    return factor_of(tol);
}

[[gnu::noinline]] int verdict_in_mode(const float tol, const float x, const float y) {
    return nesk::detail::compare_impl(tol, x, y);
}

// Sets bits of `passes` of the first operands that pass.
constexpr std::uint32_t by_scalars = 1;
constexpr std::uint32_t by_fused = 2;

template <typename Bound>
[[gnu::noinline]] void test_by_scalars(const Bound bound, const float* const xs, const float y,
                                       std::uint32_t* const passes) {
    for (std::size_t i = 0; i < block_size; ++i) {
        passes[i] = talnumericarray::certainly_same(bound, xs[i], y) ? by_scalars : 0;
    }
}

// As the loops whose product is not rounded. A loop answers for a vector as a whole, so it is asked
// one pair at a time, and only about pairs that pass or are near a limit.
#if defined(__x86_64__)
[[gnu::noinline, gnu::target("avx2,fma")]] void test_by_fused(const Nearness bound,
                                                              const float* const xs, const float y,
                                                              std::uint32_t* const passes) {
    const float m = __builtin_fabsf(y);
    for (std::size_t i = 0; i < block_size; ++i) {
        const float d = __builtin_fabsf(xs[i] - y);
        passes[i] |= __builtin_fmaf(-bound.divisor, d, m) >= d ? by_fused : 0;
    }
}
#endif

template <typename Bound>
void test_block(const Bound bound, const float* const xs, const float y,
                std::uint32_t* const passes) {
    test_by_scalars(bound, xs, y, passes);
#if defined(__x86_64__)
    if constexpr (std::is_same_v<Bound, Nearness>) {
        if (talnumericarray::avx2::supported()) {
            test_by_fused(bound, xs, y, passes);
        }
    }
#endif
}

// Whether a vector that is filled with the pair passes.
template <typename Set, typename Bound>
bool passes_loop(const Bound bound, const float x, const float y) {
    constexpr std::size_t count = Set::template elements<float, float>;
    float xs[count];
    float ys[count];
    std::fill(std::begin(xs), std::end(xs), x);
    std::fill(std::begin(ys), std::end(ys), y);
    return Set::certain_prefix(bound, xs, ys, count, count) == count;
}

// Whether the vectors of a set answer as the function that stands for them.
template <typename Set, typename Bound>
bool loop_agrees(const Bound bound, const float x, const float y, const std::uint32_t passes) {
    if constexpr (Set::template has_loop<Bound, float, float>) {
        const bool rounded =
            std::is_same_v<Bound, equality> || std::strcmp(Set::name, "baseline") == 0;
        const bool expected = (passes & (rounded ? by_scalars : by_fused)) != 0;
        return !Set::supported() || passes_loop<Set>(bound, x, y) == expected;
    } else {
        return true;
    }
}

template <typename Bound, typename... Sets>
[[gnu::noinline]] bool loops_agree(const Bound bound, const float x, const float y,
                                   const std::uint32_t passes, type_list<Sets...> /*sets*/) {
    return (... && loop_agrees<Sets>(bound, x, y, passes));
}

// ---- The claim

struct Counts {
    std::uint64_t pairs = 0;
    std::uint64_t passed = 0;
};

struct Violation {
    float x;
    const char* reason;
};

template <typename Bound>
std::optional<Violation> violation_in_block(const Bound bound, const float tol, const Block& block,
                                            const float y, Counts& counts) {
    alignas(64) static float xs[block_size];
    alignas(64) static std::uint32_t passes[block_size];
    for (std::uint32_t i = 0; i < block_size; ++i) {
        const std::uint32_t pattern = block.first + i * block.stride;
        std::memcpy(&xs[i], &pattern, sizeof pattern);
    }
    test_block(bound, xs, y, passes);
    counts.pairs += block_size;
    std::uint32_t any = 0;
    for (const std::uint32_t pass : passes) {
        any |= pass;
    }
    if (any == 0 && !block.ask_loops) {
        return std::nullopt;
    }
    for (std::size_t i = 0; i < block_size; ++i) {
        if (passes[i] == 0 && !block.ask_loops) {
            continue;
        }
        if (!loops_agree(bound, xs[i], y, passes[i], talnumericarray::instruction_sets{})) {
            return Violation{xs[i], "vectors answer otherwise than the formula for them"};
        }
        if (passes[i] == 0) {
            continue;
        }
        ++counts.passed;
        if (verdict_in_mode(tol, xs[i], y) != 0) {
            return Violation{xs[i], "the fast test passes a pair that differs"};
        }
    }
    return std::nullopt;
}

// What a thread remembers before a pair.
struct Remembered {
    float tol;
    float factor;
};

bool still_remembered(const Remembered& remembered) {
    float factor_now = 0;
    return nesk::recall_factor(remembered.tol, factor_now) && factor_now == remembered.factor;
}

struct Setting {
    const Direction& direction;
    const Treatment& treatment;
    const Tolerance& tolerance;
};

void print(const Setting& setting, const float factor, const float x, const float y,
           const char* const reason) {
    std::printf("proof_flushed: %s: tol %a, factor %a, x %a, y %a, %s, %s\n", reason,
                static_cast<double>(setting.tolerance.tol), static_cast<double>(factor),
                static_cast<double>(x), static_cast<double>(y), setting.direction.name,
                setting.treatment.name);
}

Remembered remembered_in_mode(const Tolerance& tolerance) {
    const float tol = tolerance.remembered ? tolerance.tol : 0.25F;
    const Remembered remembered = {tol, factor_in_mode(tol)};
    nesk::remember_factor<float>({remembered.tol, remembered.factor});
    return remembered;
}

std::optional<Violation> violation_in_mode(const float divisor, const Remembered& remembered,
                                           const float tol, const Block& block, const float y,
                                           Counts& counts) {
    const auto violation = divisor == 0
                               ? violation_in_block(equality{}, tol, block, y, counts)
                               : violation_in_block(Nearness{divisor}, tol, block, y, counts);
    if (!violation && !still_remembered(remembered)) {
        return Violation{real(block.first), "a pair at or after x changes what is remembered"};
    }
    return violation;
}

// Whether the claim holds for a second operand and all first ones of the blocks.
bool holds(const Setting& setting, const std::vector<Block>& blocks, const float y,
           Counts& counts) {
    const float tol = setting.tolerance.tol;
    const bool has_divisor =
        (setting.tolerance.remembered || tol >= limits::digits) && !setting.treatment.only_results;
    std::optional<Violation> violation;
    Remembered remembered = {};
    {
        const ModeScope scope(setting.direction, setting.treatment);
        remembered = remembered_in_mode(setting.tolerance);
        const float divisor = divisor_in_mode(tol);
        if ((divisor != 0) != has_divisor) {
            violation = Violation{0, "there is a divisor where none should be, or none"};
        }
        for (std::size_t i = 0; i < blocks.size() && !violation; ++i) {
            violation = violation_in_mode(divisor, remembered, tol, blocks[i], y, counts);
        }
    }
    if (violation) {
        print(setting, remembered.factor, violation->x, y, violation->reason);
    }
    return !violation;
}

// Where only results are flushed, the divisor of IEEE arithmetic has to be found wanting. If it is
// not, this program cannot find what it looks for.
#if defined(__SSE2__)
bool finds_unsafe_divisor(const Setting& setting) {
    const float tol = setting.tolerance.tol;
    const Remembered remembered = remembered_in_mode(setting.tolerance);
    const float divisor = divisor_in_mode(tol);
    const float y = limits::denorm_min();
    Counts counts;
    bool found = false;
    {
        const ModeScope scope(setting.direction, setting.treatment);
        for (const Block& block : {Block{0, 1, false}, Block{0x80000000, 1, false}}) {
            found = found || violation_in_mode(divisor, remembered, tol, block, y, counts);
        }
    }
    if (!found) {
        print(setting, remembered.factor, 0, y, "no pair is found that the guard is for");
    }
    return found;
}
#endif

// ---- The extents of a run

template <typename Action>
bool for_each_mode(const Action& action) {
    for (const Direction& direction : directions) {
        for (const Treatment& treatment : treatments) {
            if (!action(direction, treatment)) {
                return false;
            }
        }
    }
    return true;
}

bool try_guard() {
    return for_each_mode([](const Direction& direction, const Treatment& treatment) {
#if defined(__SSE2__)
        for (const Tolerance& tolerance : tolerances) {
            if (treatment.only_results && tolerance.remembered
                && !finds_unsafe_divisor({direction, treatment, tolerance})) {
                return false;
            }
        }
#endif
        return true;
    });
}

bool try_thinned(Counts& counts) {
    for (const Tolerance& tolerance : tolerances) {
        for (const float y : second_operands(tolerance.tol)) {
            const std::vector<Block> blocks = thinned_blocks(tolerance.tol, y);
            if (!for_each_mode([&](const Direction& direction, const Treatment& treatment) {
                    return holds({direction, treatment, tolerance}, blocks, y, counts);
                })) {
                return false;
            }
        }
    }
    return true;
}

bool try_all(Counts& counts) {
    std::vector<Block> blocks;
    for (std::uint64_t first = 0; first < std::uint64_t{1} << 32; first += block_size) {
        blocks.push_back({static_cast<std::uint32_t>(first), 1, false});
    }
    for (const Tolerance& tolerance : tolerances_of_all) {
        for (const float y : second_operands_of_all(tolerance.tol)) {
            if (!for_each_mode([&](const Direction& direction, const Treatment& treatment) {
                    std::fprintf(stderr, "tol %g, y %a, %s, %s\n",
                                 static_cast<double>(tolerance.tol), static_cast<double>(y),
                                 direction.name, treatment.name);
                    return holds({direction, treatment, tolerance}, blocks, y, counts);
                })) {
                return false;
            }
        }
    }
    return true;
}

} // namespace

int main(const int argc, const char* const* const argv) {
    const bool all = argc == 2 && std::strcmp(argv[1], "--all") == 0;
    if (argc > 1 && !all) {
        std::fputs("usage: proof_flushed [--all]\n", stderr);
        return 2;
    }
    Counts counts;
    if (!try_guard() || !(all ? try_all(counts) : try_thinned(counts))) {
        return EXIT_FAILURE;
    }
    std::printf("%llu pairs, of which %llu pass, in %zu modes: all as claimed\n",
                static_cast<unsigned long long>(counts.pairs),
                static_cast<unsigned long long>(counts.passed),
                std::size(directions) * std::size(treatments));
    return EXIT_SUCCESS;
}
