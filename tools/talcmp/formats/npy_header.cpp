#include "npy_header.h"

#include "element_type.h"

#include <algorithm>
#include <limits>
#include <optional>
#include <string>
#include <string_view>

namespace talcmp {
namespace {

// What a message quotes from a file: one line of plain characters.
std::string printable(const std::string_view text) {
    constexpr std::size_t longest = 40;
    std::string shown(text.substr(0, longest));
    std::replace_if(
        shown.begin(), shown.end(), [](const char c) { return c < ' ' || c > '~'; }, '?');
    return "'" + shown + (text.size() > longest ? "...'" : "'");
}

// ---- The dictionary: the few Python literals that NumPy writes there

// The most dimensions that NumPy makes.
constexpr std::size_t highest_rank = 64;

struct Dictionary {
    std::string_view descr;
    bool fortran_order = false;
    Shape shape;
};

class DictionaryReader {
  public:
    explicit DictionaryReader(const std::string_view text) : text_(text) {}

    Dictionary read() {
        expect('{', "a dictionary");
        while (!accept('}')) {
            read_entry();
            if (!accept(',')) {
                expect('}', "',' or '}'");
                break;
            }
        }
        skip_space();
        if (position_ != text_.size()) {
            fail("nothing after the dictionary");
        }
        return {required(descr_, "descr"), required(fortran_order_, "fortran_order"),
                required(shape_, "shape")};
    }

  private:
    void read_entry() {
        const std::string_view key = string();
        expect(':', "':'");
        if (key == "descr") {
            set(descr_, key, element_type_code());
        } else if (key == "fortran_order") {
            set(fortran_order_, key, boolean());
        } else if (key == "shape") {
            set(shape_, key, dimensions());
        } else {
            throw NpyError("has a header with the unknown key " + printable(key));
        }
    }

    template <typename Value>
    static void set(std::optional<Value>& entry, const std::string_view key, Value value) {
        if (entry.has_value()) {
            throw NpyError("has a header with the key " + printable(key) + " twice");
        }
        entry = std::move(value);
    }

    template <typename Value>
    static Value required(const std::optional<Value>& entry, const std::string_view key) {
        if (!entry.has_value()) {
            throw NpyError("has a header without the key " + printable(key));
        }
        return *entry;
    }

    std::string_view string() {
        skip_space();
        const char quote = peek();
        if (quote != '\'' && quote != '"') {
            fail("a string in quotes");
        }
        const std::size_t end = text_.find(quote, position_ + 1);
        if (end == std::string_view::npos) {
            fail("a string with a closing quote");
        }
        const std::string_view contents = text_.substr(position_ + 1, end - position_ - 1);
        position_ = end + 1;
        return contents;
    }

    std::string_view element_type_code() {
        skip_space();
        if (peek() == '[' || peek() == '(' || peek() == '{') {
            throw NpyTypeError("has structured elements; save each field as an array of its own");
        }
        return string();
    }

    bool boolean() {
        if (accept_word("True")) {
            return true;
        }
        if (!accept_word("False")) {
            fail("True or False");
        }
        return false;
    }

    Shape dimensions() {
        expect('(', "a shape in parentheses");
        Shape shape;
        bool ends_with_comma = true;
        while (!accept(')')) {
            if (!ends_with_comma) {
                fail("',' or ')'");
            }
            if (shape.size() == highest_rank) {
                throw NpyError("has a shape of more than 64 dimensions");
            }
            shape.push_back(dimension());
            ends_with_comma = accept(',');
        }
        if (shape.size() == 1 && !ends_with_comma) {
            fail("a shape of one dimension with a ',' after it");
        }
        return shape;
    }

    std::uint64_t dimension() {
        if (peek() == '-') {
            throw NpyError("has a shape with a negative dimension");
        }
        if (!is_digit(peek())) {
            fail("a dimension");
        }
        std::uint64_t value = 0;
        for (; is_digit(peek()); ++position_) {
            const auto digit = static_cast<std::uint64_t>(peek() - '0');
            if (value > (std::numeric_limits<std::uint64_t>::max() - digit) / 10) {
                throw NpyError("has a shape with a dimension above 2^64 - 1");
            }
            value = 10 * value + digit;
        }
        accept('L'); // a long integer of Python 2
        return value;
    }

