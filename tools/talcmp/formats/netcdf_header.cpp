#include "netcdf_header.h"

#include <algorithm>
#include <limits>
#include <string_view>
#include <utility>

namespace talcmp {
namespace {

// ---- Sizes, or nothing where they are 2^64 or more

using Size = std::optional<std::uint64_t>;

Size sum(const Size one, const Size other) {
    std::uint64_t result = 0;
    const bool fits = one && other && !__builtin_add_overflow(*one, *other, &result);
    return fits ? Size(result) : std::nullopt;
}

Size product(const Size one, const Size other) {
    std::uint64_t result = 0;
    const bool fits = one && other && !__builtin_mul_overflow(*one, *other, &result);
    return fits ? Size(result) : std::nullopt;
}

// The bytes after a name, the values of an attribute, or a piece.
constexpr std::uint64_t padding(const std::uint64_t bytes) {
    constexpr std::uint64_t alignment = 4;
    return (alignment - bytes % alignment) % alignment;
}

// ---- The bytes of the header

class NetcdfBytes {
  public:
    explicit NetcdfBytes(ByteSource& file) : file_(file), file_size_(file.size().value()) {}

    std::uint64_t position() const { return position_; }
    std::uint64_t file_size() const { return file_size_; }

    // The next bytes, which stay where they are until the next call.
    std::string_view take(const std::size_t length, const char* what) {
        require(length, 1, what);
        if (position_ + length > window_begin_ + window_.size()) {
            move_window(length, what);
        }
        const auto begin = static_cast<std::size_t>(position_ - window_begin_);
        position_ += length;
        return std::string_view(window_).substr(begin, length);
    }

    void skip(const std::uint64_t count, const std::uint64_t size, const char* what) {
        require(count, size, what);
        position_ += count * size;
    }

  private:
    void require(const std::uint64_t count, const std::uint64_t size, const char* what) const {
        const std::uint64_t left = file_size_ - position_;
        if (count > left / size) {
            throw_end(count, what, left);
        }
    }

    void move_window(const std::size_t length, const char* what) {
        constexpr std::size_t kept_of_files = 4096; // by RegularFile
        const std::uint64_t left = file_size_ - position_;
        window_begin_ = position_;
        window_.resize(static_cast<std::size_t>(
            std::min<std::uint64_t>(left, std::max(length, kept_of_files))));
        window_.resize(file_.read(position_, window_.data(), window_.size()));
        if (window_.size() < length) { // the file has become shorter
            throw_end(length, what, window_.size());
        }
    }

    [[noreturn]] static void throw_end(const std::uint64_t count, const char* what,
                                       const std::uint64_t there) {
        throw NetcdfError(std::string("ends inside its header (") + what
                          + " expected: " + std::to_string(count)
                          + ", bytes there: " + std::to_string(there) + "); is the file complete?");
    }

    ByteSource& file_;
    std::uint64_t file_size_;
    std::uint64_t position_ = 0;
    std::uint64_t window_begin_ = 0;
    std::string window_;
};

// ---- The types of values, by their numbers from 1 on

struct ValueType {
    char kind; // as `stored_type` has it; or t, text
    std::size_t size;
};

constexpr ValueType value_types[] = {{'i', 1}, {'t', 1}, {'i', 2}, {'i', 4}, {'f', 4}, {'f', 8},
                                     {'u', 1}, {'u', 2}, {'u', 4}, {'i', 8}, {'u', 8}};
constexpr std::size_t types_before_version_5 = 6;

std::optional<StoredType> stored_as(const ValueType& type) {
    constexpr bool bytes_swapped = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;
    return stored_type(type.kind, type.size, bytes_swapped);
}

// ---- The header

// Far above what files have, so that a header takes little memory.
constexpr std::uint64_t most_entries = std::uint64_t{1} << 20U;
constexpr std::uint64_t longest_name = 1024;
constexpr std::uint64_t most_dimensions = 1024;

struct List {
    std::uint64_t tag;
    const char* name;
};

constexpr List dimension_list = {10, "dimensions"};
constexpr List variable_list = {11, "variables"};
constexpr List attribute_list = {12, "attributes"};

std::string in_quotes(const std::string& name) {
    return "'" + name + "'";
}

std::string too_many(const std::string& what, const std::uint64_t most) {
    return "has " + what + "; " + std::to_string(most) + " are supported";
}

class NetcdfHeaderReader {
  public:
    explicit NetcdfHeaderReader(ByteSource& file) : bytes_(file) {}

