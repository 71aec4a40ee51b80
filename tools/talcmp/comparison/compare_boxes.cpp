#include "compare_boxes.h"

#include <algorithm>
#include <atomic>
#include <exception>
#include <limits>
#include <mutex>
#include <new>
#include <optional>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

namespace talcmp {
namespace {

// What the threads share: the next boxes, the number from which no pair is wanted, what failed.
class BoxQueue {
  public:
    BoxQueue(const BoxPlan& plan, BoxSupply& supply) : plan_(plan), supply_(supply) {}

    // The number of the next box; nothing when there are no more or something failed.
    std::optional<std::uint64_t> next_box() {
        const std::lock_guard<std::mutex> lock(mutex_);
        if (!stopped_ && range_.begin == range_.end) {
            range_ = supply_.next();
        }
        return stopped_ || range_.begin == range_.end ? std::nullopt
                                                      : std::optional(range_.begin++);
    }

    // All boxes before it have been given out, so the first of several failures is known in the
    // end.
    void fail(const std::uint64_t box, const std::exception_ptr& reason) {
        const std::lock_guard<std::mutex> lock(mutex_);
        if (!failure_ || box < failure_->box) {
            failure_ = BoxFailure{box, reason};
        }
        stop();
    }

    // Boxes are given out in ascending order, so that all that were not are beyond the bound if the
    // last one is.
    void lower_bound_to(const std::uint64_t bound) {
        if (bound >= bound_) {
            return;
        }
        const std::lock_guard<std::mutex> lock(mutex_);
        bound_ = std::min<std::uint64_t>(bound, bound_);
        const Traversal& traversal = plan_.traversal();
        if (!stopped_ && plan_.is_beyond(traversal.box(traversal.box_count() - 1), bound)) {
            stop();
        }
    }
    std::uint64_t bound() const { return bound_; }

    const std::optional<BoxFailure>& failure() const { return failure_; }

  private:
    void stop() {
        stopped_ = true;
        supply_.stop();
    }

    const BoxPlan& plan_;
    BoxSupply& supply_;
    std::mutex mutex_;
    BoxRange range_;
    bool stopped_ = false;
    std::atomic<std::uint64_t> bound_ = std::numeric_limits<std::uint64_t>::max();
    std::optional<BoxFailure> failure_;
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

// A single thread would not have reached a box beyond the first pairs. What failed in another
// process is tried here, as it may be something that all of them see.
void rethrow_failure(const BoxPlan& plan, const BoxResults& results) {
    if (!results.failure) {
        return;
    }
    const Box box = plan.traversal().box(results.failure->box);
    if (plan.is_beyond(box, results.findings.first.bound())) {
        return;
    }
    if (results.failure->elsewhere) {
        BoxComparer(plan).compare(box);
    }
    std::rethrow_exception(results.failure->reason);
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

Findings compare_boxes(const BoxPlan& plan, const unsigned threads, BoxSupply& supply,
                       ProgressListener& progress) {
    supply.begin(plan, progress);
    BoxQueue queue(plan, supply);
    std::vector<std::unique_ptr<BoxComparer>> comparers;
    try {
        for (unsigned i = 0; i < threads; ++i) {
            comparers.push_back(std::make_unique<BoxComparer>(plan));
        }
        in_threads(threads,
                   [&](const std::size_t i) { take_boxes(plan, queue, *comparers[i], progress); });
    } catch (const std::bad_alloc&) {
        queue.fail(0, std::current_exception());
    }
    BoxResults sum = {{FirstPairs(plan.question().differences), {}}, queue.failure()};
    for (const auto& comparer : comparers) {
        add(sum.findings, comparer->findings());
    }
    supply.merge(plan, sum);
    if (supply.leads()) {
        rethrow_failure(plan, sum);
    }
    return std::move(sum.findings);
}

} // namespace talcmp