    // Moves past the next character if it is `character`.
    bool accept(const char character) {
        skip_space();
        const bool there = position_ < text_.size() && text_[position_] == character;
        position_ += there ? 1 : 0;
        return there;
    }

    bool accept_word(const std::string_view word) {
        skip_space();
        const bool there = text_.substr(position_, word.size()) == word;
        position_ += there ? word.size() : 0;
        return there;
    }

    void expect(const char character, const char* description) {
        if (!accept(character)) {
            fail(description);
        }
    }

    void skip_space() {
        position_ = std::min(text_.find_first_not_of(" \t\r\n\f", position_), text_.size());
    }

    // The next character; a zero at the end.
    char peek() const { return position_ < text_.size() ? text_[position_] : '\0'; }

    static bool is_digit(const char character) { return character >= '0' && character <= '9'; }

    [[noreturn]] void fail(const char* expected) const {
        throw NpyError("has a broken header: expected " + std::string(expected) + " at byte "
                       + std::to_string(position_) + " of the dictionary");
    }

    std::string_view text_;
    std::size_t position_ = 0;
    std::optional<std::string_view> descr_;
    std::optional<bool> fortran_order_;
    std::optional<Shape> shape_;
};

// ---- What the dictionary means

// NumPy's names for the element types that talcmp does not read.
std::string kind_name(const std::string& code) {
    if (code == "f12" || code == "f16" || code == "c24" || code == "c32") {
        return " (extended precision)";
    }
    switch (code.empty() ? '\0' : code[0]) {
    case 'O':
        return " (Python objects)";
    case 'S':
    case 'a':
    case 'U':
        return " (text)";
    case 'V':
        return " (raw bytes)";
    case 'M':
    case 'm':
        return " (dates or times)";
    default:
        return ""; // another width, or nothing that NumPy writes
    }
}

constexpr char native_byte_order = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__ ? '<' : '>';

// The letter of the kind and the number of bytes; '?' is NumPy's short name of booleans.
std::optional<StoredType> type_of(const std::string& code, const bool bytes_swapped) {
    if (code == "?") {
        return stored_type('b', 1, bytes_swapped);
    }
    for (const std::size_t size : {1U, 2U, 4U, 8U, 16U}) {
        if (!code.empty() && code.substr(1) == std::to_string(size)) {
            return stored_type(code[0], size, bytes_swapped);
        }
    }
    return std::nullopt;
}

StoredType elements_of(const std::string_view descr) {
    const std::string what = "has elements of type " + printable(descr);
    if (descr.empty() || std::string_view("<>|").find(descr[0]) == std::string_view::npos) {
        throw NpyError(what + " without a byte order; save the array with NumPy");
    }
    const char byte_order = descr[0];
    const std::string code(descr.substr(1));
    const auto type = type_of(code, byte_order != native_byte_order);
    if (!type) {
        throw NpyTypeError(what + kind_name(code)
                           + ", which is not supported; save them as booleans, integers of 8 to 64 "
                             "bits, float16 to float64, complex64 or complex128");
    }
    if (type->size != 1 && byte_order == '|') {
        throw NpyError(what + " without a byte order; save the array with NumPy");
    }
    return *type;
}

// The product of `shape`; nothing where it is 2^64 or more. One zero makes it zero.
std::optional<std::uint64_t> product(const Shape& shape) {
    if (!has_elements(shape)) {
        return 0;
    }
    std::uint64_t count = 1;
    for (const std::uint64_t dimension : shape) {
        if (count > std::numeric_limits<std::uint64_t>::max() / dimension) {
            return std::nullopt;
        }
        count *= dimension;
    }
    return count;
}

// Checks that `count` elements of `element_size` bytes are exactly `available` bytes.
void check_data_size(const std::optional<std::uint64_t> count, const std::size_t element_size,
                     const std::uint64_t available) {
    if (!count.has_value() || *count > available / element_size) {
        throw NpyError("has less data than its shape says ("
                       + (count.has_value() ? std::to_string(*count) : "more than 2^64 - 1")
                       + " elements of " + std::to_string(element_size) + " bytes, but "
                       + std::to_string(available) + " bytes); is the file complete?");
    }
    const std::uint64_t surplus = available - *count * element_size;
    if (surplus != 0) {
        throw NpyError("has more data than its shape says (bytes after the array: "
                       + std::to_string(surplus) + "); save one array per file");
    }
}

// Checks that positions in a file of unknown size can be counted.
void check_countable(const std::optional<std::uint64_t> count) {
    constexpr std::uint64_t most = std::uint64_t{1} << 58U;
    if (!count.has_value() || *count > most) {
        throw NpyError("has a shape of more than 2^58 elements");
    }
}

// ---- The bytes up to the dictionary, and its own

constexpr std::string_view magic = "\x93NUMPY";

// NumPy itself reads longer ones only on request.
constexpr std::size_t longest_dictionary = std::size_t{1} << 20U;

class HeaderBytes {
  public:
    explicit HeaderBytes(ByteSource& file) : file_(file) {}

