#include "folder_files.h"

#include "trouble.h"

#include <algorithm>
#include <filesystem>
#include <iterator>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include <sys/stat.h>

namespace talcmp {
namespace {

namespace fs = std::filesystem;

// What all names of a folder, its own and those of links to it, have in common.
using Identity = std::pair<dev_t, ino_t>;

std::optional<Identity> identity_of(const fs::path& folder) {
    struct stat status = {};
    return ::stat(folder.c_str(), &status) == 0
               ? std::optional(Identity(status.st_dev, status.st_ino))
               : std::nullopt;
}

bool is_called_like_an_array(const fs::path& path) {
    constexpr std::string_view extensions[] = {".npy", ".npz", ".h5",  ".hdf5",
                                               ".he5", ".nc",  ".nc4", ".cdf"};
    const std::string extension = path.extension().string();
    return std::find(std::begin(extensions), std::end(extensions), extension)
           != std::end(extensions);
}

// Whether nothing has this name; a link that leads nowhere is something.
bool is_gone(const fs::path& path) {
    std::error_code ignored;
    return fs::symlink_status(path, ignored).type() == fs::file_type::not_found;
}

class Walk {
  public:
    explicit Walk(const fs::path& folder) : top_(folder) { enter(folder); }

    FolderFiles files() && { return std::move(found_); }

  private:
    void enter(const fs::path& folder) {
        const auto identity = identity_of(folder);
        if (identity && std::find(open_.begin(), open_.end(), *identity) != open_.end()) {
            add(folder, "is a link to a folder that it is in; leave it out by --exclude");
            return;
        }
        open_.push_back(identity.value_or(Identity()));
        std::error_code error;
        // Read to its end before the next is opened: there may be more levels than a program may
        // have files open.
        for (const fs::path& path : entries_of(folder, error)) {
            visit(path);
        }
        if (error) {
            cannot_be_read(folder, error);
        }
        open_.pop_back();
    }

    static std::vector<fs::path> entries_of(const fs::path& folder, std::error_code& error) {
        std::vector<fs::path> paths;
        for (fs::directory_iterator entry(folder, error);
             !error && entry != fs::directory_iterator(); entry.increment(error)) {
            paths.push_back(entry->path());
        }
        return paths;
    }

    void visit(const fs::path& path) {
        std::error_code error;
        const fs::file_status status = fs::status(path, error);
        if (fs::is_directory(status)) {
            enter(path);
        } else if (fs::exists(status)) {
            if (is_called_like_an_array(path)) {
                add(path, reason_not_to_open(path.string()));
            } else {
                found_.others.insert(name_of(path));
            }
        } else if (!is_gone(path)) {
            add(path, "cannot be followed: " + error.message());
        }
    }

    void cannot_be_read(const fs::path& folder, const std::error_code& error) {
        const std::string trouble = "cannot be read: " + error.message();
        if (folder == top_) {
            throw Trouble(folder.string(), trouble);
        }
        add(folder, trouble);
    }

    void add(const fs::path& path, std::optional<std::string> trouble) {
        found_.files[name_of(path)] = {path.string(), std::move(trouble)};
    }

    std::string name_of(const fs::path& path) const {
        return path.lexically_relative(top_).string();
    }

    fs::path top_;
    FolderFiles found_;
    std::vector<Identity> open_; // the folders that the walk is in
};

} // namespace

FolderFiles files_in(const std::string& folder) {
    return Walk(folder).files();
}

std::optional<std::string> reason_not_to_open(const std::string& path) {
    std::error_code error;
    const fs::file_status status = fs::status(path, error);
    if (!fs::exists(status) || fs::is_regular_file(status) || fs::is_directory(status)) {
        return std::nullopt; // or opening it says what is wrong
    }
    return "is no regular file; leave it out by --exclude, or compare it by itself";
}

} // namespace talcmp
