// A copy, readable in any order by positions, of an array that can be read only once or in blocks.

#pragma once

#include "array_source.h"
#include "temporary_file.h"

#include <functional>
#include <memory>
#include <vector>

namespace talcmp {

// In a temporary file.
class TemporaryCopy : public ArraySource {
  public:
    using Copied = std::function<void(std::uint64_t)>;

    // Reads all of `source`, to its end; `copied` is called with the bytes copied since its last
    // call. Throws Trouble.
    TemporaryCopy(std::unique_ptr<ArraySource> source, const Copied& copied);

    const ElementType& type() const override { return source_->type(); }
    std::string type_name() const override { return source_->type_name(); }
    const Shape& shape() const override { return source_->shape(); }
    bool fortran_order() const override { return source_->fortran_order(); }
    bool random_access() const override { return true; }
    void read(std::uint64_t first, std::uint64_t count, void* elements) override;

  private:
    void copy_all(const Copied& copied);
    void copy_blocks(const Copied& copied);
    void copy_slab(const Slab& slab, std::vector<char>& buffer);

    std::unique_ptr<ArraySource> source_; // already read
    TemporaryFile file_;
};

} // namespace talcmp
