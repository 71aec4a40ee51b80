// What is allowed beside the tolerance: NaNs beside NaNs, and absolute errors.

#pragma once

#include "element_type.h"
#include "question.h"

#include <cstddef>
#include <cstdint>
#include <vector>

namespace talcmp {

// Pairs of parts that are allowed to differ become two zeros before the module is asked about them.
// A pair of elements of which each part is allowed is then the same under every tolerance.
class Allowances {
  public:
    explicit Allowances(const Question& question)
        : equal_nan_(question.equal_nan), absolute_(question.absolute) {}

    // Whether anything is allowed.
    bool any() const { return equal_nan_ || absolute_.has_value(); }

    // Allowed are, part by part of a complex number, two NaNs with `equal_nan`, and two finite
    // numbers whose exact values differ by at most the absolute error.
    void apply(const ElementType& type1, void* elements1, const ElementType& type2, void* elements2,
               std::size_t count);

  private:
    void apply_to_part(int part, const ElementType& type1, void* elements1,
                       const ElementType& type2, void* elements2, std::size_t count);

    bool equal_nan_;
    std::optional<double> absolute_;
    std::vector<double> parts1_, parts2_, rests1_, rests2_;
    std::vector<std::uint8_t> allowed_;
};

// Whether |x + x_rest - y - y_rest| is at most `error`; exact. All are finite.
bool is_within(double x, double x_rest, double y, double y_rest, double error);

} // namespace talcmp
