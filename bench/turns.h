// Contenders take turns in short batches of calls, so that other work of the machine affects all of
// them, and the shortest time of each counts.

#pragma once

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <limits>
#include <vector>

struct Effort {
    double batch; // nanoseconds, at least; 0 is one call
    int turns;
};

class Contender {
  public:
    // `ask()` is what is timed: a call, and whether its answer is right.
    template <typename Ask>
    explicit Contender(const Ask& ask)
        : batch_([ask](const int calls) { return nanoseconds(ask, calls); }) {}

    // As many as make every batch long enough for the clock: a batch that was interrupted says
    // little.
    void choose_calls(const double batch) {
        while (batch > 0 && shortest_batch() < batch) {
            calls_ *= 2;
        }
    }

    void take_turn() { best_ = std::min(best_, batch_(calls_) / calls_); }

    // Of a call.
    double nanoseconds() const { return best_; }

  private:
    double shortest_batch() const {
        constexpr int batches = 5;
        double shortest = batch_(calls_);
        for (int i = 1; i < batches; ++i) {
            shortest = std::min(shortest, batch_(calls_));
        }
        return shortest;
    }

    template <typename Ask>
    static double nanoseconds(const Ask& ask, const int calls) {
        bool right = true;
        const auto start = std::chrono::steady_clock::now();
        for (int i = 0; i < calls; ++i) {
            right &= ask();
            // So that the compiler cannot reuse the answer of the call before.
            asm volatile("" : : : "memory");
        }
        const std::chrono::duration<double, std::nano> time =
            std::chrono::steady_clock::now() - start;
        if (!right) {
            std::fputs("an answer is wrong\n", stderr);
            std::abort();
        }
        return time.count();
    }

    std::function<double(int calls)> batch_;
    int calls_ = 1;
    double best_ = std::numeric_limits<double>::infinity();
};

// Whether the program is called with --quick; ends the program if it is called in any other way.
inline bool is_quick(const int count, char** const arguments) {
    const bool quick = count == 2 && std::strcmp(arguments[1], "--quick") == 0;
    if (count > 1 && !quick) {
        std::fprintf(stderr, "usage: %s [--quick]\n", arguments[0]);
        // NOLINTNEXTLINE(concurrency-mt-unsafe): no other thread runs yet
        std::exit(2);
    }
    return quick;
}

inline void take_turns(std::vector<Contender>& contenders, const Effort& effort) {
    for (Contender& contender : contenders) {
        contender.choose_calls(effort.batch);
    }
    for (int turn = 0; turn < effort.turns; ++turn) {
        for (Contender& contender : contenders) {
            contender.take_turn();
        }
    }
}
