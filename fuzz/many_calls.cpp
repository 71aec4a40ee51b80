// Calls one after another with short arrays under changing tolerances: the module remembers and
// forgets factors as the oracle does.

#include "checked_call.h"
#include "input_draws.h"
#include "random_arrays.h"

#include <cstddef>
#include <cstdint>

namespace {

using fuzz::InputDraws;
using fuzz::Operand;

// Mostly a recent one, or one that may become the same single.
double next_tolerance(InputDraws& draws, oracle::RandomTolerances& tolerances) {
    const double tolerance = tolerances.next(draws);
    return draws.rarely(8) ? tolerance + 0x1p-22 * draws.between(0, 15) : tolerance;
}

// One or more pairs to each call, mostly of reals; integers are compared with reals only.
void make_call(InputDraws& draws, oracle::State& state, const double tolerance) {
    const int first_type = draws.pick({10, 9, 12, 11, 5, 8, 2});
    const int second_type = draws.pick({10, 9, 12, 11});
    const talint count = draws.between(1, 4);
    Operand first(first_type, {count}, count, 0);
    Operand second(second_type, {count}, count, 0);
    for (std::size_t i = 0; i < static_cast<std::size_t>(count); ++i) {
        oracle::draw_elements(draws, tolerance, first_type, second_type, !draws.rarely(4),
                              first.element(i), second.element(i));
    }
    const int any_type = 1;
    fuzz::check_call(state, tolerance, any_type, first, second);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, const std::size_t size) {
    constexpr int most_calls = 32;
    InputDraws draws(bytes, size);
    oracle::RandomTolerances tolerances;
    oracle::State state = fuzz::known_state();
    for (int calls = 0; calls < most_calls && !draws.used_up(); ++calls) {
        make_call(draws, state, next_tolerance(draws, tolerances));
    }
    return 0;
}
