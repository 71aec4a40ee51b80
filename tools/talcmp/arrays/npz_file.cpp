#include "npz_file.h"

#include "byte_stream.h"
#include "npy_array.h"
#include "trouble.h"

#include <string_view>

namespace talcmp {
namespace {

constexpr std::string_view suffix = ".npy";

bool ends_with(const std::string_view text, const std::string_view end) {
    return text.size() >= end.size() && text.substr(text.size() - end.size()) == end;
}

std::shared_ptr<zip_t> open_archive(RegularFile& file) {
    int code = 0;
    zip_t* const archive = ::zip_fdopen(file.descriptor().number(), 0, &code);
    if (archive == nullptr) {
        zip_error_t error;
        ::zip_error_init_with_code(&error, code);
        const std::string text = ::zip_error_strerror(&error);
        ::zip_error_fini(&error);
        throw Trouble(file.path(), "is a broken .npz archive: " + text + "; is the file complete?");
    }
    file.descriptor().release();
    return {archive, ::zip_discard};
}

// The bytes of one member, decompressed and checked as they are read.
class Member : public ByteStream {
  public:
    Member(std::shared_ptr<zip_t> archive, const zip_uint64_t index, std::string name)
        : archive_(std::move(archive)), name_(std::move(name)),
          file_(::zip_fopen_index(archive_.get(), index, 0), ::zip_fclose) {
        zip_stat_t status;
        if (file_ == nullptr || ::zip_stat_index(archive_.get(), index, 0, &status) != 0
            || (status.valid & ZIP_STAT_SIZE) == 0) {
            throw Trouble(name_,
                          std::string("cannot be opened: ") + ::zip_strerror(archive_.get()));
        }
        size_ = status.size;
    }

    std::optional<std::uint64_t> size() const override { return size_; }

  private:
    std::size_t read_next(void* const bytes, const std::size_t count) override {
        const zip_int64_t got = ::zip_fread(file_.get(), bytes, count);
        if (got < 0) {
            throw Trouble(name_, std::string("cannot be read: ") + ::zip_file_strerror(file_.get())
                                     + "; is the archive damaged?");
        }
        return static_cast<std::size_t>(got);
    }

    std::shared_ptr<zip_t> archive_;
    std::string name_;
    std::unique_ptr<zip_file_t, int (*)(zip_file_t*)> file_;
    std::uint64_t size_ = 0;
};

} // namespace

NpzFile::NpzFile(RegularFile& file) : path_(file.path()), archive_(open_archive(file)) {
    const zip_int64_t count = ::zip_get_num_entries(archive_.get(), 0);
    for (zip_int64_t i = 0; i < count; ++i) {
        const auto index = static_cast<zip_uint64_t>(i);
        const char* const name = ::zip_get_name(archive_.get(), index, ZIP_FL_ENC_GUESS);
        if (name == nullptr) {
            throw Trouble(path_, "has a member without a readable name");
        }
        std::string member = name;
        if (ends_with(member, "/")) {
            continue; // a folder: zip writes an entry for it before its contents
        }
        if (ends_with(member, suffix)) {
            member.resize(member.size() - suffix.size());
        }
        if (!index_.emplace(member, index).second) {
            throw Trouble(path_, "has two members of the name '" + member + "'");
        }
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
    const std::string name = path_ + "[" + member + "]";
    return std::make_unique<NpyArray>(name,
                                      std::make_unique<Member>(archive_, index_.at(member), name));
}

} // namespace talcmp
