// A file of an operand, opened, and its arrays.

#pragma once

#include "array_file.h"
#include "comparison.h"
#include "operands.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>

namespace talcmp {

// An array, or why it is none of numbers.
struct OpenedArray {
    NamedArray array;
    std::optional<std::string> not_numbers;
};

// Its type, its shape and how it is stored, or why it is none.
std::string header_of(const OpenedArray& opened);

class OperandFile {
  public:
    // Opens the file; `member` is the array that the operand names, if it names one. Throws
    // Trouble.
    OperandFile(std::string path, std::optional<std::string> member);

    const std::string& path() const { return path_; }
    const std::optional<std::string>& member() const { return member_; }
    ArrayFile& file() const { return *file_; }

    // The name of one of its arrays, in messages and as an operand.
    std::string name_of(const std::string& array) const;

    // The array that is compared with one of the other operand, if there is one. Throws Trouble.
    std::string chosen_array(const OperandFile* other, const NameFilter& filter) const;

    // The bytes of an array that can be read in any order; 0 if they cannot, or if there is
    // trouble.
    std::uint64_t divisible_bytes(const std::string& array) const;

    // Throws Trouble.
    OpenedArray open(const std::string& array) const;

    // Its size, and the names of its arrays.
    std::string contents() const;

  private:
    std::string path_;
    std::optional<std::string> member_;
    std::unique_ptr<ArrayFile> file_;
};

// In bytes; 0 if the file is not there.
std::uint64_t file_size(const std::string& path);

} // namespace talcmp
