#include "compare_boxes.h"

#include <algorithm>
#include <atomic>
#include <exception>
#include <limits>
#include <mutex>
#include <optional>
#include <system_error>
#include <thread>
#include <vector>

namespace talcmp {
namespace {

// What the threads share: the next box, the number from which no pair is wanted, what failed.
class BoxQueue {
  public:
    explicit BoxQueue(const std::uint64_t box_count) : box_count_(box_count) {}

    // The number of the next box; nothing when all are done or something failed.
    std::optional<std::uint64_t> next_box() {
        const std::uint64_t box = next_box_++;
        return box < box_count_ && !stopped_ ? std::optional(box) : std::nullopt;
    }

    // All boxes before it have been given out, so the first of several failures is known in the
    // end.
    void fail(const std::uint64_t box, const std::exception_ptr& failure) {
        const std::lock_guard<std::mutex> lock(mutex_);
        if (!failure_ || box < failed_box_) {
            failed_box_ = box;
            failure_ = failure;
        }
        stopped_ = true;
    }

    void lower_bound_to(const std::uint64_t bound) {
        std::uint64_t known = bound_;
        while (bound < known && !bound_.compare_exchange_weak(known, bound)) {
        }
    }
    std::uint64_t bound() const { return bound_; }

    // Called when all threads have ended. A single thread would not have reached a box beyond
    // `bound`.
    void rethrow_failure_before(const std::uint64_t bound, const BoxPlan& plan) const {
        if (failure_ && !plan.is_beyond(plan.traversal().box(failed_box_), bound)) {
            std::rethrow_exception(failure_);
        }
    }

  private:
    std::uint64_t box_count_;
    std::atomic<std::uint64_t> next_box_ = 0;
    std::atomic<std::uint64_t> bound_ = std::numeric_limits<std::uint64_t>::max();
    std::atomic<bool> stopped_ = false;
    std::mutex mutex_;
    std::exception_ptr failure_;
    std::uint64_t failed_box_ = 0;
};

// The work of each thread.
void take_boxes(const BoxPlan& plan, BoxQueue& queue, BoxComparer& comparer,
                ProgressListener& progress) {
    remember_factor_of(plan.tolerance());
    while (const auto number = queue.next_box()) {
        try {
            const Box box = plan.traversal().box(*number);
            if (!plan.is_beyond(box, queue.bound())) {
                queue.lower_bound_to(comparer.compare(box));
                progress.advance(box.count * plan.bytes_of_pair());
            }
        } catch (...) {
            queue.fail(*number, std::current_exception());
        }
    }
}

// Runs `action(0)` here and `action(1)`, `action(2)`, ... below `count` in new threads, as many as
// the system can start.
template <typename Action>
void in_threads(const std::size_t count, const Action& action) {
    std::vector<std::thread> threads;
    try {
        for (std::size_t i = 1; i < count; ++i) {
            threads.emplace_back([&action, i] { action(i); });
        }
    } catch (const std::system_error&) {
        // The threads that exist do all of the work.
    }
    action(0);
    for (std::thread& thread : threads) {
        thread.join();
    }
}

} // namespace

unsigned thread_count(const BoxPlan& plan) {
    if (!plan.random_access()) {
        return 1;
    }
    constexpr unsigned most = 8; // a few MiB each; more are hardly faster
    const unsigned allowed = plan.question().threads;
    const unsigned wanted =
        allowed != 0 ? allowed : std::clamp(std::thread::hardware_concurrency(), 1U, most);
    // Large blocks are read by fewer threads, so that these take no more memory than many would
    // take for small ones.
    constexpr std::uint64_t most_bytes = std::uint64_t{48} << 20U;
    const std::uint64_t bytes = plan.traversal().largest_box() * plan.bytes_of_pair();
    const std::uint64_t in_memory =
        allowed != 0 ? wanted : std::max<std::uint64_t>(most_bytes / bytes, 1);
    return static_cast<unsigned>(
        std::min({std::uint64_t{wanted}, in_memory, plan.traversal().box_count()}));
}

Findings compare_boxes(const BoxPlan& plan, const unsigned threads, ProgressListener& progress) {
    BoxQueue queue(plan.traversal().box_count());
    std::vector<std::unique_ptr<BoxComparer>> comparers;
    for (unsigned i = 0; i < threads; ++i) {
        comparers.push_back(std::make_unique<BoxComparer>(plan));
    }
    in_threads(threads,
               [&](const std::size_t i) { take_boxes(plan, queue, *comparers[i], progress); });
    Findings sum = {FirstPairs(plan.question().differences), {}};
    for (const auto& comparer : comparers) {
        add(sum, comparer->findings());
    }
    queue.rethrow_failure_before(sum.first.bound(), plan);
    return sum;
}

} // namespace talcmp
