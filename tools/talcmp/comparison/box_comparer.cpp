#include "box_comparer.h"

#include <algorithm>
#include <future>

namespace talcmp {

bool column_major(const ArraySource& first, const ArraySource& second) {
    return first.fortran_order() && second.fortran_order();
}

// ---- BoxPlan

BoxPlan::BoxPlan(const Traversal& traversal, ArraySource& first, ArraySource& second,
                 ArraySource* const mask, const Question& question, const DifferenceMaps& maps)
    : traversal_(traversal), first_(first), second_(second), mask_(mask), question_(question),
      maps_(maps), tolerance_(tolerance_for(question, first.type(), second.type())),
      as_stored_(question.only_whether && column_major(first, second)),
      in_order_(as_stored_ || !column_major(first, second)),
      numbers_(as_stored_ ? RowMajorNumbers()
                          : RowMajorNumbers(first.shape(), first.fortran_order())) {}

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
    : plan_(plan), buffer1_(room_for(Side::first, plan.first())),
      buffer2_(room_for(Side::second, plan.second())),
      mask_(plan.mask() == nullptr ? nullptr : new unsigned char[plan.traversal().largest_box()]),
      chosen_(plan.question()), counter_(plan.tolerance()),
      maps_(plan.maps(), plan.traversal(), column_major(plan.first(), plan.second())),
      findings_{FirstPairs(plan.question().differences), {}} {}

std::uint64_t BoxComparer::compare(const Box& box) {
    // So few that what is chosen stays in the first cache.
    constexpr std::size_t at_once = 2048;
    read(box);
    const Pairs pairs(plan_.first().type(), elements1_, plan_.second().type(), elements2_,
                      box.count);
    const std::size_t length = plan_.chooses() ? at_once : box.count;
    for (std::size_t begin = 0; begin < box.count; begin += length) {
        chosen_.choose(pairs, begin, std::min(length, box.count - begin), mask_.get());
        compare(chosen_.asked(), chosen_.stored(), box);
    }
    return findings_.first.bound();
}

void BoxComparer::compare(const Pairs& asked, const Pairs& stored, const Box& box) {
    findings_.totals.ignored += chosen_.left_out();
    if (stored.count() == 0) {
        return;
    }
    if (plan_.question().report) {
        const auto number = [&](const std::size_t i) { return number_of(box, i); };
        const auto& found = counter_.add(asked, stored, number, plan_.in_order(), findings_);
        maps_.add(box, chosen_, found);
    } else {
        find_different(asked, stored, box);
    }
}

// None for elements that are compared where they are.
std::unique_ptr<unsigned char[]> BoxComparer::room_for(const Side side,
                                                       const ArraySource& source) const {
    const Traversal& traversal = plan_.traversal();
    if (traversal.in_memory(side, source, traversal.box(0)) != nullptr) {
        return nullptr;
    }
    const std::size_t size = traversal.largest_box() * source.type().size;
    return std::unique_ptr<unsigned char[]>(new unsigned char[size]);
}

const void* BoxComparer::read(const Side side, ArraySource& source, const Box& box,
                              unsigned char* const buffer) const {
    if (buffer == nullptr) {
        return plan_.traversal().in_memory(side, source, box);
    }
    plan_.traversal().read(side, source, box, buffer);
    return buffer;
}

void BoxComparer::read(const Box& box) {
    const auto read_second = [&] {
        elements2_ = read(Side::second, plan_.second(), box, buffer2_.get());
    };
    // A side that can be read only once may have to be decompressed: each side gets a thread.
    const bool side_by_side = !plan_.first().random_access() && !plan_.second().random_access();
    auto second = std::async(side_by_side ? std::launch::async | std::launch::deferred
                                          : std::launch::deferred,
                             read_second);
    elements1_ = read(Side::first, plan_.first(), box, buffer1_.get());
    second.get();
    if (plan_.mask() != nullptr) {
        plan_.traversal().read(Side::mask, *plan_.mask(), box, mask_.get());
    }
}

void BoxComparer::find_different(const Pairs& asked, const Pairs& stored, const Box& box) {
    const talreal tolerance = plan_.tolerance();
    for (std::size_t i = asked.find_different(tolerance, 0); i < asked.count();
         i = asked.find_different(tolerance, i + 1)) {
        const bool wanted = findings_.first.add(found_pair(stored, i, number_of(box, i)));
        if (!wanted && plan_.in_order()) {
            return; // later ones have higher numbers still
        }
    }
}

} // namespace talcmp
