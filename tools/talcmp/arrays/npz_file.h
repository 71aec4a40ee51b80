// A file that is a zip archive of .npy arrays, as numpy.savez and numpy.savez_compressed write it.

#pragma once

#include "array_file.h"
#include "regular_file.h"

#include <map>

#include <zip.h>

namespace talcmp {

class NpzFile : public ArrayFile {
  public:
    // Takes over the open file. Throws Trouble when the archive is broken.
    explicit NpzFile(RegularFile& file);

    bool is_archive() const override { return true; }
    std::vector<std::string> members() const override;
    std::unique_ptr<ArraySource> open(const std::string& member) override;

  private:
    std::string path_;
    std::shared_ptr<zip_t> archive_;            // each opened member keeps it open
    std::map<std::string, zip_uint64_t> index_; // of each member in the archive
};

} // namespace talcmp
