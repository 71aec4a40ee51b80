// A file that is a zip archive of .npy arrays, as numpy.savez and numpy.savez_compressed write it.

#pragma once

#include "array_file.h"
#include "regular_file.h"
#include "zip_archive.h"

#include <cstdint>
#include <map>

namespace talcmp {

class NpzFile : public ArrayFile {
  public:
    // Throws Trouble when the archive is broken.
    explicit NpzFile(std::unique_ptr<RegularFile> file);

    bool is_archive() const override { return true; }
    std::vector<std::string> members() const override;
    std::uint64_t divisible_bytes(const std::string& member) override {
        return archive_->stored_bytes(index_.at(member));
    }
    std::unique_ptr<ArraySource> open(const std::string& member) override;

  private:
    void add(std::string member, std::uint64_t index);

    std::shared_ptr<ZipArchive> archive_;        // each opened member keeps it open
    std::map<std::string, std::uint64_t> index_; // of each member in the archive
};

} // namespace talcmp
