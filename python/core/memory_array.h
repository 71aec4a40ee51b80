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

// The elements stay where they are, and are there as long as the source is used. Those that are in
// C or Fortran order without gaps are read by their positions; all others in slabs, so that only a
// slab is copied at a time.
class MemoryArray : public ArraySource {
  public:
    MemoryArray(const StoredType& stored, const MemoryLayout& layout);

    const ElementType& type() const override { return *stored_.type; }
    std::string type_name() const override { return stored_.name; }
    const Shape& shape() const override { return layout_.shape; }
    bool fortran_order() const override { return fortran_order_; }
    bool random_access() const override { return true; }
    void read(std::uint64_t first, std::uint64_t count, void* elements) override;
    const void* in_memory() const override;
    const Shape& block() const override { return block_; }
    void read_slab(const Slab& slab, void* elements) override;

  private:
    StoredType stored_;
    MemoryLayout layout_;
    bool fortran_order_ = false;
    Shape block_; // empty if the elements are read by their positions
};

} // namespace talcmp
