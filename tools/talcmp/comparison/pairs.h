// Pairs of elements, in the form in which the module is asked about them.

#pragma once

#include "element_type.h"
#include "type_properties.h"

#include <cstddef>

namespace talcmp {

// A stretch of elements of two arrays, side by side; fewer than 2^31.
class Pairs {
  public:
    Pairs(const ElementType& type1, const void* data1, const ElementType& type2, const void* data2,
          const std::size_t count)
        : type1_(type1), type2_(type2), data1_(static_cast<const unsigned char*>(data1)),
          data2_(static_cast<const unsigned char*>(data2)), count_(count) {}

    std::size_t count() const { return count_; }
    const ElementType& type1() const { return type1_; }
    const ElementType& type2() const { return type2_; }
    const unsigned char* element1(const std::size_t i) const { return data1_ + i * type1_.size; }
    const unsigned char* element2(const std::size_t i) const { return data2_ + i * type2_.size; }

    // Whether the elements `begin` to `begin + count - 1` of both are the same.
    bool same(talreal tolerance, std::size_t begin, std::size_t count) const;

    bool same(const talreal tolerance, const std::size_t i) const { return same(tolerance, i, 1); }

    // The first pair from `begin` that is not the same; `count()` if all are the same.
    std::size_t find_different(talreal tolerance, std::size_t begin) const;

  private:
    const ElementType& type1_;
    const ElementType& type2_;
    const unsigned char* data1_;
    const unsigned char* data2_;
    std::size_t count_;
};

// Makes this thread remember the factor of a tolerance, until it compares under another one.
//
// Between 52 and 53 (23 and 24 for singles) the module's answer for some pairs depends on whether
// it remembers the factor. talcmp always asks with the factor remembered: two numbers are then the
// same exactly when they differ by less than 2^(tolerance - bits) times the larger, and the answer
// depends neither on the order of the pairs nor on the number of threads.
void remember_factor_of(talreal tolerance);

} // namespace talcmp
