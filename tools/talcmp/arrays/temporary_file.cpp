#include "temporary_file.h"

#include "blocked_signals.h"

#include <cstdlib>

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

TemporaryFile::TemporaryFile() : folder_(temporary_folder()), file_(open_without_name(folder_)) {
    if (file_.number() < 0) {
        throw_system_trouble(folder_, cannot_be_written);
    }
}

void TemporaryFile::write(std::uint64_t offset, const void* const bytes, const std::size_t count) {
    const auto* next = static_cast<const char*>(bytes);
    const char* const end = next + count;
    while (next != end) {
        const ssize_t written = ::pwrite(file_.number(), next, static_cast<std::size_t>(end - next),
                                         static_cast<off_t>(offset));
        if (written < 0 && errno == EINTR) {
            continue;
        }
        if (written <= 0) {
            throw_system_trouble(folder_, cannot_be_written);
        }
        next += written;
        offset += static_cast<std::uint64_t>(written);
    }
}

} // namespace talcmp
