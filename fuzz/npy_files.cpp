// An input is an .npy file as it is, or, where a second one seems to begin in it, two files: what
// is refused is refused with a message of one line, and what is read is compared as the oracle
// would.

#include "checked_call.h"

#include "difference.h"
#include "difference_text.h"
#include "element_type.h"
#include "npy_file.h"
#include "npy_header.h"
#include "trouble.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <sys/mman.h>
#include <unistd.h>

namespace {

using fuzz::fail;
using talcmp::ArraySource;
using talcmp::Difference;
using talcmp::NpyHeader;

void require(const bool holds, const char* what_has_to_hold) {
    if (!holds) {
        fail(std::string("it does not hold that ") + what_has_to_hold);
    }
}

void require_line(const std::string& text) {
    const bool line =
        std::all_of(text.begin(), text.end(), [](const char c) { return c >= ' ' && c <= '~'; });
    if (!line || text.empty()) {
        fail("not one line of printable characters: " + text);
    }
}

// ---- The header

// By division, so that nothing overflows.
bool is_product(std::uint64_t count, const talcmp::Shape& shape) {
    if (std::find(shape.begin(), shape.end(), 0U) != shape.end()) {
        return count == 0;
    }
    for (const std::uint64_t dimension : shape) {
        if (count % dimension != 0) {
            return false;
        }
        count /= dimension;
    }
    return count == 1;
}

// What stands in the dictionary of an accepted file, where "shape" and a '(' stand but once.
std::vector<std::string> written_dimensions(const std::string_view dictionary) {
    const std::size_t begin = dictionary.find('(');
    std::vector<std::string> dimensions;
    bool inside = false;
    for (const char c : dictionary.substr(begin, dictionary.find(')') - begin)) {
        const bool digit = c >= '0' && c <= '9';
        if (digit && !inside) {
            dimensions.emplace_back();
        }
        if (digit && dimensions.back() == "0") {
            dimensions.back() = c;
        } else if (digit) {
            dimensions.back() += c;
        }
        inside = digit;
    }
    return dimensions;
}

void check_against_text(const NpyHeader& header, const std::string_view dictionary) {
    std::vector<std::string> dimensions;
    for (const std::uint64_t dimension : header.shape) {
        dimensions.push_back(std::to_string(dimension));
    }
    require(dimensions == written_dimensions(dictionary), "the shape is the one that is written");
    const talcmp::ElementType& type = talcmp::element_type(header.element_type);
    const std::size_t code = dictionary.find(type.kind + std::to_string(type.size));
    require(code != std::string_view::npos && code > 0, "the type is the one that is written");
    require(header.bytes_swapped == (dictionary[code - 1] == '>' && type.size > 1),
            "the byte order is the one that is written");
}

void check_header(const NpyHeader& header, const std::size_t file_size) {
    require(header.element_type >= 1 && header.element_type <= 12, "the element type is known");
    require(header.shape.size() <= 64, "there are at most 64 dimensions");
    require(is_product(header.element_count, header.shape), "the count is that of the shape");
    require(header.data_offset <= file_size, "the data begins in the file");
    const std::uint64_t bytes = file_size - header.data_offset;
    const std::uint64_t size = oracle::element_size(header.element_type);
    require(bytes % size == 0 && bytes / size == header.element_count,
            "the elements fill the file");
}

struct HeaderOrRefusal {
    std::optional<NpyHeader> header;
    std::string refusal;
};

// Of bytes at the end of a heap block.
HeaderOrRefusal read_header(const std::string_view bytes) {
    const std::unique_ptr<unsigned char[]> block(new unsigned char[bytes.size()]);
    std::copy(bytes.begin(), bytes.end(), block.get());
    try {
        const NpyHeader header = talcmp::read_npy_header(block.get(), bytes.size());
        check_header(header, bytes.size());
        const std::size_t begin = bytes[6] == 1 ? 10 : 12;
        check_against_text(header, bytes.substr(begin, header.data_offset - begin));
        return {header, {}};
    } catch (const talcmp::NpyError& error) {
        require_line(error.what());
        return {std::nullopt, error.what()};
    }
}

// ---- The file

// In memory, and yet with a path.
class MemoryFile {
  public:
    MemoryFile() : descriptor_(::memfd_create("npy", MFD_CLOEXEC)) {
        require(descriptor_ >= 0, "there is a file in memory");
    }
    MemoryFile(const MemoryFile&) = delete;
    MemoryFile& operator=(const MemoryFile&) = delete;
    ~MemoryFile() { ::close(descriptor_); }

