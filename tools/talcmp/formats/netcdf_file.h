// A file in a classic netCDF format: variables that are read from any place, by any thread.

#pragma once

#include "array_file.h"
#include "byte_source.h"
#include "netcdf_header.h"

#include <map>

namespace talcmp {

class NetcdfFile : public ArrayFile {
  public:
    // `path` is what messages call the file, which can be read in any order. Throws Trouble when
    // its header is broken or not supported.
    NetcdfFile(std::string path, std::shared_ptr<ByteSource> file);

    bool is_archive() const override { return true; }
    const char* root() const override { return "/"; }
    std::vector<std::string> members() const override;

    std::uint64_t divisible_bytes(const std::string& member) override;

    // Throws Trouble if the file does not have all elements of the variable.
    std::unique_ptr<ArraySource> open(const std::string& member) override;

  private:
    std::string path_;
    std::shared_ptr<ByteSource> file_; // each opened variable keeps it open
    std::map<std::string, NetcdfVariable> variables_;
};

} // namespace talcmp
