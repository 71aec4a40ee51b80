#include "netcdf_file.h"

#include "trouble.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace talcmp {
namespace {

std::vector<NetcdfVariable> variables_of(const std::string& path, ByteSource& file) {
    try {
        return read_netcdf_header(file);
    } catch (const NetcdfError& error) {
        throw Trouble(path, error.what());
    }
}

void check_complete(const std::string& name, const NetcdfVariable& variable,
                    const std::uint64_t file_size) {
    const std::optional<std::uint64_t> end = end_of(variable);
    if (has_elements(variable.shape) && (!end || *end > file_size)) {
        throw Trouble(name, "has less data than its shape says (its elements end at byte "
                                + (end ? std::to_string(*end) : "2^64 or later")
                                + ", the file at byte " + std::to_string(file_size)
                                + "); is the file complete?");
    }
}

class NetcdfArray : public ArraySource {
  public:
    NetcdfArray(std::string name, NetcdfVariable variable, std::shared_ptr<ByteSource> file)
        : name_(std::move(name)), variable_(std::move(variable)), file_(std::move(file)) {
        // Pieces without anything between them are one.
        if (variable_.in_records && variable_.record_bytes == variable_.piece_bytes) {
            variable_.piece_bytes *= variable_.shape.front();
        }
    }

    const ElementType& type() const override { return *stored().type; }
    std::string type_name() const override { return stored().name; }
    const Shape& shape() const override { return variable_.shape; }
    bool fortran_order() const override { return false; }
    bool random_access() const override { return true; }

    void read(const std::uint64_t first, const std::uint64_t count, void* const elements) override {
        // As many elements as memory holds.
        const auto in_memory = static_cast<std::size_t>(count);
        auto* const bytes =
            static_cast<unsigned char*>(room_for_stored(stored(), elements, in_memory));
        read_bytes(first * stored().size, in_memory * stored().size, bytes);
        decode(stored(), elements, in_memory);
    }

  private:
    const StoredType& stored() const { return *variable_.type; }

    // Reads bytes of the variable; offsets do not count what is between its pieces.
    void read_bytes(std::uint64_t offset, std::size_t count, unsigned char* bytes) {
        constexpr std::uint64_t longest_read_whole = 8192;
        const std::uint64_t piece = variable_.piece_bytes;
        std::vector<unsigned char> span;
        while (count != 0) {
            const bool gather = variable_.record_bytes <= longest_read_whole && offset % piece == 0
                                && count / piece > 1;
            const std::size_t done = gather ? read_pieces(offset, count, bytes, span)
                                            : read_in_piece(offset, count, bytes);
            offset += done;
            count -= done;
            bytes += done;
        }
    }

    // Reads up to the end of a piece. Returns the number of bytes.
    std::size_t read_in_piece(const std::uint64_t offset, const std::size_t count,
                              unsigned char* const bytes) {
        const std::uint64_t left = variable_.piece_bytes - offset % variable_.piece_bytes;
        const auto length = static_cast<std::size_t>(std::min<std::uint64_t>(count, left));
        read_stored(place_of(offset), bytes, length);
        return length;
    }

    // Reads whole pieces of short records, together with what is between them: that takes less time
    // than many reads. Returns the number of bytes that belong to the variable.
    std::size_t read_pieces(const std::uint64_t offset, const std::size_t count,
                            unsigned char* const bytes, std::vector<unsigned char>& span) {
        constexpr std::size_t longest_span = std::size_t{256} * 1024;
        const auto piece = static_cast<std::size_t>(variable_.piece_bytes);
        const auto stride = static_cast<std::size_t>(variable_.record_bytes);
        const std::size_t pieces = std::min(count / piece, longest_span / stride);
        span.resize((pieces - 1) * stride + piece);
        read_stored(place_of(offset), span.data(), span.size());
        for (std::size_t i = 0; i < pieces; ++i) {
            std::memcpy(bytes + i * piece, span.data() + i * stride, piece);
        }
        return pieces * piece;
    }

    std::uint64_t place_of(const std::uint64_t offset) const {
        const std::uint64_t piece = variable_.piece_bytes;
        return variable_.begin + offset / piece * variable_.record_bytes + offset % piece;
    }

    void read_stored(const std::uint64_t place, unsigned char* const bytes,
                     const std::size_t count) {
        if (file_->read(place, bytes, count) < count) {
            throw Trouble(name_, "has become shorter since it was opened; is it still being "
                                 "written?");
        }
    }

    std::string name_;
    NetcdfVariable variable_;
    std::shared_ptr<ByteSource> file_;
};

} // namespace

NetcdfFile::NetcdfFile(std::string path, std::shared_ptr<ByteSource> file)
    : path_(std::move(path)), file_(std::move(file)) {
    for (NetcdfVariable& variable : variables_of(path_, *file_)) {
        const std::string name = variable.name;
        if (!variables_.emplace(name, std::move(variable)).second) {
            throw Trouble(path_, "has two variables of the name '" + name + "'");
        }
    }
}

std::vector<std::string> NetcdfFile::members() const {
    std::vector<std::string> names;
    for (const auto& [name, variable] : variables_) {
        names.push_back(name);
    }
    return names;
}

std::uint64_t NetcdfFile::divisible_bytes(const std::string& member) {
    const NetcdfVariable& variable = variables_.at(member);
    const std::uint64_t records =
        variable.in_records && !variable.shape.empty() ? variable.shape.front() : 1;
    return variable.type && end_of(variable) ? variable.piece_bytes * records : 0;
}

std::unique_ptr<ArraySource> NetcdfFile::open(const std::string& member) {
    const NetcdfVariable& variable = variables_.at(member);
    const std::string name = path_ + "[" + root() + member + "]";
    if (!variable.type) {
        throw NotNumbers(name, "has elements of type char (text), which is not supported; save "
                               "them as integers of 8 to 64 bits, float or double");
    }
    check_complete(name, variable, file_->size().value());
    return std::make_unique<NetcdfArray>(name, variable, file_);
}

} // namespace talcmp
