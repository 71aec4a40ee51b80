// What a program can ask of floating-point arithmetic: a direction of rounding, and to treat
// subnormal numbers as zero.

#pragma once

#include <gtest/gtest.h>

#include <cfenv>
#include <cstdint>

#if defined(__SSE2__)
#    include <xmmintrin.h>
#endif

// ---- Directions of rounding

struct Rounding {
    const char* name;
    int mode;
};

inline constexpr Rounding roundings[] = {
    {"to nearest", FE_TONEAREST},
    {"upward", FE_UPWARD},
    {"downward", FE_DOWNWARD},
    {"toward zero", FE_TOWARDZERO},
};

// Rounds in one direction for as long as it lives.
class RoundingScope {
  public:
    explicit RoundingScope(const Rounding& rounding) : before_(std::fegetround()) {
        EXPECT_EQ(std::fesetround(rounding.mode), 0) << rounding.name;
    }
    RoundingScope(const RoundingScope&) = delete;
    RoundingScope& operator=(const RoundingScope&) = delete;
    ~RoundingScope() { std::fesetround(before_); }

  private:
    int before_;
};

// ---- The processor's control word: status flags, which arithmetic sets, and all that it obeys

#if defined(__SSE2__)

inline constexpr std::uint64_t status_flags = 0x3F;
// One bit for subnormal results, one for subnormal operands.
inline constexpr std::uint64_t flushing = 0x8040;

inline std::uint64_t control_word() {
    return _mm_getcsr();
}

inline void set_control_word(const std::uint64_t word) {
    _mm_setcsr(static_cast<unsigned>(word));
}

#elif defined(__aarch64__)

inline constexpr std::uint64_t status_flags = 0;
inline constexpr std::uint64_t flushing = 1 << 24;

inline std::uint64_t control_word() {
    std::uint64_t word = 0;
    asm volatile("mrs %0, fpcr" : "=r"(word));
    return word;
}

inline void set_control_word(const std::uint64_t word) {
    asm volatile("msr fpcr, %0" : : "r"(word));
}

#elif defined(__arm__)

// Including the condition flags, which comparisons set for branches.
inline constexpr std::uint64_t status_flags = 0xF800009F;
inline constexpr std::uint64_t flushing = 1 << 24;

inline std::uint64_t control_word() {
    std::uint32_t word = 0;
    asm volatile("vmrs %0, fpscr" : "=r"(word));
    return word;
}

inline void set_control_word(const std::uint64_t word) {
    asm volatile("vmsr fpscr, %0" : : "r"(static_cast<std::uint32_t>(word)));
}

#elif defined(__s390x__)

// Including the cause of the last trap.
inline constexpr std::uint64_t status_flags = 0x00F8FF00;
inline constexpr std::uint64_t flushing = 0; // there is no such mode

inline std::uint64_t control_word() {
    std::uint32_t word = 0;
    asm volatile("efpc %0" : "=d"(word));
    return word;
}

inline void set_control_word(const std::uint64_t word) {
    asm volatile("sfpc %0" : : "d"(static_cast<std::uint32_t>(word)));
}

#else
#    error "this processor's control word of floating point is not known here"
#endif

// Treats subnormal numbers as zero for as long as it lives, if the processor can: in all ways, or
// only in a part of `flushing`.
class FlushingScope {
  public:
    explicit FlushingScope(const std::uint64_t part = flushing)
        : before_(control_word() & flushing) {
        set_control_word((control_word() & ~flushing) | part);
    }
    FlushingScope(const FlushingScope&) = delete;
    FlushingScope& operator=(const FlushingScope&) = delete;
    ~FlushingScope() { set_control_word((control_word() & ~flushing) | before_); }

  private:
    std::uint64_t before_;
};
