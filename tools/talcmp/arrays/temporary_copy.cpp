#include "temporary_copy.h"

#include "blocked_signals.h"

#include <algorithm>
#include <cstdlib>
#include <vector>

#include <fcntl.h>

namespace talcmp {
namespace {

int open_without_name(const std::string& folder) {
    std::string path = folder + "/talcmp-XXXXXX";
    const BlockedSignals blocked; // otherwise a signal might leave the file behind
    const int file = ::mkostemp(path.data(), O_CLOEXEC);
    if (file >= 0) {
        ::unlink(path.c_str());
    }
    return file;
}

std::string temporary_folder() {
    // NOLINTNEXTLINE(concurrency-mt-unsafe): nothing changes the environment.
    const char* const folder = std::getenv("TMPDIR");
    return folder != nullptr && *folder != '\0' ? folder : "/tmp";
}

constexpr const char* cannot_be_written =
    "cannot take a temporary copy of the array; set TMPDIR to a folder with room for it";

} // namespace

TemporaryCopy::TemporaryCopy(std::unique_ptr<ArraySource> source,
                             const std::function<void(std::uint64_t)>& copied)
    : source_(std::move(source)), folder_(temporary_folder()), file_(open_without_name(folder_)) {
    if (file_.number() < 0) {
        throw_system_trouble(folder_, cannot_be_written);
    }
    copy_all(copied);
}

void TemporaryCopy::copy_all(const std::function<void(std::uint64_t)>& copied) {
    constexpr std::uint64_t elements_at_once = std::uint64_t{1} << 14U;
    const std::size_t size = source_->type().size;
    const std::uint64_t total = element_count(*source_);
    std::vector<char> buffer(static_cast<std::size_t>(std::min(elements_at_once, total)) * size);
    for (std::uint64_t first = 0; first < total; first += elements_at_once) {
        const std::uint64_t count = std::min(elements_at_once, total - first);
        const auto bytes = static_cast<std::size_t>(count) * size;
        source_->read(first, count, buffer.data());
        append(buffer.data(), bytes);
        copied(bytes);
    }
    source_->check_to_end();
}

void TemporaryCopy::append(const char* bytes, std::size_t count) {
    while (count > 0) {
        const ssize_t written = ::write(file_.number(), bytes, count);
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            throw_system_trouble(folder_, cannot_be_written);
        }
        bytes += written;
        count -= static_cast<std::size_t>(written);
    }
}

void TemporaryCopy::read(const std::uint64_t first, const std::uint64_t count,
                         void* const elements) {
    const std::size_t size = source_->type().size;
    const std::size_t bytes = static_cast<std::size_t>(count) * size;
    if (read_at(file_.number(), folder_, first * size, elements, bytes) < bytes) {
        throw Trouble(folder_, "the temporary copy of the array there was cut short");
    }
}

} // namespace talcmp
