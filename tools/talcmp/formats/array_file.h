// The formats of files that talcmp reads.

#pragma once

#include "array_source.h"

#include <algorithm>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace talcmp {

// A file with one array or several. A format is a class that implements this, and a line of
// `formats` in array_file.cpp before the last, which takes every file.
class ArrayFile {
  public:
    ArrayFile() = default;
    ArrayFile(const ArrayFile&) = delete;
    ArrayFile& operator=(const ArrayFile&) = delete;
    virtual ~ArrayFile() = default;

    // Whether the arrays have names.
    virtual bool is_archive() const = 0;

    // What messages write before the names of arrays: "/" where arrays are in groups.
    virtual const char* root() const { return ""; }

    // The names of the arrays, without the root, each once; one empty name where they have none.
    virtual std::vector<std::string> members() const = 0;

    // Whether there is an array of that name. Some may have further names than `members` lists.
    virtual bool has(const std::string& member) {
        const std::vector<std::string> names = members();
        return std::find(names.begin(), names.end(), member) != names.end();
    }

    // The bytes of the elements of an array that the file has; 0 if they cannot be read in any
    // order, or if opening it would fail.
    virtual std::uint64_t divisible_bytes(const std::string& /*member*/) { return 0; }

    // Opens an array that the file has. Each may be opened only once. Throws Trouble; NotNumbers if
    // it is not an array of numbers.
    virtual std::unique_ptr<ArraySource> open(const std::string& member) = 0;
};

// The path that stands for standard input.
inline constexpr const char* standard_input_path = "-";

// Opens a file, once, and recognises its format by its first bytes. Of a pipe, such as standard
// input, an .npy file is read as it comes, and any other is first copied to a temporary file;
// opening a pipe waits until somebody writes to it. Throws Trouble when the file cannot be opened
// or is of no known format.
std::unique_ptr<ArrayFile> open_array_file(const std::string& path);

// The names of the formats that can be read.
std::vector<std::string_view> format_names();

} // namespace talcmp
