// Arrays for the fuzzers, and calls whose answers are compared with the oracle's.

#pragma once

#include "taldata_array.h"

#include "oracle.h"

#include <cstddef>
#include <memory>
#include <new>
#include <string>
#include <vector>

namespace fuzz {

// Whether the module has the element type.
bool is_known(int type_id);

// An array whose elements end where their heap block does, so that a sanitizer sees a read past
// them, and begin at a chosen place in a page.
class Operand {
  public:
    static constexpr std::size_t page_bytes = 4096;

    // `place` is below `page_bytes`, and is rounded down to the alignment of the elements. An
    // element of an unknown type is a byte.
    Operand(int type_id, std::vector<talint> dimensions, talint count, std::size_t place);
    Operand(const Operand&) = delete;
    Operand& operator=(const Operand&) = delete;
    ~Operand() = default;

    unsigned char* element(const std::size_t index) { return data() + index * element_size_; }
    std::size_t element_size() const { return element_size_; }

    // May be changed only before the first call.
    st_TalDataArray& record() { return record_; }

    const oracle::Array& array() const { return array_; }
    std::string described() const;

    // Record, dimensions and elements, as bytes.
    std::vector<unsigned char> contents() const;

  private:
    struct Deletion {
        void operator()(unsigned char* block) const {
            ::operator delete (block, std::align_val_t{page_bytes});
        }
    };

    unsigned char* data() const { return block_.get() + place_; }

    oracle::Array array_;
    std::size_t element_size_;
    std::size_t place_;
    std::size_t bytes_;
    std::unique_ptr<unsigned char, Deletion> block_;
    st_TalDataArray record_ = {};
};

// Makes the module remember the factors of one tolerance, and returns a state that does too.
oracle::State known_state();

// Asks both predicates and the oracle; ends the program if they disagree, or if anything but the
// state is changed.
void check_call(oracle::State& state, double tolerance, int compare_different_types, Operand& first,
                Operand& second);

// Ends the program so that libFuzzer keeps the input.
[[noreturn]] void fail(const std::string& what_is_wrong);

} // namespace fuzz
