#include "chosen_pairs.h"

#include <algorithm>

namespace talcmp {
namespace {

// The elements at `indices`, one after another.
void gather(const unsigned char* const elements, const std::size_t size,
            const std::vector<std::size_t>& indices, std::vector<unsigned char>& gathered) {
    gathered.resize(indices.size() * size);
    unsigned char* next = gathered.data();
    for (const std::size_t index : indices) {
        next = std::copy_n(elements + index * size, size, next);
    }
}

} // namespace

void ChosenPairs::choose(const Pairs& pairs, const std::size_t begin, const std::size_t count,
                         const std::uint8_t* const mask) {
    type1_ = &pairs.type1();
    type2_ = &pairs.type2();
    begin_ = begin;
    count_ = count;
    left_out_ = 0;
    indices_.clear();
    stored1_ = pairs.element1(begin);
    stored2_ = pairs.element2(begin);
    if (mask != nullptr) {
        leave_out(pairs, count, mask);
    }
    if (allowances_.any()) {
        asked1_.assign(stored1_, stored1_ + count_ * type1_->size);
        asked2_.assign(stored2_, stored2_ + count_ * type2_->size);
        allowances_.apply(*type1_, asked1_.data(), *type2_, asked2_.data(), count_);
    }
}

void ChosenPairs::leave_out(const Pairs& pairs, const std::size_t count,
                            const std::uint8_t* const mask) {
    const std::uint8_t* const first = mask + begin_;
    left_out_ = count - static_cast<std::size_t>(std::count(first, first + count, 0));
    count_ = count - left_out_;
    if (left_out_ == 0 || left_out_ == count) {
        return;
    }
    for (std::size_t i = begin_; i < begin_ + count; ++i) {
        if (mask[i] == 0) {
            indices_.push_back(i);
        }
    }
    gather(pairs.element1(0), type1_->size, indices_, gathered1_);
    gather(pairs.element2(0), type2_->size, indices_, gathered2_);
    stored1_ = gathered1_.data();
    stored2_ = gathered2_.data();
}

Pairs ChosenPairs::stored() const {
    return {*type1_, stored1_, *type2_, stored2_, count_};
}

Pairs ChosenPairs::asked() const {
    return allowances_.any() ? Pairs(*type1_, asked1_.data(), *type2_, asked2_.data(), count_)
                             : stored();
}

} // namespace talcmp
