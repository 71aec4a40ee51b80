// An entry of an archive that is not compressed.

#pragma once

#include "byte_source.h"

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>

namespace talcmp {

class ZipArchive;

struct StoredBytes {
    std::uint64_t begin; // in the archive
    std::uint64_t size;
    std::uint32_t sum; // CRC-32
};

// Bytes that are read in any order, by several threads. Sums of parts are taken as these are read,
// and combined to that of all.
class StoredEntry : public ByteSource {
  public:
    StoredEntry(std::shared_ptr<ZipArchive> archive, std::string name, StoredBytes stored)
        : archive_(std::move(archive)), name_(std::move(name)), stored_(stored) {}

    bool random_access() const override { return true; }
    std::optional<std::uint64_t> size() const override { return stored_.size; }
    std::size_t read(std::uint64_t offset, void* bytes, std::size_t count) override;

    // Reads what has not been read. Throws Trouble if the sum is not right.
    void check_to_end() override;
    std::vector<SummedPart> summed_parts() const override;
    void add_summed_parts(const std::vector<SummedPart>& parts) override;

  private:
    struct Part {
        std::uint64_t end;
        std::uint32_t sum;
    };

    void add(std::uint64_t begin, std::uint64_t end, std::uint32_t sum);
    std::uint64_t first_gap() const;

    std::shared_ptr<ZipArchive> archive_;
    std::string name_;
    StoredBytes stored_;
    std::mutex mutex_;
    std::map<std::uint64_t, Part> parts_; // by their beginnings; no two overlap or meet
};

} // namespace talcmp
