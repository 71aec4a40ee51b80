// An .npy file as a source of elements.

#pragma once

#include "array_source.h"
#include "byte_source.h"
#include "npy_header.h"

#include <memory>
#include <string>

namespace talcmp {

class NpyArray : public ArraySource {
  public:
    // `name` is what messages call the file. Throws Trouble when it is broken or not supported.
    NpyArray(std::string name, std::unique_ptr<ByteSource> file);

    const ElementType& type() const override { return *header_.type.type; }
    std::string type_name() const override { return header_.type.name; }
    const Shape& shape() const override { return header_.shape; }
    bool fortran_order() const override { return header_.fortran_order; }
    bool random_access() const override { return file_->random_access(); }
    void read(std::uint64_t first, std::uint64_t count, void* elements) override;
    void check_to_end() override;
    std::vector<SummedPart> summed_parts() const override { return file_->summed_parts(); }
    void add_summed_parts(const std::vector<SummedPart>& parts) override {
        file_->add_summed_parts(parts);
    }

  private:
    // Checks that nothing follows the elements; an archive checks its sum only when asked for more.
    void check_end();

    std::string name_;
    std::unique_ptr<ByteSource> file_;
    NpyHeader header_;
    std::uint64_t next_ = 0; // the position after those that have been read, if read only once
};

} // namespace talcmp
