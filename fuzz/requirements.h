// What has to hold for every input; otherwise the program ends and libFuzzer keeps the input.

#pragma once

#include "checked_call.h"

#include <algorithm>
#include <string>

namespace fuzz {

inline void require(const bool holds, const char* what_has_to_hold) {
    if (!holds) {
        fail(std::string("it does not hold that ") + what_has_to_hold);
    }
}

inline void require_line(const std::string& text) {
    const bool line =
        std::all_of(text.begin(), text.end(), [](const char c) { return c >= ' ' && c <= '~'; });
    if (!line || text.empty()) {
        fail("not one line of printable characters: " + text);
    }
}

} // namespace fuzz
