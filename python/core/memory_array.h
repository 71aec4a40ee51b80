// An array in memory, in whatever order its elements are, as a source of elements.

#pragma once

#include "array_source.h"
#include "stored_type.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace talcmp {

// Where elements are in memory.
struct MemoryLayout {
    const unsigned char* data = nullptr; // the element whose indices are all 0
    Shape shape;
    std::vector<std::int64_t> strides; // bytes from index to index: of any sign, or 0
};

// Whether the first index varies fastest, without gaps, and the elements are not in C order too.
bool is_in_fortran_order(const MemoryLayout& layout, std::size_t element_size);

// The elements stay where they are, and are there as long as the source is used. Those in C order
// without gaps are read by their positions; all others in slabs, as if they were in C order, so
// that only a slab is copied at a time. Those in Fortran order may be read by their positions too,
// if all arrays of a comparison are.
class MemoryArray : public ArraySource {
  public:
    MemoryArray(StoredType stored, MemoryLayout layout, bool by_fortran_positions);

    const ElementType& type() const override { return *stored_.type; }
    std::string type_name() const override { return stored_.name; }
    const Shape& shape() const override { return layout_.shape; }
    bool fortran_order() const override { return fortran_order_; }
    bool random_access() const override { return true; }
    void read(std::uint64_t first, std::uint64_t count, void* elements) override;
    const void* in_memory() const override;
    const Shape& block() const override { return block_; }
    bool has_whole_blocks() const override { return false; }
    void read_slab(const Slab& slab, void* elements) override;

  private:
    StoredType stored_;
    MemoryLayout layout_;
    bool fortran_order_;
    Shape block_; // empty if the elements are read by their positions
};

} // namespace talcmp
