// A zip archive: its members, and where they are in the file.

#pragma once

#include "byte_source.h"
#include "regular_file.h"

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <zip.h>

namespace talcmp {

class ZipArchive : public std::enable_shared_from_this<ZipArchive> {
  public:
    // Throws Trouble when the archive is broken.
    explicit ZipArchive(std::unique_ptr<RegularFile> file);

    const std::string& path() const { return file_->path(); }
    RegularFile& file() { return *file_; }

    // The names of all entries; nothing in place of one that cannot be read.
    std::vector<std::optional<std::string>> names() const;

    // How many bytes of an entry may be read in any order; 0 if they may not.
    std::uint64_t stored_bytes(std::uint64_t index) const;

    // The bytes of an entry, checked against its sum as they are read, or when the last were. Those
    // of a large entry that is not compressed may be read in any order, by several threads; those
    // of others are decompressed one after another. `name` is what messages call it. Throws
    // Trouble.
    std::unique_ptr<ByteSource> open(std::uint64_t index, const std::string& name);

  private:
    class Entry;

    static zip_int64_t answer(void* archive, void* data, zip_uint64_t length,
                              zip_source_cmd_t command);
    zip_int64_t answer(void* data, zip_uint64_t length, zip_source_cmd_t command);

    std::unique_ptr<RegularFile> file_;
    std::uint64_t position_ = 0;  // where libzip reads next
    std::uint64_t last_read_ = 0; // where it has read last
    zip_error_t error_ = {};
    std::unique_ptr<zip_t, void (*)(zip_t*)> archive_;
};

} // namespace talcmp
