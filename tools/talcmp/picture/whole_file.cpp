#include "whole_file.h"

#include "blocked_signals.h"
#include "descriptor.h"

#include <cerrno>
#include <cstdio>
#include <filesystem>
#include <system_error>

#include <fcntl.h>
#include <unistd.h>

namespace talcmp {
namespace {

constexpr const char* not_written = "cannot be written";

int opened(const std::string& path, const int flags) {
    constexpr mode_t as_the_user_wants = 0666; // less what the umask takes away
    return ::open(path.c_str(), O_WRONLY | O_CLOEXEC | flags, as_the_user_wants);
}

bool write_bytes(const int file, std::string_view bytes) {
    while (!bytes.empty()) {
        const ssize_t written = ::write(file, bytes.data(), bytes.size());
        if (written < 0 && errno != EINTR) {
            return false;
        }
        bytes.remove_prefix(written > 0 ? static_cast<std::size_t>(written) : 0);
    }
    return true;
}

// Closing may report what writing did not.
bool write_and_close(const int number, const std::string_view bytes) {
    Descriptor file(number);
    return file.number() >= 0 && write_bytes(file.number(), bytes) && ::close(file.release()) == 0;
}

bool write_in_place(const std::string& path, const std::string_view bytes) {
    return write_and_close(opened(path, 0), bytes);
}

bool write_beside(const std::string& path, const std::string_view bytes) {
    const std::string beside = path + ".part-" + std::to_string(::getpid());
    const BlockedSignals blocked; // otherwise a signal might leave the file behind
    const int file = opened(beside, O_CREAT | O_EXCL);
    if (file < 0) {
        return false;
    }
    if (write_and_close(file, bytes) && std::rename(beside.c_str(), path.c_str()) == 0) {
        return true;
    }
    const int reason = errno;
    ::unlink(beside.c_str());
    errno = reason;
    return false;
}

} // namespace

void write_whole_file(const std::string& path, const std::string_view bytes) {
    std::error_code ignored;
    const auto kind = std::filesystem::status(path, ignored).type();
    const bool is_file = kind == std::filesystem::file_type::regular;
    const bool is_new = kind == std::filesystem::file_type::not_found;
    const std::string target = is_file ? std::filesystem::canonical(path, ignored).string() : path;
    if (!(is_file || is_new ? write_beside(target, bytes) : write_in_place(path, bytes))) {
        throw_system_trouble(path, not_written);
    }
}

} // namespace talcmp
