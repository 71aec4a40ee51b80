// Draws from the bytes of an input. Zero bytes draw the plainest choice, as does an input that is
// used up.

#pragma once

#include "draws.h"

#include <cstddef>
#include <cstdint>

#include <fuzzer/FuzzedDataProvider.h>

namespace fuzz {

class InputDraws final : public oracle::Draws {
  public:
    InputDraws(const std::uint8_t* bytes, const std::size_t size) : bytes_(bytes, size) {}

    std::uint64_t bits() override { return bytes_.ConsumeIntegral<std::uint64_t>(); }

    // As few bytes as will do.
    std::uint32_t below(const std::uint32_t bound) override {
        return bytes_.ConsumeIntegralInRange<std::uint32_t>(0, bound - 1);
    }

    std::size_t index(const std::size_t size) {
        return bytes_.ConsumeIntegralInRange<std::size_t>(0, size - 1);
    }

    // Zero bytes make this false, unlike `one_in`.
    bool rarely(const std::uint32_t bound) { return below(bound) == bound - 1; }

    bool used_up() { return bytes_.remaining_bytes() == 0; }

  private:
    FuzzedDataProvider bytes_;
};

} // namespace fuzz