    std::vector<NetcdfVariable> read() {
        read_version();
        const std::uint64_t records = size();
        read_dimensions();
        skip_attributes();
        read_variables();
        measure_records();
        set_record_count(records == unknown_size() ? counted_records() : records);
        check_beginnings();
        return std::move(variables_);
    }

  private:
    // ---- Numbers, names and lists

    std::uint64_t number(const std::size_t width) {
        std::uint64_t value = 0;
        for (const char byte : bytes_.take(width, "bytes of a number")) {
            value = value << 8U | static_cast<unsigned char>(byte);
        }
        return value;
    }

    std::size_t size_width() const { return version_ == 5 ? 8 : 4; }
    std::uint64_t size() { return number(size_width()); }

    // The number of records while a program still appends some.
    std::uint64_t unknown_size() const {
        return std::numeric_limits<std::uint64_t>::max() >> (64 - 8 * size_width());
    }

    void skip_padding(const std::uint64_t bytes) {
        bytes_.skip(padding(bytes), 1, "bytes of padding");
    }

    std::string name() {
        const std::uint64_t length = size();
        if (length > longest_name) {
            throw NetcdfError(
                too_many("a name of " + std::to_string(length) + " bytes", longest_name));
        }
        std::string text(bytes_.take(static_cast<std::size_t>(length), "bytes of a name"));
        skip_padding(length);
        return text;
    }

    // The number of entries of a list that begins here.
    std::uint64_t entries(const List& list) {
        const std::string place = std::to_string(bytes_.position());
        const std::uint64_t tag = number(4);
        const std::uint64_t count = size();
        const bool left_out = tag == 0 && count == 0;
        if (tag != list.tag && !left_out) {
            throw NetcdfError(std::string("has a broken header: expected a list of ") + list.name
                              + " at byte " + place);
        }
        if (count > most_entries) {
            throw NetcdfError(
                too_many("a list of " + std::to_string(count) + " " + list.name, most_entries));
        }
        return count;
    }

    ValueType value_type(const std::string& whose) {
        const std::uint64_t type = number(4);
        const std::size_t types = version_ == 5 ? std::size(value_types) : types_before_version_5;
        if (type == 0 || type > types) {
            throw NetcdfError("has " + whose + " of the unknown type " + std::to_string(type));
        }
        return value_types[type - 1];
    }

    // ---- The parts of the header

    void read_version() {
        const std::string_view magic = bytes_.take(4, "bytes of format and version");
        version_ = static_cast<unsigned char>(magic[3]);
        if (magic.substr(0, 3) != "CDF" || (version_ != 1 && version_ != 2 && version_ != 5)) {
            throw NetcdfError("is not a netCDF file: it does not begin with CDF and the byte 1, 2 "
                              "or 5");
        }
    }

    void read_dimensions() {
        bool in_records = false;
        for (std::uint64_t left = entries(dimension_list); left != 0; --left) {
            const std::string dimension = name();
            dimensions_.push_back(size());
            if (dimensions_.back() == record_dimension) {
                if (in_records) {
                    throw NetcdfError("has a second record dimension, " + in_quotes(dimension));
                }
                in_records = true;
            }
        }
    }

    void skip_attributes() {
        for (std::uint64_t left = entries(attribute_list); left != 0; --left) {
            const std::string attribute = name();
            const ValueType type = value_type("the attribute " + in_quotes(attribute));
            const std::uint64_t count = size();
            bytes_.skip(count, type.size, "values of an attribute");
            skip_padding(count * type.size);
        }
    }

    void read_variables() {
        for (std::uint64_t left = entries(variable_list); left != 0; --left) {
            variables_.push_back(read_variable());
        }
    }

    NetcdfVariable read_variable() {
        NetcdfVariable variable;
        variable.name = name();
        if (variable.name.empty()) {
            throw NetcdfError("has a variable without a name");
        }
        read_shape(variable);
        skip_attributes();
        const ValueType type = value_type("the variable " + in_quotes(variable.name));
        variable.type = stored_as(type);
        size(); // of a piece: it follows from the shape, and is wrong where it would be too large
        variable.begin = number(version_ == 1 ? 4 : 8);
        measure_piece(variable, type.size);
        return variable;
    }

