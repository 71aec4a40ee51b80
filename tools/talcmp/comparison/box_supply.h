// Hands out the boxes of a comparison, and brings together what was found in them.

#pragma once

#include "box_comparer.h"
#include "progress_listener.h"

#include <cstdint>
#include <exception>
#include <optional>
#include <utility>

namespace talcmp {

// The numbers of boxes from `begin` to `end` - 1.
struct BoxRange {
    std::uint64_t begin = 0;
    std::uint64_t end = 0;
};

// A box that could not be compared.
struct BoxFailure {
    std::uint64_t box = 0;
    std::exception_ptr reason;
    bool elsewhere = false; // whether in another process, which may not see the same files
};

// What was found in some of the boxes, and the first of them that failed.
struct BoxResults {
    Findings findings;
    std::optional<BoxFailure> failure;
};

class BoxSupply {
  public:
    BoxSupply() = default;
    BoxSupply(const BoxSupply&) = delete;
    BoxSupply& operator=(const BoxSupply&) = delete;
    virtual ~BoxSupply() = default;

    // Whether other processes take boxes of the same comparison.
    virtual bool is_shared() const { return false; }

    // Whether what all have found is known here in the end.
    virtual bool leads() const { return true; }

    // Before the first box. `progress` is told of what others compare.
    virtual void begin(const BoxPlan& plan, ProgressListener& progress) = 0;

    // Boxes that are handed out here and nowhere else, after all that were handed out before;
    // none if there are no more. Called by one thread at a time, as is `stop`.
    virtual BoxRange next() = 0;

    // No more boxes are wanted.
    virtual void stop() = 0;

    // Adds what other processes have found, if this one leads.
    virtual void merge(const BoxPlan& /*plan*/, BoxResults& /*results*/) {}

    // The comparison ends by an exception.
    virtual void abandon() {}
};

// All boxes for this process.
class AllBoxes : public BoxSupply {
  public:
    void begin(const BoxPlan& plan, ProgressListener& /*progress*/) override {
        range_ = {0, plan.traversal().box_count()};
    }
    BoxRange next() override { return std::exchange(range_, {}); }
    void stop() override { range_ = {}; }

  private:
    BoxRange range_;
};

} // namespace talcmp
