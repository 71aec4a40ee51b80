// A signal handler that compares too, under whatever tolerance, may interrupt a comparison anywhere
// and may leave it for good: every answer is as if undisturbed.
//
// On x86-64 the processor traps after each instruction of the interrupted comparison; on every
// platform a timer interrupts it now and again. Functions are bound when the program starts, as the
// dynamic linker is not the subject.

#include "support/arrays.h"
#include "support/child_process.h"
#include "support/random_arrays.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <cmath>
#include <csetjmp>
#include <csignal>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <iostream>
#include <limits>
#include <vector>

#include <sys/time.h>
#include <unistd.h>

#if defined(__x86_64__)
#    include <x86intrin.h>
#endif

namespace {

// ---- Questions whose answers are wrong by the factor of another tolerance

struct Question {
    talreal tol;
    TalNumericArray array1, array2;
    int same;
};

bool is_answered_right(const Question& question) {
    return TalNumericArray_sameQ(question.tol, 1, question.array1, question.array2)
           == question.same;
}

// Tolerances so far apart that no two of their factors answer the same question right.
const std::vector<double> every_kind = {4, 8.5, 17, NAN};

// For each tolerance two questions, about numbers well within its limit and well beyond it. The
// factor of NaN makes no two numbers the same.
template <typename T>
class Questions {
  public:
    explicit Questions(const std::size_t count,
                       const std::vector<double>& tolerances = every_kind) {
        for (const double tol : tolerances) {
            add(tol, count, 0.5);
            add(tol, count, 2);
        }
    }

    const Question& operator[](const std::size_t index) const { return questions_[index]; }
    std::size_t size() const { return questions_.size(); }

  private:
    // The first and the last pair need the factor; the last one decides. Numbers of at least 1 are
    // judged in another way than smaller ones.
    void add(const double tol, const std::size_t count, const double share_of_limit) {
        const double limit =
            std::isnan(tol) ? 0.125 : std::exp2(tol - std::numeric_limits<T>::digits);
        std::vector<T> elements1(count);
        std::vector<T> elements2(count);
        for (std::size_t i = 0; i < count; ++i) {
            const double number = i % 2 == 0 ? 1 : 0.125;
            const double share = i + 1 == count ? share_of_limit : i == 0 ? 0.5 : 0;
            elements1[i] = static_cast<T>(number);
            elements2[i] = static_cast<T>(number + number * limit * share);
        }
        const std::vector<talint> dimensions = {static_cast<talint>(count)};
        const Array<T>& array1 = arrays_.emplace_back(dimensions, elements1);
        const Array<T>& array2 = arrays_.emplace_back(dimensions, elements2);
        const bool same = share_of_limit < 1 && !std::isnan(tol);
        questions_.push_back({tol, array1.handle(), array2.handle(), same ? 1 : 0});
    }

    std::deque<Array<T>> arrays_; // a deque does not move them
    std::vector<Question> questions_;
};

// ---- The handler

// What the handler asks, an entry for each interruption and then over again; a null asks nothing.
using Script = std::vector<const Question*>;

using Ask = bool (*)(const Question& question);

struct Handler {
    const Script* volatile script = nullptr;
    std::size_t next = 0;
    std::atomic<long> interruptions{0};
    std::atomic<long> wrong_answers{0};
    // Whether each interruption forks a child, and where the child goes.
    bool leaves_in_child = false;
    sigjmp_buf target = {};
    // How the handler asks, and what another asks that interrupts it meanwhile.
    Ask ask = is_answered_right;
    const Question* innermost = nullptr;
    int depth = 0;
};

Handler handler;

void ask_once() {
    const Script* const script = handler.script;
    if (script == nullptr) {
        return;
    }
    const Question* const question = (*script)[handler.next++ % script->size()];
    if (question != nullptr && !handler.ask(*question)) {
        ++handler.wrong_answers;
    }
}

void leave_in_child() {
    const ChildEnd end = in_child([]() -> int { siglongjmp(handler.target, 1); });
    handler.wrong_answers += end == success ? 0 : 1;
}

void interrupt(const int /*signal*/) {
    if (handler.depth > 0) {
        handler.wrong_answers += is_answered_right(*handler.innermost) ? 0 : 1;
        return;
    }
    ++handler.interruptions;
    ++handler.depth;
    ask_once();
    --handler.depth;
    if (handler.leaves_in_child) {
        leave_in_child();
    }
}

class HandlerScope {
  public:
    explicit HandlerScope(const int signal) : signal_(signal) {
        struct sigaction action = {};
        action.sa_handler = interrupt;
        // So that the handler can be interrupted as well.
        action.sa_flags = signal == SIGTRAP ? SA_NODEFER : 0;
        handler.interruptions = 0;
        handler.wrong_answers = 0;
        EXPECT_EQ(::sigaction(signal, &action, &before_), 0);
    }
    HandlerScope(const HandlerScope&) = delete;
    HandlerScope& operator=(const HandlerScope&) = delete;
    ~HandlerScope() { ::sigaction(signal_, &before_, nullptr); }

