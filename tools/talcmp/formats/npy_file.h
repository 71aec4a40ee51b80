// A file that is one .npy array.

#pragma once

#include "array_file.h"
#include "npy_array.h"

namespace talcmp {

class NpyFile : public ArrayFile {
  public:
    // `name` is what messages call the file.
    NpyFile(std::string name, std::unique_ptr<ByteSource> bytes)
        : name_(std::move(name)), bytes_(std::move(bytes)) {}

    bool is_archive() const override { return false; }
    std::vector<std::string> members() const override { return {""}; }
    std::unique_ptr<ArraySource> open(const std::string& /*member*/) override {
        return std::make_unique<NpyArray>(name_, std::move(bytes_));
    }

  private:
    std::string name_;
    std::unique_ptr<ByteSource> bytes_;
};

} // namespace talcmp
