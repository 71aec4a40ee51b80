#include "box_comparer.h"

#include <future>

namespace talcmp {

bool column_major(const ArraySource& first, const ArraySource& second) {
    return first.fortran_order() && second.fortran_order();
}

// ---- BoxPlan

BoxPlan::BoxPlan(const Traversal& traversal, ArraySource& first, ArraySource& second,
                 const Question& question)
    : traversal_(traversal), first_(first), second_(second), question_(question),
      as_stored_(question.only_whether && column_major(first, second)),
      in_order_(as_stored_ || !column_major(first, second)),
      numbers_(as_stored_ ? RowMajorNumbers() : RowMajorNumbers(first)) {}

std::uint64_t BoxPlan::number_of(const Box& box, const std::size_t i) const {
    return numbers_.of(traversal_.first_position(box, i));
}

Shape BoxPlan::index_of(const std::uint64_t number) const {
    return talcmp::index_of(first_.shape(), as_stored_, number);
}

bool BoxPlan::is_beyond(const Box& box, const std::uint64_t bound) const {
    if (question_.report) {
        return false;
    }
    const std::uint64_t earliest = in_order_ ? number_of(box, 0) : 0;
    return earliest >= bound;
}

// ---- BoxComparer

BoxComparer::BoxComparer(const BoxPlan& plan)
    : plan_(plan),
      buffer1_(new unsigned char[plan.traversal().largest_box() * plan.first().type().size]),
      buffer2_(new unsigned char[plan.traversal().largest_box() * plan.second().type().size]),
      counter_(plan.question().tolerance), findings_{FirstPairs(plan.question().differences), {}} {}

std::uint64_t BoxComparer::compare(const Box& box) {
    read(box);
    const Pairs pairs(plan_.first().type(), buffer1_.get(), plan_.second().type(), buffer2_.get(),
                      box.count);
    if (plan_.question().report) {
        const auto number = [&](const std::size_t i) { return plan_.number_of(box, i); };
        counter_.add(pairs, number, plan_.in_order(), findings_);
    } else {
        find_different(pairs, box);
    }
    return findings_.first.bound();
}

void BoxComparer::read(const Box& box) {
    const Traversal& traversal = plan_.traversal();
    const auto read_second = [&] {
        traversal.read(Side::second, plan_.second(), box, buffer2_.get());
    };
    // A side that can be read only once may have to be decompressed: each side gets a thread.
    const bool side_by_side = !plan_.first().random_access() && !plan_.second().random_access();
    auto second = std::async(side_by_side ? std::launch::async | std::launch::deferred
                                          : std::launch::deferred,
                             read_second);
    traversal.read(Side::first, plan_.first(), box, buffer1_.get());
    second.get();
}

void BoxComparer::find_different(const Pairs& pairs, const Box& box) {
    const talreal tolerance = plan_.question().tolerance;
    for (std::size_t i = pairs.find_different(tolerance, 0); i < pairs.count();
         i = pairs.find_different(tolerance, i + 1)) {
        const bool wanted = findings_.first.add(found_pair(pairs, i, plan_.number_of(box, i)));
        if (!wanted && plan_.in_order()) {
            return; // later ones have higher numbers still
        }
    }
}

} // namespace talcmp