    std::uint64_t position() const { return position_; }

    // Checks that the file begins as .npy files do.
    void take_magic() {
        const std::string found = read(magic.size());
        if (found.empty()) {
            throw NpyError("is empty; an .npy file was expected");
        }
        if (found != magic) {
            throw NpyError("is not an .npy file: it does not begin with \\x93NUMPY");
        }
    }

    std::string take(const std::size_t length, const char* what) {
        const std::uint64_t begin = position_;
        std::string found = read(std::min(length, longest_dictionary + 1));
        if (found.size() < std::min(length, longest_dictionary + 1)) {
            throw NpyError("ends inside its header: " + std::to_string(length) + " bytes of " + what
                           + " expected, " + std::to_string(position_ - begin)
                           + " there; is the file complete?");
        }
        if (length > longest_dictionary) {
            throw NpyError("has a header of " + std::to_string(length)
                           + " bytes; 2^20 are supported");
        }
        return found;
    }

  private:
    std::string read(const std::size_t length) {
        std::string bytes(length, '\0');
        bytes.resize(file_.read(position_, bytes.data(), length));
        position_ += bytes.size();
        return bytes;
    }

    ByteSource& file_;
    std::uint64_t position_ = 0;
};

std::size_t little_endian(const std::string_view bytes) {
    std::size_t value = 0;
    for (std::size_t i = bytes.size(); i-- > 0;) {
        value = value << 8U | static_cast<unsigned char>(bytes[i]);
    }
    return value;
}

} // namespace

NpyHeader read_npy_header(ByteSource& file) {
    HeaderBytes bytes(file);
    bytes.take_magic();
    const std::string version = bytes.take(2, "version");
    const int major = static_cast<unsigned char>(version[0]);
    const int minor = static_cast<unsigned char>(version[1]);
    if (major < 1 || major > 3 || minor != 0) {
        throw NpyError("has format version " + std::to_string(major) + "." + std::to_string(minor)
                       + "; versions 1.0, 2.0 and 3.0 are supported");
    }
    const std::size_t length = little_endian(bytes.take(major == 1 ? 2 : 4, "header length"));
    const std::string text = bytes.take(length, "dictionary");
    const Dictionary dictionary = DictionaryReader(text).read();

    const StoredType type = elements_of(dictionary.descr);
    const std::optional<std::uint64_t> count = product(dictionary.shape);
    const std::optional<std::uint64_t> file_size = file.size();
    if (file_size.has_value()) {
        check_data_size(count, type.size, *file_size - bytes.position());
    } else {
        check_countable(count);
    }
    return {type, dictionary.shape, *count, bytes.position(), dictionary.fortran_order};
}

} // namespace talcmp
