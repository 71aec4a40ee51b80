// The ranks of MPI as the processes that compare the operands together.

#pragma once

#include "mpi_boxes.h"
#include "process_group.h"
#include "question.h"
#include "ranks.h"

#include <cstdint>
#include <deque>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace talcmp {

// The first rank leads. What one rank compares has a number, and each takes the next number by
// adding to one at the first rank. Outcomes go to the first rank, which prints them in their order
// while it compares, too.
class MpiGroup : public ProcessGroup {
  public:
    // `question` has the maps that are made.
    MpiGroup(Reporter reporter, const Question& question);

    bool is_alone() const override { return false; }
    bool leads() const override { return rank() == 0; }
    BoxSupply& boxes() override { return boxes_; }
    FilePairs same_files(const std::function<FilePairs()>& find) override;
    void agree(const std::function<void()>& open, const std::function<Sights()>& seen) override;
    bool suits_one(std::uint64_t bytes, std::uint64_t total) const override;
    void by_one(const std::function<std::vector<Outcome>()>& compare) override;
    void report(const Outcome& outcome) override;
    bool has_ended() const override { return ended_; }
    void finish() override;

  private:
    using Outcomes = std::vector<Outcome>;

    // Outcomes, or the number of what another rank compares.
    struct Next {
        std::uint64_t number = 0;
        std::optional<Outcomes> outcomes = {};
    };

    static void open_first(const std::function<void()>& open, const std::function<Sights()>& seen);
    std::string open_like_first(const std::function<void()>& open,
                                const std::function<Sights()>& seen);
    void hand_in(std::uint64_t number, Outcomes outcomes);
    void take_in(const Message& message);
    void print_next();
    void take_in_all();
    void print_all();
    void print(const Outcomes& outcomes);

    Reporter reporter_;
    const Question& question_;
    SharedCounters counters_;
    MpiBoxes boxes_;
    bool ended_ = false;
    std::uint64_t number_ = 0;           // of what one rank compares next
    std::optional<std::uint64_t> taken_; // by this rank
    Sendings outcomes_sent_;
    // Of the first rank.
    std::deque<Next> next_;                        // to be printed
    std::map<std::uint64_t, std::string> arrived_; // packed outcomes, by their numbers
    int finished_ = 0;                             // other ranks
};

} // namespace talcmp