  private:
    int signal_;
    struct sigaction before_ = {};
};

class ScriptScope {
  public:
    explicit ScriptScope(const Script& script) {
        handler.next = 0;
        handler.script = &script;
    }
    ScriptScope(const ScriptScope&) = delete;
    ScriptScope& operator=(const ScriptScope&) = delete;
    ~ScriptScope() { handler.script = nullptr; }
};

// Three scripts: always the other question; it and the interrupted one in turn; both at random,
// with pauses.
std::vector<Script> scripts(const Question& interrupted, const Question& other) {
    constexpr std::uint64_t seed = 1;
    oracle::Random random(seed);
    const Question* const choices[] = {nullptr, nullptr, nullptr, &other, &interrupted};
    Script with_pauses(101);
    for (const Question*& asked : with_pauses) {
        asked = random.pick(choices);
    }
    return {{&other}, {&other, &interrupted}, with_pauses};
}

struct Tally {
    long comparisons = 0;
    long wrong_answers = 0;
    long wrong_answers_afterwards = 0;
};

// By then the thread has to remember a tolerance with its own factor.
void ask_afterwards(Tally& tally, const Question& first, const Question& second) {
    for (const Question* question : {&first, &second, &first}) {
        tally.wrong_answers_afterwards += is_answered_right(*question) ? 0 : 1;
    }
}

void expect_all_right(const Tally& tally) {
    std::cout << tally.comparisons << " comparisons, interrupted " << handler.interruptions
              << " times" << std::endl;
    EXPECT_GT(handler.interruptions, 0);
    EXPECT_EQ(tally.wrong_answers, 0);
    EXPECT_EQ(handler.wrong_answers, 0) << "of the handler";
    EXPECT_EQ(tally.wrong_answers_afterwards, 0);
}

// Each question is interrupted by one question under each other tolerance, about numbers on the
// same side of the limit. `ask` may be interrupted.
template <typename Interrupted, typename Other>
void ask_all(Tally& tally, const Questions<Interrupted>& questions, const Questions<Other>& others,
             const Ask ask) {
    const auto ask_two = [&](const Question& interrupted, const Question& other) {
        for (const Script& script : scripts(interrupted, other)) {
            for (const Question* remembered : {&interrupted, &other}) {
                is_answered_right(*remembered);
                const ScriptScope scope(script);
                ++tally.comparisons;
                tally.wrong_answers += ask(interrupted) ? 0 : 1;
                ask_afterwards(tally, other, interrupted);
            }
        }
    };
    for (std::size_t i = 0; i < questions.size(); ++i) {
        for (std::size_t other = i % 2; other < others.size(); other += 2) {
            if (others[other].tol != questions[i].tol) {
                ask_two(questions[i], others[other]);
            }
        }
    }
}

// ---- Interrupted after each instruction

class Stepped : public testing::Test {
  protected:
    void SetUp() override {
#if !defined(__x86_64__)
        GTEST_SKIP() << "NOT TESTED: comparisons are stepped through on x86-64 alone";
#endif
        if (address_sanitizer || thread_sanitizer) {
            GTEST_SKIP() << "NOT TESTED: a sanitizer's own code may not be interrupted anywhere";
        }
    }
};

// The kernel clears the trap flag for a handler, and restores it afterwards.
bool is_answered_right_in_steps(const Question& question) {
#if defined(__x86_64__)
    constexpr unsigned long long trap_flag = 0x100;
    __writeeflags(__readeflags() | trap_flag);
    const bool right = is_answered_right(question);
    __writeeflags(__readeflags() & ~trap_flag);
    return right;
#else
    return is_answered_right(question);
#endif
}

template <typename Interrupted, typename Other>
void expect_steps_all_right(const Questions<Interrupted>& questions,
                            const Questions<Other>& others) {
    const HandlerScope scope(SIGTRAP);
    Tally tally;
    ask_all(tally, questions, others, is_answered_right_in_steps);
    expect_all_right(tally);
}

TEST_F(Stepped, ComparisonsOfDoublesAnswerAsIfUndisturbed) {
    const Questions<double> questions(2);
    expect_steps_all_right(questions, questions);
}

TEST_F(Stepped, ComparisonsOfSinglesAnswerAsIfUndisturbed) {
    const Questions<float> questions(2);
    expect_steps_all_right(questions, questions);
}

TEST_F(Stepped, ComparisonsOfOtherWidthThanTheHandlersAnswerAsIfUndisturbed) {
    const Questions<double> doubles(1, {4, 17.5});
    const Questions<float> singles(1, {4, 17.5});
    expect_steps_all_right(doubles, singles);
    expect_steps_all_right(singles, doubles);
}

TEST_F(Stepped, ComparisonsInBlocksAnswerAsIfUndisturbed) {
    expect_steps_all_right(Questions<double>(140, {4}), Questions<double>(1, {17.5}));
    expect_steps_all_right(Questions<float>(140, {4}), Questions<float>(1, {17.5}));
}

// The handler's own comparisons are stepped through as well.
TEST_F(Stepped, ComparisonsOfTheHandlerAnswerAsIfUndisturbed) {
    const Questions<double> questions(1, {4, 10, 17});
    const HandlerScope scope(SIGTRAP);
    Script script(11);
    script[0] = &questions[2];
    const ScriptScope script_scope(script);
    handler.ask = is_answered_right_in_steps;
    handler.innermost = &questions[4];
    Tally tally;
    for (int run = 0; run < 2; ++run) {
        ++tally.comparisons;
        tally.wrong_answers += is_answered_right_in_steps(questions[0]) ? 0 : 1;
        ask_afterwards(tally, questions[2], questions[4]);
    }
    handler.ask = is_answered_right;
    expect_all_right(tally);
}

// Leaves the comparison after each instruction, each time in another process, and then asks under
// both tolerances, `first` before `second`.
void leave_after_each_step(Tally& tally, const Question& interrupted, const Question& first,
                           const Question& second) {
    if (sigsetjmp(handler.target, 1) != 0) {
        Tally afterwards;
        ask_afterwards(afterwards, first, second);
        ::_exit(afterwards.wrong_answers_afterwards == 0 ? 0 : 1);
    }
    handler.leaves_in_child = true;
    ++tally.comparisons;
    tally.wrong_answers += is_answered_right_in_steps(interrupted) ? 0 : 1;
    handler.leaves_in_child = false;
}

TEST_F(Stepped, ComparisonsMayBeLeftForGood) {
    const Questions<double> questions(1, {4, 17.5});
    const Question& interrupted = questions[0];
    const Question& other = questions[2];
    const HandlerScope scope(SIGTRAP);
    Tally tally;
    is_answered_right(other);
    leave_after_each_step(tally, interrupted, interrupted, other);
    is_answered_right(other);
    leave_after_each_step(tally, interrupted, other, interrupted);
    expect_all_right(tally);
}

// A thread still remembers factors after a handler has left one of its comparisons for good.
TEST_F(Stepped, ComparisonsThatAreLeftDoNotKeepFactorsFromBeingRemembered) {
    const Questions<double> questions(1, {4, 17.5});
    const Array<double> one({1}, {1.0});
    const Array<double> near_one({1}, {1.1});
    const Array<double> far_from_one({1}, {2.5});
    const Question needs_factor = {52.5, one.handle(), near_one.handle(), 1};
    // Numbers that are the same only if the factor is remembered.
    const Question finds_factor = {52.5, one.handle(), far_from_one.handle(), 1};
    const HandlerScope scope(SIGTRAP);
    Tally tally;
    is_answered_right(questions[2]);
    EXPECT_FALSE(is_answered_right(finds_factor));
    leave_after_each_step(tally, questions[0], needs_factor, finds_factor);
    expect_all_right(tally);
}

// ---- Interrupted by a timer, wherever the comparison happens to be

class IntervalTimer {
  public:
    IntervalTimer() { set(100); }
    IntervalTimer(const IntervalTimer&) = delete;
    IntervalTimer& operator=(const IntervalTimer&) = delete;
    ~IntervalTimer() { set(0); }

  private:
    static void set(const suseconds_t microseconds) {
        const itimerval interval = {{0, microseconds}, {0, microseconds}};
        EXPECT_EQ(::setitimer(ITIMER_REAL, &interval, nullptr), 0);
    }
};

TEST(Timer, LeavesAnswersUndisturbed) {
#if defined(SIGNALS_LOSE_VECTOR_REGISTERS)
    GTEST_SKIP() << "NOT TESTED: this emulator does not save vector registers around handlers";
#endif
    const Questions<double> doubles(5);
    const Questions<float> singles(5);
    const Questions<double> long_doubles(260);
    const HandlerScope scope(SIGALRM);
    Tally tally;
    const IntervalTimer timer;
    const auto end = std::chrono::steady_clock::now() + std::chrono::seconds(1);
    while (std::chrono::steady_clock::now() < end) {
        ask_all(tally, doubles, doubles, is_answered_right);
        ask_all(tally, singles, doubles, is_answered_right);
        ask_all(tally, singles, singles, is_answered_right);
        ask_all(tally, long_doubles, doubles, is_answered_right);
    }
    expect_all_right(tally);
}

} // namespace
