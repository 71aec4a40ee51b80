// An input is a netCDF file as it is: a refusal has a message of one line, and what is read is what
// a plain decoder of accepted files finds. Variables that are refused are text or lack elements.

#include "requirements.h"

#include "netcdf_file.h"
#include "support/memory_bytes.h"
#include "trouble.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace {

using fuzz::require;
using talcmp::ArraySource;

// One line that names the file. Names in it may be of any characters that a message may show.
void require_message(const talcmp::Trouble& refusal) {
    const std::string text = refusal.what();
    require(text.substr(0, 5) == "input", "a refusal names the file");
    require(std::none_of(text.begin(), text.end(),
                         [](const char c) { return (c >= 0 && c < ' ') || c == 0x7F; }),
            "a refusal has no control characters");
}

// ---- A plain decoder

struct Variable {
    std::vector<std::uint64_t> shape;
    std::uint64_t type = 0;
    std::uint64_t begin = 0;
    bool in_records = false;
};

constexpr std::uint64_t type_char = 2;

std::uint64_t size_of(const std::uint64_t type) {
    return std::vector<std::uint64_t>{0, 1, 1, 2, 4, 4, 8, 1, 2, 4, 8, 8}.at(type);
}

std::string name_of(const std::uint64_t type) {
    return std::vector<std::string>{"",        "int8",  "text",   "int16",  "int32", "float32",
                                    "float64", "uint8", "uint16", "uint32", "int64", "uint64"}
        .at(type);
}

// Of a file that has been accepted; its members throw where it should not have been.
class PlainDecoder {
  public:
    explicit PlainDecoder(const std::string_view bytes)
        : bytes_(bytes), version_(number_at(0, 4) & 0xFFU) {
        const std::uint64_t count = size();
        read_dimensions();
        skip_attributes();
        read_variables();
        const bool unknown = count == (version_ == 5 ? ~std::uint64_t{0} : 0xFFFFFFFFU);
        record_count_ = unknown ? counted_records() : count;
        for (auto& [name, variable] : variables_) {
            if (variable.in_records) {
                variable.shape[0] = record_count_;
            }
        }
    }

    const std::map<std::string, Variable>& variables() const { return variables_; }

    // Not rounded where it is in the file.
    long double end_of(const Variable& variable) const {
        const auto records = static_cast<long double>(variable.in_records ? record_count_ : 1);
        return static_cast<long double>(variable.begin) + (records - 1) * record_bytes()
               + piece_bytes(variable);
    }

    // The bits of an element.
    std::uint64_t element(const Variable& variable, const std::uint64_t position) const {
        const std::uint64_t size = size_of(variable.type);
        const auto piece = static_cast<std::uint64_t>(piece_bytes(variable)) / size;
        const std::uint64_t record = position / piece;
        const std::uint64_t skipped =
            record == 0 ? 0 : record * static_cast<std::uint64_t>(record_bytes());
        return number_at(variable.begin + skipped + position % piece * size, size);
    }

  private:
    std::uint64_t number_at(const std::uint64_t place, const std::uint64_t width) const {
        std::uint64_t value = 0;
        for (std::uint64_t i = 0; i < width; ++i) {
            value = value * 256 + static_cast<unsigned char>(bytes_.at(place + i));
        }
        return value;
    }

    std::uint64_t number(const std::uint64_t width) {
        place_ += width;
        return number_at(place_ - width, width);
    }

    std::uint64_t size() { return number(version_ == 5 ? 8 : 4); }

    std::string padded(const std::uint64_t length) {
        std::string text(bytes_.substr(place_, length));
        require(text.size() == length, "the text is in the file");
        place_ += (length + 3) / 4 * 4;
        return text;
    }

    std::uint64_t list() {
        number(4);
        return size();
    }

    void read_dimensions() {
        for (std::uint64_t left = list(); left > 0; --left) {
            padded(size());
            dimensions_.push_back(size());
        }
    }

    void skip_attributes() {
        for (std::uint64_t left = list(); left > 0; --left) {
            padded(size());
            const std::uint64_t type = number(4);
            padded(size() * size_of(type));
        }
    }

    void read_variables() {
        for (std::uint64_t left = list(); left > 0; --left) {
            Variable variable;
            const std::string name = padded(size());
            for (std::uint64_t axes = size(); axes > 0; --axes) {
                variable.shape.push_back(dimensions_.at(size()));
            }
            variable.in_records = !variable.shape.empty() && variable.shape[0] == 0;
            skip_attributes();
            variable.type = number(4);
            size();
            variable.begin = number(version_ == 1 ? 4 : 8);
            require(variables_.emplace(name, variable).second, "each variable has its own name");
        }
    }

