// How much stack a comparison takes: the stack of a thread is painted, all kinds of comparisons are
// made on it, and the paint that is left shows how deep they went. Functions are bound beforehand,
// as the dynamic linker would need more than the comparisons do.

#include "support/prepared_calls.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <iostream>
#include <memory>

#include <pthread.h>

namespace {

// Bytes below the caller's frame, including those of the C library's power function. Without
// optimisation every vector in a computation has its own place on the stack.
#if defined(__OPTIMIZE__)
constexpr std::ptrdiff_t limit = 2048;
#else
constexpr std::ptrdiff_t limit = 8192;
#endif

constexpr unsigned char paint = 0xA5;

class PaintedStack {
  public:
    // Runs `start(argument)` in a thread on this stack.
    void run(void* (*start)(void*), void* argument) {
        pthread_attr_t attributes;
        ASSERT_EQ(::pthread_attr_init(&attributes), 0);
        ASSERT_EQ(::pthread_attr_setstack(&attributes, memory_->bytes, size), 0);
        pthread_t thread{};
        ASSERT_EQ(::pthread_create(&thread, &attributes, start, argument), 0);
        ASSERT_EQ(::pthread_join(thread, nullptr), 0);
        ASSERT_EQ(::pthread_attr_destroy(&attributes), 0);
    }

    // Paints the stack below the caller, except for the frame of this function, which calls nothing
    // so that its frame is small: on 32-bit ARM the comparisons themselves take little more.
    [[gnu::noinline]] void paint_below_caller() {
        constexpr std::ptrdiff_t own_frame = 128;
        const auto* const here = static_cast<unsigned char*>(__builtin_frame_address(0));
        const std::ptrdiff_t size_below = here - own_frame - lowest();
        volatile unsigned char* const bytes = memory_->bytes; // else memset might be called
        for (std::ptrdiff_t i = 0; i < size_below; ++i) {
            bytes[i] = paint;
        }
    }

    // How far below `top` the lowest byte lies that has lost its paint.
    std::ptrdiff_t depth_below(const unsigned char* top) const {
        return top - std::find_if(lowest(), top, [](unsigned char byte) { return byte != paint; });
    }

  private:
    static constexpr std::size_t size = std::size_t{256} * 1024;

    struct alignas(4096) Memory {
        unsigned char bytes[size];
    };

    const unsigned char* lowest() const { return memory_->bytes; }

    std::unique_ptr<Memory> memory_ = std::make_unique<Memory>();
};

struct Measurement {
    const PreparedCalls& prepared;
    bool skip_calls;
    PaintedStack stack;
    std::ptrdiff_t depth = 0;
    int wrong = 0;
};

[[gnu::noinline]] void make_calls(Measurement& measured) {
    const auto* const top = static_cast<unsigned char*>(__builtin_frame_address(0));
    measured.wrong = measured.skip_calls ? 0 : measured.prepared.wrong_answers();
    measured.depth = measured.stack.depth_below(top);
}

void* paint_and_make_calls(void* measurement) {
    auto& measured = *static_cast<Measurement*>(measurement);
    measured.stack.paint_below_caller();
    make_calls(measured);
    return nullptr;
}

TEST(Stack, OfAComparisonIsBelowALimit) {
    if (address_sanitizer || thread_sanitizer) {
        GTEST_SKIP() << "NOT TESTED: a sanitizer's frames say nothing about the module";
    }
    const PreparedCalls prepared;
    Measurement without_calls{prepared, true, {}};
    without_calls.stack.run(paint_and_make_calls, &without_calls);
    Measurement with_calls{prepared, false, {}};
    with_calls.stack.run(paint_and_make_calls, &with_calls);
    EXPECT_EQ(with_calls.wrong, 0);
    EXPECT_GT(with_calls.depth, without_calls.depth) << "nothing is measured";
    EXPECT_LE(with_calls.depth, limit);
    std::cout << "stack of the comparisons: " << with_calls.depth << " bytes" << std::endl;
    RecordProperty("stack", static_cast<int>(with_calls.depth));
}

} // namespace
