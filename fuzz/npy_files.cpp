// An input is an .npy file as it is, or, where a second one seems to begin in it, two files: a
// refusal has a message of one line, and what is read is compared as the oracle would compare it.
// An input that begins like a file of another format is read as one.

#include "checked_call.h"
#include "requirements.h"

#include "array_file.h"
#include "comparison.h"
#include "element_type.h"
#include "npy_header.h"
#include "support/memory_bytes.h"
#include "trouble.h"
#include "wording.h"

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

using fuzz::require;
using fuzz::require_line;
using talcmp::ArraySource;
using talcmp::Difference;
using talcmp::NpyHeader;

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

// What the dictionary of an accepted file says, in which "shape" and a '(' occur only once.
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
    const talcmp::StoredType& type = header.type;
    const std::string kind(1, type.name == "bool" ? 'b' : type.type->kind);
    const std::size_t long_code = dictionary.find(kind + std::to_string(type.size));
    const std::size_t code =
        long_code != std::string_view::npos || kind != "b" ? long_code : dictionary.find('?');
    require(code != std::string_view::npos && code > 0, "the type is the one that is written");
    require(type.bytes_swapped == (dictionary[code - 1] == '>' && type.size > 1),
            "the byte order is the one that is written");
    require(header.fortran_order == (dictionary.find("True") != std::string_view::npos),
            "the order is the one that is written");
}

