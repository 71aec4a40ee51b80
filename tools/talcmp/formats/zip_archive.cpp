#include "zip_archive.h"

#include "byte_stream.h"
#include "stored_entry.h"
#include "trouble.h"

#include <cstring>

namespace talcmp {
namespace {

// Whether the entry is stored as it is, and so large that several threads read it faster than one.
bool is_divisible(const zip_stat_t& status) {
    constexpr std::uint64_t large = std::uint64_t{1} << 20U;
    constexpr zip_uint64_t needed = ZIP_STAT_SIZE | ZIP_STAT_COMP_SIZE | ZIP_STAT_CRC
                                    | ZIP_STAT_COMP_METHOD | ZIP_STAT_ENCRYPTION_METHOD;
    return (status.valid & needed) == needed && status.comp_method == ZIP_CM_STORE
           && status.encryption_method == ZIP_EM_NONE && status.size == status.comp_size
           && status.size >= large;
}

} // namespace

// ---- What libzip reads, and an entry as libzip reads it

// Remembers where libzip reads, as it does not say where entries begin.
zip_int64_t ZipArchive::answer(void* const data, const zip_uint64_t length,
                               const zip_source_cmd_t command) {
    switch (command) {
    case ZIP_SOURCE_OPEN:
        position_ = 0;
        return 0;
    case ZIP_SOURCE_READ: {
        last_read_ = position_;
        const std::size_t got = file_->read(position_, data, static_cast<std::size_t>(length));
        position_ += got;
        return static_cast<zip_int64_t>(got);
    }
    case ZIP_SOURCE_SEEK: {
        const auto place =
            ::zip_source_seek_compute_offset(position_, *file_->size(), data, length, &error_);
        position_ = place < 0 ? position_ : static_cast<std::uint64_t>(place);
        return place < 0 ? -1 : 0;
    }
    case ZIP_SOURCE_TELL:
        return static_cast<zip_int64_t>(position_);
    case ZIP_SOURCE_STAT: {
        zip_stat_t status;
        ::zip_stat_init(&status);
        status.valid = ZIP_STAT_SIZE;
        status.size = *file_->size();
        std::memcpy(data, &status, sizeof status);
        return sizeof status;
    }
    case ZIP_SOURCE_ERROR:
        return ::zip_error_to_data(&error_, data, length);
    case ZIP_SOURCE_CLOSE:
    case ZIP_SOURCE_FREE:
        return 0;
    case ZIP_SOURCE_SUPPORTS:
        return ::zip_source_make_command_bitmap(
            ZIP_SOURCE_OPEN, ZIP_SOURCE_READ, ZIP_SOURCE_CLOSE, ZIP_SOURCE_STAT, ZIP_SOURCE_ERROR,
            ZIP_SOURCE_FREE, ZIP_SOURCE_SEEK, ZIP_SOURCE_TELL, ZIP_SOURCE_SUPPORTS, -1);
    default:
        ::zip_error_set(&error_, ZIP_ER_OPNOTSUPP, 0);
        return -1;
    }
}

// No exception may pass through libzip.
zip_int64_t ZipArchive::answer(void* const archive, void* const data, const zip_uint64_t length,
                               const zip_source_cmd_t command) {
    auto* const self = static_cast<ZipArchive*>(archive);
    try {
        return self->answer(data, length, command);
    } catch (const std::exception&) {
        ::zip_error_set(&self->error_, ZIP_ER_READ, errno);
        return -1;
    }
}

class ZipArchive::Entry : public ByteStream {
  public:
    Entry(std::shared_ptr<ZipArchive> archive, const std::uint64_t index, std::string name)
        : archive_(std::move(archive)), name_(std::move(name)),
          file_(::zip_fopen_index(archive_->archive_.get(), index, 0), ::zip_fclose) {
        ::zip_stat_init(&status_);
        zip_t* const zip = archive_->archive_.get();
        if (file_ == nullptr || ::zip_stat_index(zip, index, 0, &status_) != 0
            || (status_.valid & ZIP_STAT_SIZE) == 0) {
            throw Trouble(name_, std::string("cannot be opened: ") + ::zip_strerror(zip));
        }
    }

    std::optional<std::uint64_t> size() const override { return status_.size; }
    const zip_stat_t& status() const { return status_; }

  private:
    std::size_t read_next(void* const bytes, const std::size_t count) override {
        const zip_int64_t got = ::zip_fread(file_.get(), bytes, count);
        if (got < 0) {
            throw Trouble(name_, std::string("cannot be read: ") + ::zip_file_strerror(file_.get())
                                     + "; is the archive damaged?");
        }
        return static_cast<std::size_t>(got);
    }

    std::shared_ptr<ZipArchive> archive_;
    std::string name_;
    std::unique_ptr<zip_file_t, int (*)(zip_file_t*)> file_;
    zip_stat_t status_ = {};
};

// ---- The archive

ZipArchive::ZipArchive(std::unique_ptr<RegularFile> file)
    : file_(std::move(file)), archive_(nullptr, ::zip_discard) {
    ::zip_error_init(&error_);
    zip_error_t error;
    ::zip_error_init(&error);
    zip_source_t* const source = ::zip_source_function_create(answer, this, &error);
    if (source != nullptr) {
        archive_.reset(::zip_open_from_source(source, ZIP_RDONLY, &error));
    }
    if (archive_ == nullptr) {
        const std::string text = ::zip_error_strerror(&error);
        ::zip_error_fini(&error);
        ::zip_source_free(source);
        throw Trouble(path(), "is a broken .npz archive: " + text + "; is the file complete?");
    }
}

std::vector<std::optional<std::string>> ZipArchive::names() const {
    std::vector<std::optional<std::string>> names;
    const zip_int64_t count = ::zip_get_num_entries(archive_.get(), 0);
    for (zip_int64_t i = 0; i < count; ++i) {
        const char* const name =
            ::zip_get_name(archive_.get(), static_cast<zip_uint64_t>(i), ZIP_FL_ENC_GUESS);
        names.push_back(name == nullptr ? std::nullopt : std::optional<std::string>(name));
    }
    return names;
}

std::uint64_t ZipArchive::stored_bytes(const std::uint64_t index) const {
    zip_stat_t status;
    ::zip_stat_init(&status);
    const bool is_known = ::zip_stat_index(archive_.get(), index, 0, &status) == 0;
    return is_known && is_divisible(status) ? status.size : 0;
}

std::unique_ptr<ByteSource> ZipArchive::open(const std::uint64_t index, const std::string& name) {
    auto entry = std::make_unique<Entry>(shared_from_this(), index, name);
    const zip_stat_t& status = entry->status();
    if (!is_divisible(status)) {
        return entry;
    }
    char first = 0;
    entry->read(0, &first, 1); // and so libzip reads where the entry begins
    const std::uint64_t begin = last_read_;
    return std::make_unique<StoredEntry>(shared_from_this(), name,
                                         StoredBytes{begin, status.size, status.crc});
}

} // namespace talcmp
