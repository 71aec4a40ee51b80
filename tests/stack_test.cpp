// How much stack a comparison takes: the stack of a thread is painted, all kinds of comparisons are
// made on it, and the paint that is left tells how deep they went. What the program itself calls is
// bound before, as the dynamic linker would need more than the comparisons do.

#include "support/prepared_calls.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstring>
#include <iostream>
#include <memory>

#include <pthread.h>

namespace {

// Bytes below the frame of the function that calls, the power function of the C library included.
constexpr std::ptrdiff_t limit = 2048;

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

    // All below the caller but for what a call of a library's function takes.
    [[gnu::noinline]] void paint_below_caller() {
        constexpr std::ptrdiff_t own_frame = 256;
        const auto* const here = static_cast<unsigned char*>(__builtin_frame_address(0));
        std::memset(memory_->bytes, paint, static_cast<std::size_t>(here - own_frame - lowest()));
    }

    // How far below `top` the lowest byte is that is no longer painted.
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
    int (*use_stack)(const PreparedCalls&);
    const PreparedCalls& prepared;
    PaintedStack stack;
    std::ptrdiff_t depth = 0;
    int wrong = 0;
};

int make_calls(const PreparedCalls& prepared) {
    return prepared.wrong_answers();
}

int touch_the_limit(const PreparedCalls& /*unused*/) {
    volatile unsigned char touched[limit];
    for (volatile unsigned char& byte : touched) {
        byte = 0;
    }
    return 0;
}

[[gnu::noinline]] void measure_depth(Measurement& measured) {
    const auto* const top = static_cast<unsigned char*>(__builtin_frame_address(0));
    measured.wrong = measured.use_stack(measured.prepared);
    measured.depth = measured.stack.depth_below(top);
}

void* paint_and_measure(void* measurement) {
    auto& measured = *static_cast<Measurement*>(measurement);
    measured.stack.paint_below_caller();
    measure_depth(measured);
    return nullptr;
}

// No depth within what `paint_below_caller` leaves unpainted can be told apart: on 32-bit ARM
// comparisons take less.
TEST(Stack, OfAComparisonIsBelowALimit) {
    if (address_sanitizer || thread_sanitizer) {
        GTEST_SKIP() << "NOT TESTED: a sanitizer's frames say nothing about the module";
    }
    const PreparedCalls prepared;
    Measurement too_deep{touch_the_limit, prepared, {}};
    too_deep.stack.run(paint_and_measure, &too_deep);
    EXPECT_GE(too_deep.depth, limit) << "nothing is measured";
    Measurement of_calls{make_calls, prepared, {}};
    of_calls.stack.run(paint_and_measure, &of_calls);
    EXPECT_EQ(of_calls.wrong, 0);
    EXPECT_LE(of_calls.depth, limit);
    std::cout << "stack of the comparisons: " << of_calls.depth << " bytes" << std::endl;
    RecordProperty("stack", static_cast<int>(of_calls.depth));
}

} // namespace
