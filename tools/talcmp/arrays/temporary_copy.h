// A copy, readable in any order, of an array that can be read only once.

#pragma once

#include "array_source.h"
#include "descriptor.h"

#include <functional>
#include <memory>

namespace talcmp {

// In a file without a name, in the folder that the environment variable TMPDIR names.
class TemporaryCopy : public ArraySource {
  public:
    // Reads all of `source`, to its end; `copied` is called with the bytes copied since its last
    // call. Throws Trouble.
    TemporaryCopy(std::unique_ptr<ArraySource> source,
                  const std::function<void(std::uint64_t)>& copied);

    const ElementType& type() const override { return source_->type(); }
    const Shape& shape() const override { return source_->shape(); }
    bool fortran_order() const override { return source_->fortran_order(); }
    bool random_access() const override { return true; }
    void read(std::uint64_t first, std::uint64_t count, void* elements) override;

  private:
    void copy_all(const std::function<void(std::uint64_t)>& copied);
    void append(const char* bytes, std::size_t count);

    std::unique_ptr<ArraySource> source_; // already read
    std::string folder_;
    Descriptor file_;
};

} // namespace talcmp
