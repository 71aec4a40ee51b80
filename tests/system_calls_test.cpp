// A comparison makes no system call, and so neither blocks nor waits: in the kernel's strict mode a
// process that makes one is killed, except for the call that ends its only thread.

#include "support/child_process.h"
#include "support/prepared_calls.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <csignal>

#include <linux/seccomp.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <unistd.h>

namespace {

constexpr int wrong_answer = 1;
constexpr int strict_mode_refused = 2;

// Not with _exit, which ends all threads by another system call.
[[noreturn]] void leave_strict_mode(const int status) {
    for (;;) {
        ::syscall(SYS_exit, status);
    }
}

template <typename Body>
ChildEnd in_strict_mode(const Body& body) {
    return in_child([&body]() -> int {
        if (::prctl(PR_SET_SECCOMP, SECCOMP_MODE_STRICT) != 0) {
            return strict_mode_refused;
        }
        leave_strict_mode(body());
    });
}

class SystemCalls : public testing::Test {
  protected:
    void SetUp() override {
        if (thread_sanitizer) {
            GTEST_SKIP() << "NOT TESTED: ThreadSanitizer has a thread of its own in each process";
        }
        if (in_strict_mode([] { return 0; }) == ChildEnd{strict_mode_refused, 0}) {
            GTEST_SKIP() << "NOT TESTED: no strict mode here; emulators have none";
        }
    }
};

TEST_F(SystemCalls, AreSeenWhereThereAreAny) {
    EXPECT_EQ(in_strict_mode([] { return ::getppid() == 0 ? 1 : 0; }), killed_by(SIGKILL));
}

// The child is the first to compare: its parent has asked only the oracle.
TEST_F(SystemCalls, AreMadeByNoComparison) {
    const PreparedCalls prepared;
    EXPECT_EQ(in_strict_mode([&] { return prepared.wrong_answers() == 0 ? 0 : wrong_answer; }),
              success);
}

} // namespace