    void read_shape(NetcdfVariable& variable) {
        const std::uint64_t rank = size();
        if (rank > most_dimensions) {
            throw NetcdfError(too_many("the variable " + in_quotes(variable.name) + " of "
                                           + std::to_string(rank) + " dimensions",
                                       most_dimensions));
        }
        for (std::uint64_t axis = 0; axis < rank; ++axis) {
            variable.shape.push_back(dimension(variable, size()));
            if (variable.shape.back() == record_dimension) {
                if (axis != 0) {
                    fail(variable, ", of which the record dimension is not the first");
                }
                variable.in_records = true;
            }
        }
    }

    std::uint64_t dimension(const NetcdfVariable& variable, const std::uint64_t id) const {
        if (id >= dimensions_.size()) {
            fail(variable, " of the unknown dimension " + std::to_string(id));
        }
        return dimensions_[static_cast<std::size_t>(id)];
    }

    static void measure_piece(NetcdfVariable& variable, const std::uint64_t element_size) {
        Size bytes = element_size;
        for (const std::uint64_t dimension : variable.shape) {
            bytes = dimension == record_dimension ? bytes : product(bytes, dimension);
        }
        if (!bytes) {
            fail(variable, std::string(" of more than 2^64 - 1 bytes")
                               + (variable.in_records ? " in a record" : ""));
        }
        variable.piece_bytes = *bytes;
    }

    [[noreturn]] static void fail(const NetcdfVariable& variable, const std::string& of_it) {
        throw NetcdfError("has the variable " + in_quotes(variable.name) + of_it);
    }

    // ---- The records

    std::vector<NetcdfVariable*> in_records() {
        std::vector<NetcdfVariable*> chosen;
        for (NetcdfVariable& variable : variables_) {
            if (variable.in_records) {
                chosen.push_back(&variable);
            }
        }
        return chosen;
    }

    // Pieces are padded, but not where a record is a single one.
    void measure_records() {
        const auto variables = in_records();
        Size bytes = 0;
        for (const NetcdfVariable* variable : variables) {
            const std::uint64_t piece = variable->piece_bytes;
            bytes = sum(bytes, variables.size() == 1 ? piece : sum(piece, padding(piece)));
        }
        if (!bytes) {
            throw NetcdfError("has records of more than 2^64 - 1 bytes");
        }
        for (NetcdfVariable* variable : variables) {
            variable->record_bytes = *bytes;
        }
    }

    void set_record_count(const std::uint64_t count) {
        for (NetcdfVariable* variable : in_records()) {
            variable->shape.front() = count;
        }
    }

    // The records of which the file has all pieces; nothing may follow them.
    std::uint64_t counted_records() {
        const std::uint64_t file_size = bytes_.file_size();
        std::uint64_t begin = file_size; // of the first record
        std::uint64_t count = std::numeric_limits<std::uint64_t>::max();
        std::uint64_t record_bytes = 0;
        for (const NetcdfVariable* variable : in_records()) {
            record_bytes = variable->record_bytes;
            begin = std::min(begin, variable->begin);
            const std::uint64_t there = file_size - std::min(file_size, variable->begin);
            const std::uint64_t piece = variable->piece_bytes;
            count = std::min(count, there < piece ? 0 : (there - piece) / record_bytes + 1);
        }
        // It may be less where the last piece lacks its padding.
        if (file_size - begin > count * record_bytes) {
            throw NetcdfError("ends inside a record, and does not say how many there are; is the "
                              "file complete?");
        }
        return count;
    }

    void check_beginnings() const {
        for (const NetcdfVariable& variable : variables_) {
            if (variable.begin < bytes_.position() && has_elements(variable.shape)) {
                fail(variable,
                     " at byte " + std::to_string(variable.begin) + ", inside the header");
            }
        }
    }

    // The length that the dimension of the records is written with, and no other.
    static constexpr std::uint64_t record_dimension = 0;

    NetcdfBytes bytes_;
    int version_ = 0;
    std::vector<std::uint64_t> dimensions_;
    std::vector<NetcdfVariable> variables_;
};

} // namespace

std::optional<std::uint64_t> end_of(const NetcdfVariable& variable) {
    if (!has_elements(variable.shape)) {
        return variable.begin;
    }
    const std::uint64_t records_before = variable.in_records ? variable.shape.front() - 1 : 0;
    const Size last_piece = sum(variable.begin, product(records_before, variable.record_bytes));
    return sum(last_piece, variable.piece_bytes);
}

std::vector<NetcdfVariable> read_netcdf_header(ByteSource& file) {
    return NetcdfHeaderReader(file).read();
}

} // namespace talcmp
