#include "hdf5_type.h"

#include <algorithm>
#include <array>
#include <cstdint>
#include <optional>
#include <utility>

namespace talcmp::hdf5 {
namespace {

constexpr std::size_t bits_of_byte = 8;

Handle copy_of(const hid_t type) {
    return Handle(::H5Tcopy(type));
}

bool is_swapped(const hid_t type) {
    return ::H5Tget_order(type) != ::H5Tget_order(H5T_NATIVE_INT);
}

// As the elements are in the file.
std::optional<DatasetType> as_in_file(const hid_t type, const char kind, const bool swapped) {
    auto stored = stored_type(kind, ::H5Tget_size(type), swapped);
    if (!stored) {
        return std::nullopt;
    }
    return DatasetType{*std::move(stored), copy_of(type), true};
}

// As the library converts them.
std::optional<DatasetType> converted(Handle memory, const char kind) {
    auto stored = stored_type(kind, ::H5Tget_size(memory.id()), is_swapped(memory.id()));
    if (!stored) {
        return std::nullopt;
    }
    return DatasetType{*std::move(stored), std::move(memory), false};
}

// ---- Integers

bool is_all_bits(const hid_t type) {
    const H5T_order_t order = ::H5Tget_order(type);
    return ::H5Tget_precision(type) == bits_of_byte * ::H5Tget_size(type)
           && (order == H5T_ORDER_LE || order == H5T_ORDER_BE);
}

// The smallest of the types, from one byte to eight, that has as many bits.
hid_t smallest_with(const std::size_t bits, const std::array<hid_t, 4>& types) {
    return *std::find_if(types.begin(), types.end(),
                         [bits](const hid_t type) { return ::H5Tget_precision(type) >= bits; });
}

std::array<hid_t, 4> types_in_memory(const hid_t type) {
    if (::H5Tget_class(type) == H5T_BITFIELD) {
        return {H5T_NATIVE_B8, H5T_NATIVE_B16, H5T_NATIVE_B32, H5T_NATIVE_B64};
    }
    if (::H5Tget_sign(type) == H5T_SGN_NONE) {
        return {H5T_NATIVE_UINT8, H5T_NATIVE_UINT16, H5T_NATIVE_UINT32, H5T_NATIVE_UINT64};
    }
    return {H5T_NATIVE_INT8, H5T_NATIVE_INT16, H5T_NATIVE_INT32, H5T_NATIVE_INT64};
}

std::optional<DatasetType> integer_type(const hid_t type) {
    const bool is_signed =
        ::H5Tget_class(type) == H5T_INTEGER && ::H5Tget_sign(type) != H5T_SGN_NONE;
    const char kind = is_signed ? 'i' : 'u';
    if (is_all_bits(type)) {
        if (auto found = as_in_file(type, kind, is_swapped(type))) {
            return found;
        }
    }
    constexpr std::size_t most_bits = 64;
    const std::size_t bits = ::H5Tget_precision(type);
    if (bits == 0 || bits > most_bits) {
        return std::nullopt;
    }
    // In the byte order of the file: where only that and the precision differ, the library forgets
    // the sign.
    Handle memory = copy_of(smallest_with(bits, types_in_memory(type)));
    ::H5Tset_order(memory.id(), ::H5Tget_order(type));
    return converted(std::move(memory), kind);
}

// ---- Reals and complex numbers

// Half precision, for which the library has no type of its own.
Handle half_type(const hid_t single) {
    Handle half = copy_of(single);
    ::H5Tset_fields(half.id(), 15, 10, 5, 0, 10);
    ::H5Tset_size(half.id(), 2);
    ::H5Tset_ebias(half.id(), 15);
    return half;
}

bool is_ieee(const hid_t type) {
    const std::array<Handle, 2> halves = {half_type(H5T_IEEE_F32LE), half_type(H5T_IEEE_F32BE)};
    const std::array<hid_t, 6> formats = {halves[0].id(), halves[1].id(), H5T_IEEE_F32LE,
                                          H5T_IEEE_F32BE, H5T_IEEE_F64LE, H5T_IEEE_F64BE};
    return std::any_of(formats.begin(), formats.end(),
                       [type](const hid_t format) { return ::H5Tequal(type, format) > 0; });
}

std::optional<DatasetType> real_type(const hid_t type) {
    return is_ieee(type) ? as_in_file(type, 'f', is_swapped(type)) : std::nullopt;
}

struct PartNames {
    const char* real;
    const char* imaginary;
};

constexpr PartNames part_names[] = {{"r", "i"}, {"real", "imag"}};

Handle complex_in_memory(const hid_t part, const PartNames& names) {
    const std::size_t size = ::H5Tget_size(part);
    Handle memory(::H5Tcreate(H5T_COMPOUND, 2 * size));
    ::H5Tinsert(memory.id(), names.real, 0, part);
    ::H5Tinsert(memory.id(), names.imaginary, size, part);
    return memory;
}

struct Part {
    Handle type;
    std::size_t offset; // in the element, in bytes
    std::size_t size;
};

// Nothing if there is no such part of IEEE format within the element.
std::optional<Part> part_of(const hid_t type, const char* const name) {
    const int index = ::H5Tget_member_index(type, name);
    if (index < 0) {
        return std::nullopt;
    }
    const auto member = static_cast<unsigned>(index);
    Handle part(::H5Tget_member_type(type, member));
    const std::size_t offset = ::H5Tget_member_offset(type, member);
    const std::size_t size = ::H5Tget_size(part.id());
    const std::size_t whole = ::H5Tget_size(type);
    if (!is_ieee(part.id()) || offset > whole || size > whole - offset) {
        return std::nullopt;
    }
    return Part{std::move(part), offset, size};
}

std::optional<DatasetType> complex_type(const hid_t type, const PartNames& names) {
    const auto real = part_of(type, names.real);
    const auto imaginary = part_of(type, names.imaginary);
    if (::H5Tget_nmembers(type) != 2 || !real || !imaginary || real->size != imaginary->size) {
        return std::nullopt;
    }
    // The library refuses parts that overlap, so the real one is at the beginning.
    const bool is_packed = imaginary->offset == real->size && ::H5Tget_size(type) == 2 * real->size
                           && ::H5Tequal(real->type.id(), imaginary->type.id()) > 0;
    if (is_packed) {
        return as_in_file(type, 'c', is_swapped(real->type.id()));
    }
    const hid_t part = real->size == sizeof(float) ? H5T_NATIVE_FLOAT : H5T_NATIVE_DOUBLE;
    return converted(complex_in_memory(part, names), 'c');
}

std::optional<DatasetType> complex_type(const hid_t type) {
    for (const PartNames& names : part_names) {
        if (auto found = complex_type(type, names)) {
            return found;
        }
    }
    return std::nullopt;
}

// ---- Booleans

// Whether the enumeration gives the name to the value 0 or 1.
bool names_value(const hid_t type, const char* const name, const unsigned char value) {
    std::array<unsigned char, sizeof(std::uint64_t)> bytes = {};
    const std::size_t size = ::H5Tget_size(type);
    if (size > bytes.size() || ::H5Tenum_valueof(type, name, bytes.data()) < 0) {
        return false;
    }
    std::array<unsigned char, sizeof(std::uint64_t)> expected = {};
    expected[::H5Tget_order(type) == H5T_ORDER_BE ? size - 1 : 0] = value;
    return bytes == expected;
}

Handle boolean_in_memory() {
    Handle memory(::H5Tenum_create(H5T_NATIVE_INT8));
    for (const std::pair<const char*, std::int8_t> each : {std::pair("FALSE", 0), {"TRUE", 1}}) {
        ::H5Tenum_insert(memory.id(), each.first, &each.second);
    }
    return memory;
}

std::optional<DatasetType> boolean_type(const hid_t type) {
    if (::H5Tget_nmembers(type) != 2 || !names_value(type, "FALSE", 0)
        || !names_value(type, "TRUE", 1)) {
        return std::nullopt;
    }
    return ::H5Tget_size(type) == 1 ? as_in_file(type, 'b', false)
                                    : converted(boolean_in_memory(), 'b');
}

// ---- All types

std::optional<DatasetType> supported_type(const hid_t type) {
    switch (::H5Tget_class(type)) {
    case H5T_INTEGER:
    case H5T_BITFIELD:
        return integer_type(type);
    case H5T_FLOAT:
        return real_type(type);
    case H5T_COMPOUND:
        return complex_type(type);
    case H5T_ENUM:
        return boolean_type(type);
    default:
        return std::nullopt;
    }
}

std::string number_name(const hid_t type, const char* const kind) {
    return std::string(kind) + " of " + std::to_string(::H5Tget_precision(type)) + " bits";
}

// What elements of a type that is not supported are.
std::string elements_named(const hid_t type) {
    switch (::H5Tget_class(type)) {
    case H5T_INTEGER:
        return number_name(type, "integers");
    case H5T_BITFIELD:
        return number_name(type, "bit fields");
    case H5T_FLOAT:
        return number_name(type, "floating-point numbers");
    case H5T_STRING:
        return "texts";
    case H5T_OPAQUE:
        return "raw bytes";
    case H5T_COMPOUND:
        return "structures";
    case H5T_REFERENCE:
        return "references";
    case H5T_ENUM:
        return "names of an enumeration";
    case H5T_VLEN:
        return "lists of varying length";
    case H5T_ARRAY:
        return "arrays";
    case H5T_TIME:
        return "times";
    default:
        return "something unknown";
    }
}

} // namespace

DatasetType type_of(const hid_t dataset, const std::string& name) {
    const LibraryUse use(name);
    const Handle type(checked(::H5Dget_type(dataset), name, "has elements of an unreadable type"));
    auto found = supported_type(type.id());
    if (!found) {
        throw NotNumbers(name, "has elements that are " + elements_named(type.id())
                                   + ", which are not supported; booleans, integers of 8 to 64 "
                                     "bits, float16 to float64, complex64 and complex128 are");
    }
    return *std::move(found);
}

} // namespace talcmp::hdf5
