// The processes that compare the operands together: this one alone, or several.

#pragma once

#include "box_supply.h"
#include "operands.h"
#include "outcome.h"

#include <cstdint>
#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace talcmp {

// Thrown in processes that do not lead when no more outcomes are wanted.
struct Ended {};

// All processes go through the operands in the same order. What is small is compared by one of
// them, each time by one that is free; they share the boxes of what is large. One leads: it finds
// the files and prints all outcomes, in their order.
class ProcessGroup {
  public:
    ProcessGroup() = default;
    ProcessGroup(const ProcessGroup&) = delete;
    ProcessGroup& operator=(const ProcessGroup&) = delete;
    virtual ~ProcessGroup() = default;

    virtual bool is_alone() const = 0;
    virtual bool leads() const = 0;

    // Hands out the boxes of a comparison that is shared.
    virtual BoxSupply& boxes() = 0;

    // The files that `find` returns, which is called in the process that leads.
    virtual FilePairs same_files(const std::function<FilePairs()>& find) = 0;

    // What a process sees of files: their names, and what must be the same for all.
    using Sights = std::vector<std::pair<std::string, std::string>>;

    // Calls `open` in all processes. Throws Trouble in all of them if it does in one, or if they do
    // not see the same; Ended.
    virtual void agree(const std::function<void()>& open, const std::function<Sights()>& seen) = 0;

    // Whether one process suffices for a pair of `bytes`, of `total` bytes in all.
    virtual bool suits_one(std::uint64_t bytes, std::uint64_t total) const = 0;

    // Calls `compare` in one process, and reports the outcomes that it returns.
    virtual void by_one(const std::function<std::vector<Outcome>()>& compare) = 0;

    // Reports an outcome that all processes know.
    virtual void report(const Outcome& outcome) = 0;

    // Whether no more outcomes are wanted.
    virtual bool has_ended() const = 0;

    // When all has been compared, or no more is wanted.
    virtual void finish() = 0;
};

// Reports an outcome. Returns whether more are wanted.
using Reporter = std::function<bool(const Outcome&)>;

class SingleProcess : public ProcessGroup {
  public:
    explicit SingleProcess(Reporter report) : report_(std::move(report)) {}

    bool is_alone() const override { return true; }
    bool leads() const override { return true; }
    BoxSupply& boxes() override { return boxes_; }
    FilePairs same_files(const std::function<FilePairs()>& find) override { return find(); }
    void agree(const std::function<void()>& open,
               const std::function<Sights()>& /*seen*/) override {
        open();
    }
    bool suits_one(const std::uint64_t /*bytes*/, const std::uint64_t /*total*/) const override {
        return false;
    }
    void by_one(const std::function<std::vector<Outcome>()>& compare) override {
        for (const Outcome& outcome : compare()) {
            report(outcome);
        }
    }
    void report(const Outcome& outcome) override { ended_ = !report_(outcome); }
    bool has_ended() const override { return ended_; }
    void finish() override {}

  private:
    Reporter report_;
    AllBoxes boxes_;
    bool ended_ = false;
};

} // namespace talcmp
