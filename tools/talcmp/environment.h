// Variables of the environment.

#pragma once

#include <cstdlib>
#include <string>

namespace talcmp {

// Empty if the variable is not set.
inline std::string environment(const char* const variable) {
    // NOLINTNEXTLINE(concurrency-mt-unsafe): nothing changes the environment beside other threads.
    const char* const value = std::getenv(variable);
    return value == nullptr ? "" : value;
}

} // namespace talcmp
