// Tolerances of every kind, for answers that must not depend on them.

#pragma once

#include <cmath>

inline constexpr double every_tolerance[] = {
    0, -0.0, -1, 1e-300, 0.5, 1, 10, 23.5, 24, 30, 52.5, 53, 60, 1e300, HUGE_VAL, -HUGE_VAL, NAN};

// The answer of `ask(tol)` under every tolerance, or 99 if it is not always the same.
template <typename Ask>
int under_every_tolerance(const Ask& ask) {
    const int answer = ask(every_tolerance[0]);
    for (const double tol : every_tolerance) {
        if (ask(tol) != answer) {
            return 99;
        }
    }
    return answer;
}
