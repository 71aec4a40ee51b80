#include "mpi_boxes.h"

#include "packed.h"

#include <algorithm>

namespace talcmp {

// The ranks have agreed on the comparison just before, and so have left the last but one, whose
// counter is the next one's too.
void MpiBoxes::begin(const BoxPlan& plan, ProgressListener& progress) {
    constexpr std::uint64_t batches_of_rank = 32;
    constexpr std::uint64_t largest_batch = 16;
    ++comparison_;
    if (leads()) {
        counters_.reset(first_counter_ + (comparison_ + 1) % 2);
    }
    box_count_ = plan.traversal().box_count();
    const auto ranks = static_cast<std::uint64_t>(rank_count());
    // The first rank, which has the counter, takes single boxes: without RDMA the others wait until
    // it calls MPI again.
    batch_ = leads() ? 1
                     : std::clamp(box_count_ / (batches_of_rank * ranks), std::uint64_t{1},
                                  largest_batch);
    progress_ = &progress;
    bytes_of_box_ = plan.traversal().largest_box() * plan.bytes_of_pair();
    handed_out_ = 0;
}

BoxRange MpiBoxes::next() {
    chore_();
    const std::uint64_t begin = std::min(counters_.add(counter(), batch_), box_count_);
    const std::uint64_t end = std::min(begin + batch_, box_count_);
    progress_->advance((begin - handed_out_) * bytes_of_box_);
    handed_out_ = end;
    return {begin, end};
}

// All later batches are beyond the last box.
void MpiBoxes::stop() {
    counters_.add(counter(), box_count_);
}

// In each round every second rank of those that are left sends what it has to the one before it.
void MpiBoxes::merge(const BoxPlan& plan, BoxResults& results) {
    const int here = rank();
    for (int distance = 1; distance < rank_count(); distance *= 2) {
        if (here % (2 * distance) != 0) {
            send(here - distance, Tag::findings, packed(plan, results, process_name()));
            break;
        }
        if (here + distance < rank_count()) {
            add_packed(receive(Tag::findings, here + distance).bytes, plan, results);
        }
    }
    others_wait_ = false;
}

void MpiBoxes::abandon() {
    if (others_wait_) {
        end_run("there is not enough memory (" + process_name() + ")");
    }
}

} // namespace talcmp
