// Calls one after another with short arrays under changing tolerances: the module remembers and
// forgets factors as the oracle does.

#include "checked_call.h"
#include "draws.h"

#include <array>
#include <cstddef>
#include <cstdint>

namespace {

using fuzz::Draws;
using fuzz::Operand;

// The tolerances of late, to which calls return.
class Tolerances {
  public:
    double next(Draws& draws) {
        const std::size_t choice = fuzz::drawn_index(draws, recent_.size() + 3);
        if (choice < recent_.size()) {
            return recent_[choice];
        }
        oldest_ = (oldest_ + 1) % recent_.size();
        return recent_[oldest_] = fuzz::drawn_tolerance(draws);
    }

  private:
    std::array<double, 4> recent_{{52.5, 23.5, 52.75, 10}};
    std::size_t oldest_ = 0;
};

// One or more pairs to each call, mostly of reals; integers stand beside reals only.
void make_call(Draws& draws, oracle::State& state, const double tolerance) {
    const int first_type = draws.PickValueInArray({10, 9, 12, 11, 5, 8, 2});
    const int second_type = draws.PickValueInArray({10, 9, 12, 11});
    const talint count = draws.ConsumeIntegralInRange(1, 4);
    Operand first(first_type, {count}, count, 0);
    Operand second(second_type, {count}, count, 0);
    for (std::size_t i = 0; i < static_cast<std::size_t>(count); ++i) {
        fuzz::draw_elements(draws, tolerance, first_type, second_type, first.element(i),
                            second.element(i));
    }
    const int any_type = 1;
    fuzz::check_call(state, tolerance, any_type, first, second);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, const std::size_t size) {
    constexpr int most_calls = 32;
    Draws draws(bytes, size);
    Tolerances tolerances;
    oracle::State state = fuzz::known_state();
    for (int calls = 0; calls < most_calls && draws.remaining_bytes() > 0; ++calls) {
        make_call(draws, state, tolerances.next(draws));
    }
    return 0;
}
