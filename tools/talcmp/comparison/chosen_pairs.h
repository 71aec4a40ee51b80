// The pairs of elements that the module is asked about, chosen from those that are stored.

#pragma once

#include "allowances.h"
#include "pairs.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace talcmp {

// A stretch of the stored pairs, without those that a mask leaves out, and twice: as they are
// stored, and as the module is asked about them, with zeros for what is allowed to differ.
class ChosenPairs {
  public:
    explicit ChosenPairs(const Question& question) : allowances_(question) {}

    // Chooses from the `count` pairs from `begin` on. `mask` has an element for each of `pairs`,
    // nonzero to leave the pair out, or is null. The pairs must stay as long as those chosen are
    // used.
    void choose(const Pairs& pairs, std::size_t begin, std::size_t count, const std::uint8_t* mask);

    Pairs stored() const;
    Pairs asked() const;

    // The index of the chosen pair `i` among the pairs that it was chosen from.
    std::size_t index_of(const std::size_t i) const {
        return indices_.empty() ? begin_ + i : indices_[i];
    }

    // How many pairs the mask left out.
    std::size_t left_out() const { return left_out_; }

  private:
    void leave_out(const Pairs& pairs, std::size_t count, const std::uint8_t* mask);

    Allowances allowances_;
    const ElementType* type1_ = nullptr;
    const ElementType* type2_ = nullptr;
    std::size_t begin_ = 0;
    std::size_t count_ = 0;
    std::size_t left_out_ = 0;
    std::vector<std::size_t> indices_; // of the chosen pairs, where some were left out
    const unsigned char* stored1_ = nullptr;
    const unsigned char* stored2_ = nullptr;
    std::vector<unsigned char> gathered1_, gathered2_;
    std::vector<unsigned char> asked1_, asked2_;
};

} // namespace talcmp
