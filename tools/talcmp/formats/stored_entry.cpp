#include "stored_entry.h"

#include "trouble.h"
#include "zip_archive.h"

#include <algorithm>
#include <iterator>
#include <vector>

#include <libdeflate.h>
#include <zlib.h>

namespace talcmp {

std::size_t StoredEntry::read(const std::uint64_t offset, void* const bytes,
                              const std::size_t count) {
    // Smaller parts would be many, and are read again in the end.
    constexpr std::size_t smallest_part = 4096;
    const std::uint64_t there = stored_.size - std::min(offset, stored_.size);
    const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(count, there));
    const std::size_t got = archive_->file().read(stored_.begin + offset, bytes, wanted);
    if (got >= smallest_part) {
        const auto sum = static_cast<std::uint32_t>(::libdeflate_crc32(0, bytes, got));
        add(offset, offset + got, sum);
    }
    return got;
}

// Leaves out what overlaps other parts.
void StoredEntry::add(std::uint64_t begin, std::uint64_t end, std::uint32_t sum) {
    const auto combined = [](const std::uint32_t first, const std::uint32_t second,
                             const std::uint64_t length) {
        return static_cast<std::uint32_t>(
            ::crc32_combine(first, second, static_cast<z_off_t>(length)));
    };
    const std::lock_guard<std::mutex> lock(mutex_);
    auto next = parts_.lower_bound(begin);
    if (next != parts_.end() && next->first < end) {
        return;
    }
    if (next != parts_.begin() && std::prev(next)->second.end > begin) {
        return;
    }
    if (next != parts_.end() && next->first == end) {
        sum = combined(sum, next->second.sum, next->second.end - next->first);
        end = next->second.end;
        next = parts_.erase(next);
    }
    if (next != parts_.begin() && std::prev(next)->second.end == begin) {
        Part& before = std::prev(next)->second;
        before.sum = combined(before.sum, sum, end - begin);
        before.end = end;
    } else {
        parts_.emplace_hint(next, begin, Part{end, sum});
    }
}

void StoredEntry::check_to_end() {
    std::vector<unsigned char> bytes(std::size_t{256} * 1024);
    for (std::uint64_t begin = first_gap(); begin < stored_.size; begin = first_gap()) {
        const auto next = parts_.upper_bound(begin);
        const std::uint64_t end = next == parts_.end() ? stored_.size : next->first;
        const auto wanted =
            static_cast<std::size_t>(std::min<std::uint64_t>(bytes.size(), end - begin));
        const std::size_t got = archive_->file().read(stored_.begin + begin, bytes.data(), wanted);
        if (got == 0) {
            throw Trouble(name_, "cannot be read: the archive ends in it; is the file complete?");
        }
        add(begin, begin + got,
            static_cast<std::uint32_t>(::libdeflate_crc32(0, bytes.data(), got)));
    }
    if (parts_.begin()->second.sum != stored_.sum) {
        throw Trouble(name_, "cannot be read: CRC error; is the archive damaged?");
    }
}

std::vector<SummedPart> StoredEntry::summed_parts() const {
    std::vector<SummedPart> parts;
    parts.reserve(parts_.size());
    for (const auto& [begin, part] : parts_) {
        parts.push_back({begin, part.end, part.sum});
    }
    return parts;
}

void StoredEntry::add_summed_parts(const std::vector<SummedPart>& parts) {
    for (const SummedPart& part : parts) {
        add(part.begin, part.end, part.sum);
    }
}

std::uint64_t StoredEntry::first_gap() const {
    return parts_.empty() || parts_.begin()->first != 0 ? 0 : parts_.begin()->second.end;
}

} // namespace talcmp