void check_header(const NpyHeader& header, const std::size_t file_size) {
    require(header.type.type != nullptr, "the element type is known");
    require(header.shape.size() <= 64, "there are at most 64 dimensions");
    require(is_product(header.element_count, header.shape), "the count is that of the shape");
    require(header.data_offset <= file_size, "the data begins in the file");
    const std::uint64_t bytes = file_size - header.data_offset;
    const std::uint64_t size = header.type.name == "bool" ? 1
                               : header.type.name == "float16"
                                   ? 2
                                   : oracle::element_size(header.type.type->id);
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
        MemoryBytes file({reinterpret_cast<const char*>(block.get()), bytes.size()});
        const NpyHeader header = talcmp::read_npy_header(file);
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

// In memory, but with a path.
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

// An array, and its elements as they were read from it.
struct OpenedArray {
    std::unique_ptr<ArraySource> source;
    std::vector<std::max_align_t> elements;
};

const unsigned char* element(const OpenedArray& array, const std::uint64_t position) {
    const std::size_t size = array.source->type().size;
    return reinterpret_cast<const unsigned char*>(array.elements.data()) + position * size;
}

// One element, as an array.
oracle::Array at(const OpenedArray& array, const std::uint64_t position) {
    return {array.source->type().id, {}, 1, element(array, position)};
}

// The position of the element that is at `order` in row-major order.
std::uint64_t position_of(const OpenedArray& array, const std::uint64_t order) {
    if (!array.source->fortran_order()) {
        return order;
    }
    const talcmp::Shape& shape = array.source->shape();
    std::uint64_t rest = order;
    std::uint64_t position = 0;
    std::uint64_t stride = talcmp::element_count(*array.source);
    for (std::size_t axis = shape.size(); axis-- > 0;) {
        stride /= shape[axis];
        position += rest % shape[axis] * stride;
        rest /= shape[axis];
    }
    return position;
}

// What elements in the byte order of this machine are compared as: booleans as 0 and 1, halves as
// singles.
std::string as_compared(const std::string& type, std::string elements) {
    if (type == "bool") {
        std::replace_if(
            elements.begin(), elements.end(), [](const char byte) { return byte != 0; }, '\1');
    }
    if (type != "float16") {
        return elements;
    }
    std::string singles;
    for (std::size_t i = 0; i < elements.size(); i += 2) {
        std::uint16_t half = 0;
        std::memcpy(&half, &elements[i], sizeof half);
        const auto exponent = static_cast<int>(half >> 10U & 0x1FU);
        const auto significand = static_cast<float>(half & 0x3FFU);
        float single = exponent == 0 ? std::ldexp(significand, -24)
                                     : std::ldexp(significand + 1024, exponent - 25);
        std::uint32_t bits = 0x7F800000U | (half & 0x3FFU) << 13U; // an infinity or a NaN
        if (exponent != 0x1F) {
            std::memcpy(&bits, &single, sizeof bits);
        }
        bits |= (half & 0x8000U) << 16U;
        singles.append(reinterpret_cast<const char*>(&bits), sizeof bits);
    }
    return singles;
}

// The elements are those in the file, each part in the byte order of this machine.
void check_elements(const OpenedArray& array, const NpyHeader& header,
                    const std::string_view bytes) {
    const std::size_t part_size = std::min(header.type.type->part_size, header.type.size);
    std::string expected(bytes.substr(static_cast<std::size_t>(header.data_offset)));
    if (header.type.bytes_swapped) {
        for (std::size_t i = 0; i < expected.size(); i += part_size) {
            const auto part = expected.begin() + static_cast<std::ptrdiff_t>(i);
            std::reverse(part, part + static_cast<std::ptrdiff_t>(part_size));
        }
    }
    expected = as_compared(header.type.name, std::move(expected));
    require(std::memcmp(array.elements.data(), expected.data(), expected.size()) == 0,
            "the elements are those in the file");
}

OpenedArray read_all(const MemoryFile& file) {
    OpenedArray array;
    array.source = talcmp::open_array_file(file.path())->open("");
    const std::uint64_t count = talcmp::element_count(*array.source);
    const std::size_t size = array.source->type().size;
    array.elements.resize(static_cast<std::size_t>(count) * size / sizeof(std::max_align_t) + 1);
    array.source->read(0, count, array.elements.data());
    return array;
}

// An archive is read to its end, or refused.
void read_archive(const MemoryFile& file) {
    try {
        const auto archive = talcmp::open_array_file(file.path());
        for (const std::string& member : archive->members()) {
            const auto source = archive->open(member);
            const std::size_t size = source->type().size;
            std::vector<unsigned char> element(size);
            const std::uint64_t count = talcmp::element_count(*source);
            for (std::uint64_t i = 0; i < std::min<std::uint64_t>(count, 1000); ++i) {
                source->read(i, 1, element.data());
            }
        }
    } catch (const talcmp::Trouble& trouble) {
        require(*trouble.what() != '\0', "a refusal says something");
    }
}

// Archives, netCDF files, and those that are compressed as a whole.
bool is_of_other_format(const std::string_view bytes) {
    constexpr std::string_view beginnings[] = {"PK",  "CDF",         "\x1F\x8B",
                                               "BZh", "\xFD\x37zXZ", "\x28\xB5\x2F\xFD"};
    return std::any_of(std::begin(beginnings), std::end(beginnings),
                       [bytes](const std::string_view beginning) {
                           return bytes.substr(0, beginning.size()) == beginning;
                       });
}

// Nothing if the file is refused.
std::optional<OpenedArray> opened(const MemoryFile& file, const std::string_view bytes) {
    file.write(bytes);
    if (bytes.find("\x89HDF") != std::string_view::npos) {
        return std::nullopt; // what the HDF5 library makes of it is not ours
    }
    if (is_of_other_format(bytes)) {
        read_archive(file);
        return std::nullopt;
    }
    const HeaderOrRefusal read = read_header(bytes);
    try {
        OpenedArray array = read_all(file);
        require(read.header.has_value(), "the file is refused as its bytes are");
        require(&array.source->type() == read.header->type.type
                    && array.source->shape() == read.header->shape
                    && array.source->fortran_order() == read.header->fortran_order,
                "the file has the header of its bytes");
        check_elements(array, *read.header, bytes);
        return array;
    } catch (const talcmp::Trouble& trouble) {
        require(trouble.what() == file.path() + ": " + read.refusal,
                "the file is refused with the words for its bytes");
        return std::nullopt;
    }
}

// ---- The comparison

oracle::State remembering(const double tolerance) {
    oracle::State state;
    oracle::compare_doubles(state, tolerance, 1, 1 + 0x1p-52);
    oracle::compare_singles(state, static_cast<float>(tolerance), 1, 1 + 0x1p-23F);
    return state;
}

struct Expected {
    Difference difference = Difference::none;
    std::uint64_t order = 0; // of the first pair that differs
    std::uint64_t differing = 0;
};

Expected expected_answer(const OpenedArray& first, const OpenedArray& second,
                         const talcmp::Question& question) {
    if (first.source->shape() != second.source->shape()) {
        return {Difference::shape, 0, 0};
    }
    Expected expected;
    for (std::uint64_t i = talcmp::element_count(*first.source); i-- > 0;) {
        oracle::State state = remembering(question.tolerance);
        if (!oracle::same(state, question.tolerance, true, at(first, position_of(first, i)),
                          at(second, position_of(second, i)))) {
            expected = {Difference::elements, i, expected.differing + 1};
        }
    }
    if (question.strict_type && &first.source->type() != &second.source->type()) {
        expected.difference = Difference::type;
    }
    return expected;
}

// Moves past `expected`.
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

void pass_element(const char*& text, const OpenedArray& array, const std::uint64_t order) {
    const talcmp::ElementType& type = array.source->type();
    const unsigned char* const bytes = element(array, position_of(array, order));
    pass_part(text, type, bytes);
    if (type.kind == 'c') {
        pass(text, *text == '-' ? "" : "+");
        pass_part(text, type, bytes + type.part_size);
        pass(text, "j");
    }
}

void check_text(const std::string& line, const Expected& expected, const OpenedArray& first,
                const OpenedArray& second) {
    require_line(line);
    const char* text = line.c_str();
    if (expected.difference != Difference::elements) {
        pass(text, expected.difference == Difference::shape ? "shape (" : "type ");
        return;
    }
    pass_index(text, expected.order, first.source->shape());
    pass_element(text, first, expected.order);
    pass(text, " and ");
    pass_element(text, second, expected.order);
    pass(text, " (");
}

talcmp::NamedArray named(const MemoryFile& file) {
    return {file.path(), talcmp::open_array_file(file.path())->open("")};
}

struct Operand {
    const MemoryFile& file;
    const OpenedArray& array;
};

void check_question(const Operand& first, const Operand& second, const talcmp::Question& question) {
    const Expected expected = expected_answer(first.array, second.array, question);
    talcmp::AllBoxes boxes;
    talcmp::NoProgress progress;
    const auto comparison =
        talcmp::compare(named(first.file), named(second.file), {}, question, boxes, progress);
    require(comparison.difference == expected.difference, "the arrays differ as is expected");
    if (comparison.difference != Difference::none) {
        check_text(talcmp::difference_text(comparison), expected, first.array, second.array);
    }
    if (comparison.report) {
        require(comparison.report->totals.differing == expected.differing,
                "as many pairs differ as is expected");
    }
}

void compare(const Operand& first, const Operand& second) {
    talcmp::Question question;
    question.threads = 1;
    for (const double tolerance : {0.0, 3.0, 23.5, 52.5}) {
        question.tolerance = tolerance;
        question.report = !question.report;
        check_question(first, second, question);
    }
    question.tolerance = 30;
    question.strict_type = true;
    check_question(first, second, question);
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
    compare({first_file, *first}, {first_file, *first});
    if (second_begins != std::string_view::npos) {
        const auto second = opened(second_file, input.substr(second_begins));
        if (second) {
            compare({first_file, *first}, {second_file, *second});
            compare({second_file, *second}, {first_file, *first});
        }
    }
    return 0;
}
