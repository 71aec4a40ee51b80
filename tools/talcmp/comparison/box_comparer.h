// The comparison of two arrays box by box: what all boxes have in common, and what finds the
// differing pairs in a box.

#pragma once

#include "array_source.h"
#include "chosen_pairs.h"
#include "layout.h"
#include "map_filler.h"
#include "pair_counter.h"
#include "question.h"
#include "traversal.h"

#include <cstdint>
#include <memory>

namespace talcmp {

// Whether boxes, and the pairs in them, are in column-major order; otherwise they are in row-major
// order.
bool column_major(const ArraySource& first, const ArraySource& second);

// What all boxes of a comparison have in common. Keeps references to what it is constructed from.
class BoxPlan {
  public:
    // `mask` may be null.
    BoxPlan(const Traversal& traversal, ArraySource& first, ArraySource& second, ArraySource* mask,
            const Question& question, const DifferenceMaps& maps);
    BoxPlan(const Traversal& traversal, ArraySource& first, ArraySource& second, ArraySource* mask,
            const Question& question, DifferenceMaps&& maps) = delete; // would be gone too soon

    const Traversal& traversal() const { return traversal_; }
    ArraySource& first() const { return first_; }
    ArraySource& second() const { return second_; }
    ArraySource* mask() const { return mask_; }
    const Question& question() const { return question_; }
    const DifferenceMaps& maps() const { return maps_; }

    // Whether the module is asked about other pairs than those that are stored.
    bool chooses() const { return mask_ != nullptr || Allowances(question_).any(); }

    // In binary digits, for the types of the two arrays.
    talreal tolerance() const { return tolerance_; }

    // Whether the numbers of pairs ascend from each to the next, in a box and from box to box.
    bool in_order() const { return in_order_; }

    // The number of the pair `i` of a box, for `FoundPair`; in the order of storage if any place
    // will do.
    std::uint64_t number_of(const Box& box, std::size_t i) const;

    // The index of the first array's element with that number.
    Shape index_of(std::uint64_t number) const;

    // Whether all pairs of the box come after those wanted, whose numbers are below `bound`.
    bool is_beyond(const Box& box, std::uint64_t bound) const;

    std::size_t bytes_of_pair() const { return first_.type().size + second_.type().size; }

    // Whether boxes may be compared in any order, several at a time.
    bool random_access() const {
        return first_.random_access() && second_.random_access()
               && (mask_ == nullptr || mask_->random_access());
    }

  private:
    const Traversal& traversal_;
    ArraySource& first_;
    ArraySource& second_;
    ArraySource* mask_;
    const Question& question_;
    const DifferenceMaps& maps_;
    talreal tolerance_;
    bool as_stored_;
    bool in_order_;
    RowMajorNumbers numbers_;
};

// Compares boxes one after another. Each thread has its own.
class BoxComparer {
  public:
    explicit BoxComparer(const BoxPlan& plan);

    // Reads the box and adds what it finds. Returns the number from which no more pairs of any box
    // are wanted. Throws Trouble.
    std::uint64_t compare(const Box& box);

    const Findings& findings() const { return findings_; }

  private:
    std::unique_ptr<unsigned char[]> room_for(Side side, const ArraySource& source) const;
    void read(const Box& box);
    const void* read(Side side, ArraySource& source, const Box& box, unsigned char* buffer) const;
    void compare(const Pairs& asked, const Pairs& stored, const Box& box);
    void find_different(const Pairs& asked, const Pairs& stored, const Box& box);

    // The number of one of the chosen pairs.
    std::uint64_t number_of(const Box& box, const std::size_t i) const {
        return plan_.number_of(box, chosen_.index_of(i));
    }

    const BoxPlan& plan_;
    std::unique_ptr<unsigned char[]> buffer1_;
    std::unique_ptr<unsigned char[]> buffer2_;
    std::unique_ptr<unsigned char[]> mask_;
    const void* elements1_ = nullptr; // of the box that is compared: in the buffers or in memory
    const void* elements2_ = nullptr;
    ChosenPairs chosen_;
    PairCounter counter_;
    MapFiller maps_;
    Findings findings_;
};

} // namespace talcmp