    static long double piece_bytes(const Variable& variable) {
        auto bytes = static_cast<long double>(size_of(variable.type));
        for (std::size_t axis = variable.in_records ? 1 : 0; axis < variable.shape.size(); ++axis) {
            bytes *= static_cast<long double>(variable.shape[axis]);
        }
        return bytes;
    }

    long double record_bytes() const {
        long double bytes = 0;
        long double padded_bytes = 0;
        int pieces = 0;
        for (const auto& [name, variable] : variables_) {
            if (variable.in_records) {
                const long double piece = piece_bytes(variable);
                bytes += piece;
                padded_bytes += std::ceil(piece / 4) * 4;
                ++pieces;
            }
        }
        return pieces == 1 ? bytes : padded_bytes;
    }

    // One after another, as long as all pieces of the next are there.
    std::uint64_t counted_records() {
        record_count_ = 0;
        const auto is_there = [this](const auto& named) {
            return !named.second.in_records
                   || end_of(named.second) <= static_cast<long double>(bytes_.size());
        };
        do {
            ++record_count_;
        } while (record_bytes() > 0 && std::all_of(variables_.begin(), variables_.end(), is_there));
        return record_count_ - 1;
    }

    std::string_view bytes_;
    std::uint64_t version_;
    std::uint64_t place_ = 4;
    std::uint64_t record_count_ = 0;
    std::vector<std::uint64_t> dimensions_;
    std::map<std::string, Variable> variables_;
};

// ---- What talcmp reads

// The bits of the element at `position` of those that begin at `elements`.
std::uint64_t bits(const std::vector<unsigned char>& elements, const std::uint64_t position,
                   const std::size_t size) {
    std::uint64_t value = 0;
    for (std::size_t i = 0; i < size; ++i) {
        const std::size_t byte = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__ ? size - 1 - i : i;
        value = value * 256 + elements.at(position * size + byte);
    }
    return value;
}

void check_stretch(ArraySource& array, const std::uint64_t first, const std::uint64_t count,
                   const PlainDecoder& decoder, const Variable& variable) {
    const std::size_t size = array.type().size;
    std::vector<unsigned char> elements(count * size);
    array.read(first, count, elements.data());
    for (std::uint64_t i = 0; i < count; ++i) {
        require(bits(elements, i, size) == decoder.element(variable, first + i),
                "each element is the one in the file");
    }
}

void check_array(ArraySource& array, const PlainDecoder& decoder, const Variable& variable,
                 const std::size_t file_size) {
    require(array.shape() == variable.shape, "the shape is the one in the file");
    require(array.type_name() == name_of(variable.type), "the type is the one in the file");
    require(!array.fortran_order() && array.random_access(), "elements can be read in any order");
    const std::uint64_t count = talcmp::element_count(array);
    require(count <= file_size / array.type().size, "all elements fit in the file");
    check_stretch(array, 0, count, decoder, variable);
    for (const std::uint64_t first : {count / 3, count - count / 4}) {
        check_stretch(array, first, (count - first) / 2, decoder, variable);
    }
}

void check_variable(talcmp::NetcdfFile& file, const std::string& name, const PlainDecoder& decoder,
                    const std::size_t file_size) {
    const Variable& variable = decoder.variables().at(name);
    try {
        check_array(*file.open(name), decoder, variable, file_size);
        require(variable.type != type_char, "text is no numbers");
    } catch (const talcmp::NotNumbers& refusal) {
        require_message(refusal);
        require(variable.type == type_char, "only text is no numbers");
    } catch (const talcmp::Trouble& refusal) {
        require_message(refusal);
        require(decoder.end_of(variable) > static_cast<long double>(file_size),
                "a variable that is refused lacks elements");
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, const std::size_t size) {
    // At the end of a heap block.
    const std::unique_ptr<char[]> block(new char[size]);
    std::copy_n(bytes, size, block.get());
    const std::string_view input(block.get(), size);
    try {
        talcmp::NetcdfFile file("input", std::make_shared<MemoryBytes>(input));
        const PlainDecoder decoder(input);
        const auto members = file.members();
        require(members.size() == decoder.variables().size(), "each variable is a member");
        for (const std::string& name : members) {
            check_variable(file, name, decoder, size);
        }
    } catch (const talcmp::Trouble& refusal) {
        require_message(refusal);
    }
    return 0;
}
