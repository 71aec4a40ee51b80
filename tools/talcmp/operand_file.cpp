#include "operand_file.h"

#include "shape_text.h"
#include "trouble.h"

#include <algorithm>
#include <filesystem>
#include <system_error>
#include <utility>

namespace talcmp {
namespace {

// Some of the arrays that a file has, for a message.
std::string some_arrays(const ArrayFile& file) {
    constexpr std::size_t most = 5;
    const auto names = file.members();
    std::string text;
    for (std::size_t i = 0; i < std::min(most, names.size()); ++i) {
        text += (i == 0 ? "; it has " : ", ") + (file.root() + names[i]);
    }
    return text + (names.size() > most ? ", ..." : "");
}

} // namespace

std::uint64_t file_size(const std::string& path) {
    std::error_code error;
    const std::uint64_t size = std::filesystem::file_size(path, error);
    return error ? 0 : size;
}

std::string header_of(const OpenedArray& opened) {
    const ArraySource* const source = opened.array.source.get();
    if (source == nullptr) {
        return opened.not_numbers.value_or("");
    }
    return source->type_name() + " " + shape_text(source->shape()) + ", "
           + (source->fortran_order() ? "column-major" : "row-major")
           + (source->block().empty() ? "" : ", in blocks " + shape_text(source->block()));
}

OperandFile::OperandFile(std::string path, std::optional<std::string> member)
    : path_(std::move(path)), member_(std::move(member)), file_(open_array_file(path_)) {
    if (member_ && !file_->is_archive()) {
        throw Trouble(path_, "holds one array, without a name; leave out [" + *member_ + "]");
    }
}

std::string OperandFile::name_of(const std::string& array) const {
    return file_->is_archive() ? path_ + "[" + file_->root() + array + "]" : path_;
}

std::string OperandFile::chosen_array(const OperandFile* const other,
                                      const NameFilter& filter) const {
    if (!file_->is_archive()) {
        return "";
    }
    if (member_) {
        if (!file_->has(*member_)) {
            throw Trouble(path_, std::string("has no array '") + file_->root() + *member_ + "'"
                                     + some_arrays(*file_));
        }
        return *member_;
    }
    const auto names = file_->members();
    const auto members = match_names(names, {}, filter);
    if (members.size() == 1) {
        return members.front().name;
    }
    if (other != nullptr && other->member_ && file_->has(*other->member_)) {
        return *other->member_;
    }
    if (members.empty()) {
        throw Trouble(path_, names.empty() ? "holds no array"
                                           : "has no array that --include and --exclude leave");
    }
    throw Trouble(path_, "has " + std::to_string(members.size())
                             + " arrays, and one is needed; choose one, such as "
                             + name_of(members.front().name));
}

std::uint64_t OperandFile::divisible_bytes(const std::string& array) const {
    try {
        return file_->divisible_bytes(array);
    } catch (const Trouble&) {
        return 0; // which is reported when the array is opened
    }
}

OpenedArray OperandFile::open(const std::string& array) const {
    OpenedArray opened;
    opened.array.name = name_of(array);
    try {
        opened.array.source = file_->open(array);
    } catch (const NotNumbers& reason) {
        opened.not_numbers = reason.what();
    }
    return opened;
}

std::string OperandFile::contents() const {
    std::string text = std::to_string(file_size(path_)) + " bytes";
    if (file_->is_archive()) {
        for (const std::string& member : file_->members()) {
            text += ", " + member;
        }
    }
    return text;
}

} // namespace talcmp