    std::string path() const { return "/proc/self/fd/" + std::to_string(descriptor_); }

    void write(const std::string_view bytes) const {
        require(::ftruncate(descriptor_, 0) == 0, "the file is emptied");
        const auto written = ::pwrite(descriptor_, bytes.data(), bytes.size(), 0);
        require(written == static_cast<ssize_t>(bytes.size()), "the file is written");
    }

  private:
    int descriptor_;
};

// The elements are those in the file, each part in the byte order of this machine.
void check_elements(ArraySource& source, const NpyHeader& header, const std::string_view bytes) {
    const talcmp::ElementType& type = talcmp::element_type(header.element_type);
    std::string expected(bytes.substr(header.data_offset));
    if (header.bytes_swapped) {
        for (std::size_t i = 0; i < expected.size(); i += type.part_size) {
            const auto part = expected.begin() + static_cast<std::ptrdiff_t>(i);
            std::reverse(part, part + static_cast<std::ptrdiff_t>(type.part_size));
        }
    }
    const void* const elements = source.elements(0, header.element_count);
    require(std::memcmp(elements, expected.data(), expected.size()) == 0,
            "the elements are those in the file");
    require(reinterpret_cast<std::uintptr_t>(elements) % type.alignment == 0,
            "the elements are aligned");
}

// Nothing where the file is refused.
std::unique_ptr<ArraySource> opened(const MemoryFile& file, const std::string_view bytes) {
    const HeaderOrRefusal read = read_header(bytes);
    file.write(bytes);
    try {
        auto source = std::make_unique<talcmp::NpyFile>(file.path());
        require(read.header.has_value(), "the file is refused as its bytes are");
        require(source->element_type() == read.header->element_type
                    && source->shape() == read.header->shape
                    && source->element_count() == read.header->element_count,
                "the file has the header of its bytes");
        check_elements(*source, *read.header, bytes);
        return source;
    } catch (const talcmp::Trouble& trouble) {
        require(trouble.what() == file.path() + ": " + read.refusal,
                "the file is refused with the words for its bytes");
        return nullptr;
    }
}

// ---- The comparison

// One element, as an array.
oracle::Array at(ArraySource& source, const std::uint64_t position) {
    return {source.element_type(), {}, 1, source.elements(position, 1)};
}

std::optional<Difference> expected_difference(ArraySource& first, ArraySource& second,
                                              const talcmp::Question& question) {
    oracle::State state = fuzz::known_state();
    if (first.shape() != second.shape()) {
        return Difference{Difference::Kind::shape, 0};
    }
    if (question.strict_type && first.element_type() != second.element_type()) {
        return Difference{Difference::Kind::type, 0};
    }
    for (std::uint64_t i = 0; i < first.element_count(); ++i) {
        if (!oracle::same(state, question.tolerance, true, at(first, i), at(second, i))) {
            return Difference{Difference::Kind::element, i};
        }
    }
    return std::nullopt;
}

bool agree(const std::optional<Difference>& one, const std::optional<Difference>& other) {
    return one.has_value() == other.has_value()
           && (!one || (one->kind == other->kind && one->position == other->position));
}

// Moves behind `expected`.
void pass(const char*& text, const std::string_view expected) {
    require(std::string_view(text).substr(0, expected.size()) == expected,
            "the difference is written as it should be");
    text += expected.size();
}

void pass_index(const char*& text, std::uint64_t position, const talcmp::Shape& shape) {
    std::uint64_t read = 0;
    pass(text, "[");
    for (std::size_t i = 0; i < shape.size(); ++i) {
        pass(text, i == 0 ? "" : ", ");
        char* end = nullptr;
        const std::uint64_t index = std::strtoull(text, &end, 10);
        require(end != text && index < shape[i], "the index is in the array");
        text = end;
        read = read * shape[i] + index;
    }
    pass(text, "]: ");
    require(read == position, "the index is that of the position");
}

template <typename T, typename Read>
void pass_as(const char*& text, const void* part, const Read& read) {
    T value = {};
    std::memcpy(&value, part, sizeof value);
    char* end = nullptr;
    const T read_back = read(text, &end);
    require(end != text, "there is a number");
    text = end;
    const bool both_nan =
        std::isnan(static_cast<double>(value)) && std::isnan(static_cast<double>(read_back));
    require((value == read_back
             && std::signbit(static_cast<double>(value))
                    == std::signbit(static_cast<double>(read_back)))
                || both_nan,
            "the digits read back as the same value");
}

void pass_part(const char*& text, const talcmp::ElementType& type, const unsigned char* part) {
    if (type.kind == 'i' || type.kind == 'u') {
        std::int64_t value = 0;
        const bool negative = type.kind == 'i' && (part[type.part_size - 1] & 0x80U) != 0;
        std::memset(&value, negative ? 0xFF : 0, sizeof value);
        std::memcpy(&value, part, type.part_size);
        pass_as<std::int64_t>(text, &value, [&](const char* digits, char** end) {
            return type.kind == 'i' ? std::strtoll(digits, end, 10)
                                    : static_cast<std::int64_t>(std::strtoull(digits, end, 10));
        });
    } else if (type.part_size == sizeof(float)) {
        pass_as<float>(text, part, std::strtof);
    } else {
        pass_as<double>(text, part, std::strtod);
    }
}

void pass_element(const char*& text, ArraySource& source, const std::uint64_t position) {
    const talcmp::ElementType& type = talcmp::element_type(source.element_type());
    const auto* const element = static_cast<const unsigned char*>(source.elements(position, 1));
    pass_part(text, type, element);
    if (type.kind == 'c') {
        pass(text, *text == '-' ? "" : "+");
        pass_part(text, type, element + type.part_size);
        pass(text, "j");
    }
}

void check_text(const std::string& line, const Difference& difference, ArraySource& first,
                ArraySource& second) {
    require_line(line);
    const char* text = line.c_str();
    if (difference.kind != Difference::Kind::element) {
        pass(text, difference.kind == Difference::Kind::shape ? "shape (" : "type ");
        return;
    }
    pass_index(text, difference.position, first.shape());
    pass_element(text, first, difference.position);
    pass(text, " and ");
    pass_element(text, second, difference.position);
    require(*text == '\0', "nothing follows the difference");
}

void check_question(ArraySource& first, ArraySource& second, const talcmp::Question& question) {
    const auto expected = expected_difference(first, second, question);
    fuzz::known_state();
    const auto difference = talcmp::first_difference(first, second, question);
    require(agree(difference, expected), "the first difference is the one that is expected");
    if (difference) {
        check_text(talcmp::difference_text(*difference, first, second), *difference, first, second);
    }
}

void compare(ArraySource& first, ArraySource& second) {
    for (const double tolerance : {0.0, 3.0, 23.5, 52.5}) {
        check_question(first, second, {tolerance, false});
    }
    check_question(first, second, {30, true});
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, const std::size_t size) {
    static const MemoryFile first_file;
    static const MemoryFile second_file;
    const std::string_view input(reinterpret_cast<const char*>(bytes), size);
    const std::size_t second_begins = input.find("\x93NUMPY", 1);
    if (second_begins != std::string_view::npos) {
        read_header(input);
    }
    const auto first = opened(first_file, input.substr(0, second_begins));
    if (!first) {
        return 0;
    }
    compare(*first, *first);
    if (second_begins != std::string_view::npos) {
        const auto second = opened(second_file, input.substr(second_begins));
        if (second) {
            compare(*first, *second);
            compare(*second, *first);
        }
    }
    return 0;
}
