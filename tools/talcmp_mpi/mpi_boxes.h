// Boxes that are handed out to the ranks of MPI.

#pragma once

#include "box_supply.h"
#include "ranks.h"

#include <cstddef>
#include <cstdint>
#include <functional>
#include <utility>

namespace talcmp {

// A rank takes the next boxes by adding to a number at the first rank: in batches, of which there
// are enough for all ranks to end at about the same time, and which are short enough for all to end
// soon after a difference is found. What all have found goes to the first rank along a tree.
class MpiBoxes : public BoxSupply {
  public:
    // `chore` is called before each batch. Two of the counters, from `first_counter` on, are used.
    MpiBoxes(SharedCounters& counters, const std::size_t first_counter, std::function<void()> chore)
        : counters_(counters), first_counter_(first_counter), chore_(std::move(chore)) {}

    // All ranks begin a comparison now, unless all find that there is nothing to compare.
    void expect() { others_wait_ = true; }

    bool is_shared() const override { return true; }
    bool leads() const override { return rank() == 0; }
    void begin(const BoxPlan& plan, ProgressListener& progress) override;
    BoxRange next() override;
    void stop() override;
    void merge(const BoxPlan& plan, BoxResults& results) override;
    void abandon() override;

  private:
    std::size_t counter() const { return first_counter_ + comparison_ % 2; }

    SharedCounters& counters_;
    std::size_t first_counter_;
    std::function<void()> chore_;
    std::uint64_t comparison_ = 0;
    std::uint64_t box_count_ = 0;
    std::uint64_t batch_ = 1;
    bool others_wait_ = false; // for what this rank finds
    // What other ranks compare, for the progress of all.
    ProgressListener* progress_ = nullptr;
    std::uint64_t bytes_of_box_ = 0;
    std::uint64_t handed_out_ = 0; // as far as this rank knows
};

} // namespace talcmp
