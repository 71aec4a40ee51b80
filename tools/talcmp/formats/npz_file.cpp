#include "npz_file.h"

#include "ends_with.h"
#include "npy_array.h"
#include "trouble.h"

#include <string_view>

namespace talcmp {
namespace {

constexpr std::string_view suffix = ".npy";

} // namespace

NpzFile::NpzFile(std::unique_ptr<RegularFile> file)
    : archive_(std::make_shared<ZipArchive>(std::move(file))) {
    std::uint64_t index = 0;
    for (const std::optional<std::string>& name : archive_->names()) {
        if (!name) {
            throw Trouble(archive_->path(), "has a member without a readable name");
        }
        add(*name, index++);
    }
}

void NpzFile::add(std::string member, const std::uint64_t index) {
    if (ends_with(member, "/")) {
        return; // a folder: zip writes an entry for it before its contents
    }
    if (ends_with(member, suffix)) {
        member.resize(member.size() - suffix.size());
    }
    if (!index_.emplace(member, index).second) {
        throw Trouble(archive_->path(), "has two members of the name '" + member + "'");
    }
}

std::vector<std::string> NpzFile::members() const {
    std::vector<std::string> names;
    for (const auto& [name, index] : index_) {
        names.push_back(name);
    }
    return names;
}

std::unique_ptr<ArraySource> NpzFile::open(const std::string& member) {
    const std::string name = archive_->path() + "[" + member + "]";
    return std::make_unique<NpyArray>(name, archive_->open(index_.at(member), name));
}

} // namespace talcmp
