// HDF5 files: what is in them, which types, how they are read, and what is said of broken ones.

#include "hdf5_file.h"

#include "array_file.h"

#include "support/hdf5_writer.h"
#include "support/named_cases.h"
#include "support/random_slabs.h"
#include "support/temporary_folder.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <csignal>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iostream>
#include <iterator>
#include <memory>
#include <numeric>
#include <random>
#include <string>
#include <thread>
#include <vector>

namespace {

using namespace hdf5_test;
using talcmp::ArraySource;
using talcmp::Shape;
using talcmp::Slab;
using Names = std::vector<std::string>;
using Source = std::unique_ptr<ArraySource>;

std::vector<int> numbers(const std::size_t count) {
    std::vector<int> values(count);
    std::iota(values.begin(), values.end(), 1);
    return values;
}

// All elements, as bytes.
std::string contents(ArraySource& source) {
    const std::uint64_t count = element_count(source);
    std::string bytes(static_cast<std::size_t>(count) * source.type().size, '\0');
    if (source.block().empty()) {
        source.read(0, count, bytes.data());
        return bytes;
    }
    Slab all;
    for (const std::uint64_t extent : source.shape()) {
        all.axes.push_back({0, extent, 1});
    }
    source.read_slab(all, bytes.data());
    return bytes;
}

template <typename T>
std::string bytes_of(const std::vector<T>& values) {
    std::string bytes(values.size() * sizeof(T), '\0');
    std::memcpy(bytes.data(), values.data(), bytes.size());
    return bytes;
}

class Hdf5Files : public testing::Test {
  protected:
    std::string path(const std::string& name = "a.h5") const { return folder_.path_of(name); }

    Source open(const std::string& member, const std::string& name = "a.h5") const {
        return talcmp::open_array_file(path(name))->open(member);
    }

    // Why the array cannot be opened or read, without the folder of the file.
    std::string trouble(const std::string& member) const {
        return without_folder(thrown_message<talcmp::Trouble>([&] { contents(*open(member)); }));
    }

    std::string not_numbers(const std::string& member) const {
        return without_folder(thrown_message<talcmp::NotNumbers>([&] { open(member); }));
    }

    std::string without_folder(std::string text) const {
        const std::string folder = folder_.path_of("");
        for (auto at = text.find(folder); at != std::string::npos; at = text.find(folder)) {
            text.erase(at, folder.size());
        }
        return text;
    }

    void change(const std::function<void(std::string&)>& edit) const {
        std::ifstream in(path(), std::ios::binary);
        std::string bytes((std::istreambuf_iterator<char>(in)), {});
        edit(bytes);
        folder_.write("a.h5", bytes);
    }

  private:
    TemporaryFolder folder_;
};

// ---- Members

class Hdf5Members : public Hdf5Files {
  protected:
    Names members(const std::string& name = "a.h5") const {
        return talcmp::open_array_file(path(name))->members();
    }
};

TEST_F(Hdf5Members, AreArraysInAllGroups) {
    {
        Writer file(path());
        file.group("g");
        file.group("g/h");
        file.group("empty");
        for (const char* name : {"x", "g/y", "g/h/z", "\xC3\xA9", "Z", "g a/b"}) {
            if (std::string(name) == "g a/b") {
                file.group("g a");
            }
            file.write(name, {2}, {1, 2});
        }
    }
    EXPECT_EQ(members(), (Names{"Z", "g a/b", "g/h/z", "g/y", "x", "\xC3\xA9"}));
    EXPECT_STREQ(talcmp::open_array_file(path())->root(), "/");
    EXPECT_TRUE(talcmp::open_array_file(path())->is_archive());
}

TEST_F(Hdf5Members, OfGroupsWithSeveralNamesHaveTheFirst) {
    {
        Writer file(path());
        file.group("m");
        file.group("m/n");
        file.write("m/n/x", {1}, {1});
        file.hard_link("b", "m/n");    // entered first
        file.hard_link("m/n/up", "m"); // m is entered from b, and holds it
        file.hard_link("m/root", "/");
        file.hard_link("again", "m/n/x"); // arrays have all their names
    }
    EXPECT_EQ(members(), (Names{"again", "b/x"}));
}

TEST_F(Hdf5Members, AreFoundThroughSoftLinks) {
    {
        Writer file(path());
        file.group("g");
        file.group("g/h");
        file.write("g/h/x", {1}, {1});
        file.soft_link("a", "g");       // a group before its first name
        file.soft_link("g/h/up", "/g"); // leads to where it is
        file.soft_link("g/h/y", "x");
        file.soft_link("z", "a/h/x");
    }
    EXPECT_EQ(members(), (Names{"a/h/x", "a/h/y", "g/h/x", "g/h/y", "z"}));
    EXPECT_EQ(contents(*open("a/h/y")), bytes_of<int>({1}));
}

TEST_F(Hdf5Members, AreFewThoughGroupsLinkToEachOther) {
    {
        Writer file(path());
        for (int i = 0; i < 12; ++i) {
            file.group("g" + std::to_string(i));
            for (int j = 0; j < 12; ++j) {
                file.soft_link("g" + std::to_string(i) + "/l" + std::to_string(j),
                               "/g" + std::to_string(j));
            }
        }
        file.write("g7/x", {1}, {1});
    }
    const Names names = members();
    EXPECT_TRUE(std::binary_search(names.begin(), names.end(), "g7/x"));
    EXPECT_TRUE(std::binary_search(names.begin(), names.end(), "g3/l7/x"));
    EXPECT_LE(names.size(), 145U);
}

TEST_F(Hdf5Members, AreFoundInOtherFiles) {
    {
        Writer other(path("b.h5"));
        other.write("x", {2}, {3, 4});
        other.group("g");
        other.write("g/y", {1}, {1}, Layout::chunked({1}));
        other.external_link("back", "a.h5", "/");
        other.soft_link("g/self", "/g");
        Writer file(path());
        file.write("x", {1}, {1});
        file.external_link("to", "b.h5", "/");
        file.external_link("array", "b.h5", "x");
    }
    EXPECT_EQ(members(), (Names{"array", "to/g/y", "to/x", "x"}));
    EXPECT_EQ(contents(*open("array")), bytes_of<int>({3, 4}));
    EXPECT_EQ(contents(*open("to/g/y")), bytes_of<int>({1}));
}

TEST_F(Hdf5Members, ThatAreNoArraysAreNotNumbers) {
    {
        Writer file(path());
        file.soft_link("lost", "nowhere");
        file.soft_link("loop", "loop");
        file.external_link("no file", "no.h5", "/");
        file.external_link("long", std::string(200, 'x'), "/");
        const Handle type = made(::H5Tcopy(H5T_STD_I32LE));
        done(::H5Tcommit2(file.id(), "type", type.id(), H5P_DEFAULT, H5P_DEFAULT, H5P_DEFAULT));
    }
    EXPECT_EQ(members(), (Names{"long", "loop", "lost", "no file", "type"}));
    EXPECT_EQ(not_numbers("lost"),
              "a.h5[/lost]: is a link that leads nowhere: component not found");
    EXPECT_EQ(not_numbers("loop"), "a.h5[/loop]: is a link that leads nowhere: too many links");
    EXPECT_EQ(not_numbers("no file"),
              "a.h5[/no file]: is a link that leads nowhere: unable to open external file, "
              "external link file name = 'no.h5'");
    EXPECT_EQ(not_numbers("long"),
              "a.h5[/long]: is a link that leads nowhere: unable to open external file, external "
              "link file name = '"
                  + std::string(63, 'x') + "...");
    EXPECT_EQ(not_numbers("type"), "a.h5[/type]: is a type of elements, not an array");
}

TEST_F(Hdf5Members, AreNoDimensionsWithoutValues) {
    {
        Writer file(path());
        for (const char* name : {"time", "lat"}) {
            file.write(name, {1}, {1});
        }
        file.mark_as_dimension("time",
                               "This is a netCDF dimension but not a netCDF variable.         1");
        file.mark_as_dimension("lat", "lat");
    }
    EXPECT_EQ(members(), (Names{"lat"}));
}

TEST_F(Hdf5Members, MayBeDeepDown) {
    constexpr int depth = 2000;
    std::string name = "x";
    {
        Writer file(path());
        Handle group = made(::H5Gopen2(file.id(), "/", H5P_DEFAULT));
        for (int i = 0; i < depth; ++i) {
            group = made(::H5Gcreate2(group.id(), "g", H5P_DEFAULT, H5P_DEFAULT, H5P_DEFAULT));
            name.insert(0, "g/");
        }
        const Handle space = space_of({1});
        made(::H5Dcreate2(group.id(), "x", H5T_STD_I8LE, space.id(), H5P_DEFAULT, H5P_DEFAULT,
                          H5P_DEFAULT));
    }
    EXPECT_EQ(members(), Names{name});
    EXPECT_EQ(contents(*open(name)), std::string(1, '\0'));
}

// ---- Types

struct TypeCase {
    const char* name;
    std::function<Handle()> in_file;
    std::function<Handle()> in_memory;
    std::string written;  // elements of the type in memory
    std::string expected; // elements as they are compared
    const char* type_name;
    bool is_as_in_file = true;
};

std::function<Handle()> the(hid_t (*type)()) {
    return [type] { return made(::H5Tcopy(type())); };
}

Handle with_precision(const hid_t type, const std::size_t bits, const std::size_t offset = 0) {
    Handle changed = made(::H5Tcopy(type));
    done(::H5Tset_precision(changed.id(), bits));
    done(::H5Tset_offset(changed.id(), offset));
    return changed;
}

Handle half(const hid_t single) {
    Handle type = made(::H5Tcopy(single));
    done(::H5Tset_fields(type.id(), 15, 10, 5, 0, 10));
    done(::H5Tset_size(type.id(), 2));
    done(::H5Tset_ebias(type.id(), 15));
    return type;
}

Handle complex(const hid_t part, const std::string& real, const std::string& imaginary,
               const std::size_t gap = 0) {
    const std::size_t size = ::H5Tget_size(part);
    Handle type = made(::H5Tcreate(H5T_COMPOUND, 2 * size + gap));
    done(::H5Tinsert(type.id(), real.c_str(), 0, part));
    done(::H5Tinsert(type.id(), imaginary.c_str(), size + gap, part));
    return type;
}

Handle pair_of(const hid_t real, const hid_t imaginary) {
    Handle type = made(::H5Tcreate(H5T_COMPOUND, ::H5Tget_size(real) + ::H5Tget_size(imaginary)));
    done(::H5Tinsert(type.id(), "r", 0, real));
    done(::H5Tinsert(type.id(), "i", ::H5Tget_size(real), imaginary));
    return type;
}

Handle boolean(const hid_t base, const bool true_first = false) {
    Handle type = made(::H5Tenum_create(base));
    for (const bool value : {true_first, !true_first}) {
        const std::int64_t number = value ? 1 : 0;
        std::array<unsigned char, sizeof number> bytes = {};
        std::memcpy(bytes.data(), &number, sizeof number);
        done(::H5Tconvert(H5T_NATIVE_INT64, base, 1, bytes.data(), nullptr, H5P_DEFAULT));
        done(::H5Tenum_insert(type.id(), value ? "TRUE" : "FALSE", bytes.data()));
    }
    return type;
}

template <typename T>
TypeCase plain(const char* name, hid_t (*in_file)(), hid_t (*in_memory)(),
               const std::vector<T>& values, const char* type_name) {
    return {name, the(in_file), the(in_memory), bytes_of(values), bytes_of(values), type_name};
}

const std::vector<float> halves = {0, -2, 0.5F, 65504};
const std::vector<std::uint16_t> half_bits = {0, 0xC000, 0x3800, 0x7BFF};

const TypeCase type_cases[] = {
    plain<std::int8_t>(
        "Int8", [] { return H5T_STD_I8LE; }, [] { return H5T_NATIVE_INT8; }, {-128, 127}, "int8"),
    plain<std::uint8_t>(
        "UInt8", [] { return H5T_STD_U8BE; }, [] { return H5T_NATIVE_UINT8; }, {255, 1}, "uint8"),
    plain<std::int16_t>(
        "Int16", [] { return H5T_STD_I16LE; }, [] { return H5T_NATIVE_INT16; }, {-300, 1}, "int16"),
    plain<std::int16_t>(
        "Int16Swapped", [] { return H5T_STD_I16BE; }, [] { return H5T_NATIVE_INT16; }, {-300, 1},
        "int16"),
    plain<std::uint32_t>(
        "UInt32", [] { return H5T_STD_U32LE; }, [] { return H5T_NATIVE_UINT32; }, {4000000000, 1},
        "uint32"),
    plain<std::uint32_t>(
        "UInt32Swapped", [] { return H5T_STD_U32BE; }, [] { return H5T_NATIVE_UINT32; },
        {4000000000, 1}, "uint32"),
    plain<std::int64_t>(
        "Int64Swapped", [] { return H5T_STD_I64BE; }, [] { return H5T_NATIVE_INT64; },
        {-5000000000, 1}, "int64"),
    plain<std::uint16_t>(
        "Bits16", [] { return H5T_STD_B16LE; }, [] { return H5T_NATIVE_B16; }, {65535, 1},
        "uint16"),
    plain<std::uint64_t>(
        "Bits64Swapped", [] { return H5T_STD_B64BE; }, [] { return H5T_NATIVE_B64; },
        {1, 1U << 31U}, "uint64"),
    plain<float>(
        "Float32", [] { return H5T_IEEE_F32LE; }, [] { return H5T_NATIVE_FLOAT; }, {1.5F, -0.0F},
        "float32"),
    plain<float>(
        "Float32Swapped", [] { return H5T_IEEE_F32BE; }, [] { return H5T_NATIVE_FLOAT; },
        {1.5F, -0.0F}, "float32"),
    plain<double>(
        "Float64", [] { return H5T_IEEE_F64LE; }, [] { return H5T_NATIVE_DOUBLE; }, {0.1, 1e300},
        "float64"),
    plain<double>(
        "Float64Swapped", [] { return H5T_IEEE_F64BE; }, [] { return H5T_NATIVE_DOUBLE; },
        {0.1, 1e300}, "float64"),
    {"Half", [] { return half(H5T_IEEE_F32LE); }, [] { return half(H5T_NATIVE_FLOAT); },
     bytes_of(half_bits), bytes_of(halves), "float16"},
    {"HalfSwapped", [] { return half(H5T_IEEE_F32BE); }, [] { return half(H5T_NATIVE_FLOAT); },
     bytes_of(half_bits), bytes_of(halves), "float16"},
    {"Complex64", [] { return complex(H5T_IEEE_F32LE, "r", "i"); },
     [] { return complex(H5T_NATIVE_FLOAT, "r", "i"); }, bytes_of<float>({1, 2, 3, 4}),
     bytes_of<float>({1, 2, 3, 4}), "complex64"},
    {"Complex128Swapped", [] { return complex(H5T_IEEE_F64BE, "real", "imag"); },
     [] { return complex(H5T_NATIVE_DOUBLE, "real", "imag"); }, bytes_of<double>({1, 2, 3, 4}),
     bytes_of<double>({1, 2, 3, 4}), "complex128"},
    {"ComplexWithAGap", [] { return complex(H5T_IEEE_F64LE, "r", "i", 4); },
     [] { return complex(H5T_NATIVE_DOUBLE, "r", "i"); }, bytes_of<double>({1, 2, 3, 4}),
     bytes_of<double>({1, 2, 3, 4}), "complex128", false},
    {"ComplexImaginaryFirst", [] { return complex(H5T_IEEE_F32BE, "i", "r"); },
     [] { return complex(H5T_NATIVE_FLOAT, "r", "i"); }, bytes_of<float>({1, 2, 3, 4}),
     bytes_of<float>({1, 2, 3, 4}), "complex64", false},
    {"ComplexWithAnEnd",
     [] {
         Handle type = made(::H5Tcreate(H5T_COMPOUND, 12));
         done(::H5Tinsert(type.id(), "r", 0, H5T_IEEE_F32LE));
         done(::H5Tinsert(type.id(), "i", 4, H5T_IEEE_F32LE));
         return type;
     },
     [] { return complex(H5T_NATIVE_FLOAT, "r", "i"); }, bytes_of<float>({1, 2, 3, 4}),
     bytes_of<float>({1, 2, 3, 4}), "complex64", false},
    {"ComplexOfTwoOrders", [] { return pair_of(H5T_IEEE_F32LE, H5T_IEEE_F32BE); },
     [] { return complex(H5T_NATIVE_FLOAT, "r", "i"); }, bytes_of<float>({1, 2, 3, 4}),
     bytes_of<float>({1, 2, 3, 4}), "complex64", false},
    {"Boolean", [] { return boolean(H5T_STD_I8LE); }, [] { return boolean(H5T_STD_I8LE); },
     bytes_of<std::int8_t>({0, 1, 1}), bytes_of<std::uint8_t>({0, 1, 1}), "bool"},
    {"BooleanOfOtherValues", [] { return boolean(H5T_STD_U8LE, true); },
     [] { return boolean(H5T_STD_U8LE); }, bytes_of<std::uint8_t>({0, 1, 7}),
     bytes_of<std::uint8_t>({0, 1, 1}), "bool"},
    {"BooleanOfFourBytes", [] { return boolean(H5T_STD_I32BE); },
     [] { return boolean(H5T_NATIVE_INT32); }, bytes_of<std::int32_t>({0, 1, 1}),
     bytes_of<std::uint8_t>({0, 1, 1}), "bool", false},
    {"Signed12Bits", [] { return with_precision(H5T_STD_I16LE, 12, 3); },
     the([] { return H5T_NATIVE_INT16; }), bytes_of<std::int16_t>({-2048, 2047}),
     bytes_of<std::int16_t>({-2048, 2047}), "int16", false},
    {"Unsigned24BitsSwapped", [] { return with_precision(H5T_STD_U32BE, 24); },
     the([] { return H5T_NATIVE_UINT32; }), bytes_of<std::uint32_t>({16777215, 1}),
     bytes_of<std::uint32_t>({16777215, 1}), "uint32", false},
    {"Signed31BitsSwapped", [] { return with_precision(H5T_STD_I32BE, 31); },
     the([] { return H5T_STD_I32BE; }), std::string("\xFF\xFF\xFF\xFB\0\0\0\5", 8),
     bytes_of<std::int32_t>({-5, 5}), "int32", false},
    {"Signed3Bits", [] { return with_precision(H5T_STD_I64LE, 3); },
     the([] { return H5T_NATIVE_INT8; }), bytes_of<std::int8_t>({-4, 3}),
     bytes_of<std::int8_t>({-4, 3}), "int8", false},
    {"BitField5Bits", [] { return with_precision(H5T_STD_B8LE, 5); },
     the([] { return H5T_NATIVE_B8; }), bytes_of<std::uint8_t>({31, 1}),
     bytes_of<std::uint8_t>({31, 1}), "uint8", false},
};

class Hdf5Types : public Hdf5Files, public testing::WithParamInterface<NamedCase<TypeCase>> {
  protected:
    void check(const Layout& layout, const bool in_blocks) {
        const TypeCase& each = GetParam();
        const Handle type = each.in_file();
        const Handle in_memory = each.in_memory();
        const hsize_t count = each.written.size() / ::H5Tget_size(in_memory.id());
        Writer(path()).write("x", type.id(), {count}, in_memory.id(), each.written.data(), layout);
        const Source source = open("x");
        EXPECT_EQ(source->type_name(), each.type_name);
        EXPECT_EQ(source->shape(), Shape{count});
        EXPECT_EQ(source->block().empty(), !in_blocks);
        EXPECT_EQ(contents(*source), each.expected);
    }
};

TEST_P(Hdf5Types, AreReadFromAllLayouts) {
    const talcmp::hdf5::LibraryUse use("a.h5");
    check({}, !GetParam().is_as_in_file);
    check(Layout::chunked({2}), true);
    check(Layout::compact(), true);
}

INSTANTIATE_TEST_SUITE_P(All, Hdf5Types, named_cases(type_cases), name_of_case);

struct OtherType {
    const char* name;
    std::function<Handle()> make;
    const char* elements;
};

Handle enumeration() {
    Handle type = made(::H5Tenum_create(H5T_NATIVE_INT8));
    const std::int8_t values[] = {0, 1};
    done(::H5Tenum_insert(type.id(), "TRUE", &values[0]));
    done(::H5Tenum_insert(type.id(), "FALSE", &values[1]));
    return type;
}

Handle three_truths() {
    Handle type = boolean(H5T_NATIVE_INT8);
    const std::int8_t value = 2;
    done(::H5Tenum_insert(type.id(), "MAYBE", &value));
    return type;
}

Handle triple() {
    Handle type = made(::H5Tcreate(H5T_COMPOUND, 12));
    for (const auto& [name, offset] : {std::pair("r", 0U), {"i", 4U}, {"j", 8U}}) {
        done(::H5Tinsert(type.id(), name, offset, H5T_IEEE_F32LE));
    }
    return type;
}

Handle bfloat16() {
    Handle type = made(::H5Tcopy(H5T_IEEE_F32LE));
    done(::H5Tset_fields(type.id(), 15, 7, 8, 0, 7));
    done(::H5Tset_size(type.id(), 2));
    return type;
}

Handle text(const std::size_t size) {
    Handle type = made(::H5Tcopy(H5T_C_S1));
    done(::H5Tset_size(type.id(), size));
    return type;
}

Handle number_of_bits(const hid_t like, const std::size_t bytes) {
    Handle type = made(::H5Tcopy(like));
    done(::H5Tset_size(type.id(), bytes));
    done(::H5Tset_precision(type.id(), 8 * bytes));
    return type;
}

Handle array_of_ints() {
    const hsize_t extent = 3;
    return made(::H5Tarray_create2(H5T_STD_I32LE, 1, &extent));
}

const OtherType other_types[] = {
    {"Text", [] { return text(5); }, "texts"},
    {"TextOfAnyLength", [] { return text(H5T_VARIABLE); }, "texts"},
    {"RawBytes", [] { return made(::H5Tcreate(H5T_OPAQUE, 5)); }, "raw bytes"},
    {"Reference", the([] { return H5T_STD_REF_OBJ; }), "references"},
    {"Enumeration", enumeration, "names of an enumeration"},
    {"Lists", [] { return made(::H5Tvlen_create(H5T_STD_I32LE)); }, "lists of varying length"},
    {"Arrays", array_of_ints, "arrays"},
    {"Pairs", [] { return complex(H5T_IEEE_F64LE, "x", "y"); }, "structures"},
    {"PairOfIntegers", [] { return complex(H5T_STD_I32LE, "r", "i"); }, "structures"},
    {"PairOfTwoSizes", [] { return pair_of(H5T_IEEE_F32LE, H5T_IEEE_F64LE); }, "structures"},
    {"Triple", triple, "structures"},
    {"ThreeTruths", three_truths, "names of an enumeration"},
    {"BFloat16", bfloat16, "floating-point numbers of 16 bits"},
    {"Integer128", [] { return number_of_bits(H5T_STD_I64LE, 16); }, "integers of 128 bits"},
    {"BitField72", [] { return number_of_bits(H5T_STD_B64LE, 9); }, "bit fields of 72 bits"},
    {"Times", the([] { return H5T_UNIX_D32LE; }), "times"},
};

class OtherHdf5Types : public Hdf5Files,
                       public testing::WithParamInterface<NamedCase<OtherType>> {};

TEST_P(OtherHdf5Types, AreNotNumbers) {
    {
        const talcmp::hdf5::LibraryUse use("a.h5");
        const Handle type = GetParam().make();
        Writer(path()).array("x", type.id(), space_of({2}));
    }
    EXPECT_EQ(not_numbers("x"), std::string("a.h5[/x]: has elements that are ")
                                    + GetParam().elements
                                    + ", which are not supported; booleans, integers of 8 to 64 "
                                      "bits, float16 to float64, complex64 and complex128 are");
}

INSTANTIATE_TEST_SUITE_P(All, OtherHdf5Types, named_cases(other_types), name_of_case);

// ---- Shapes

class Hdf5Shapes : public Hdf5Files {};

TEST_F(Hdf5Shapes, MayBeThoseOfOneElement) {
    const int element = 7;
    {
        Writer file(path());
        file.write("contiguous", H5T_STD_I32LE, {}, H5T_NATIVE_INT, &element);
        file.write("compact", H5T_STD_I32LE, {}, H5T_NATIVE_INT, &element, Layout::compact());
        const Handle scalar = made(::H5Screate(H5S_SCALAR));
        file.array("unwritten", H5T_STD_I32LE, scalar);
        file.write("long", Extents(32, 1), {7});
    }
    for (const auto& [name, shape, value] : {std::tuple("contiguous", Shape(), 7),
                                             {"compact", Shape(), 7},
                                             {"unwritten", Shape(), 0},
                                             {"long", Shape(32, 1), 7}}) {
        const Source source = open(name);
        EXPECT_EQ(source->shape(), shape) << name;
        EXPECT_TRUE(source->block().empty()) << name;
        EXPECT_EQ(contents(*source), bytes_of<int>({value})) << name;
    }
}

TEST_F(Hdf5Shapes, MayHaveNoElements) {
    {
        Writer file(path());
        const Handle space = space_of({0, 3});
        file.array("contiguous", H5T_STD_I32LE, space);
        const hsize_t now[] = {0, 3};
        const hsize_t most[] = {H5S_UNLIMITED, 3};
        const Handle growing = made(::H5Screate_simple(2, now, most));
        file.array("chunked", H5T_STD_I32LE, growing, Layout::chunked({4, 2}));
    }
    EXPECT_EQ(open("contiguous")->shape(), (Shape{0, 3}));
    EXPECT_EQ(open("chunked")->shape(), (Shape{0, 3}));
    EXPECT_EQ(open("chunked")->block(), (Shape{1, 2}));
}

TEST_F(Hdf5Shapes, AreThoseToWhichArraysHaveGrown) {
    {
        Writer file(path());
        const hsize_t now[] = {2};
        const hsize_t most[] = {H5S_UNLIMITED};
        const Handle space = made(::H5Screate_simple(1, now, most));
        const Handle array = file.array("x", H5T_STD_I32LE, space, Layout::chunked({4}));
        const hsize_t later[] = {6};
        done(::H5Dset_extent(array.id(), later));
        const std::vector<int> values = numbers(6);
        done(::H5Dwrite(array.id(), H5T_NATIVE_INT, H5S_ALL, H5S_ALL, H5P_DEFAULT, values.data()));
    }
    EXPECT_EQ(open("x")->shape(), Shape{6});
    EXPECT_EQ(open("x")->block(), Shape{4});
    EXPECT_EQ(contents(*open("x")), bytes_of(numbers(6)));
}

TEST_F(Hdf5Shapes, MayBeMissing) {
    {
        Writer file(path());
        const Handle null = made(::H5Screate(H5S_NULL));
        file.array("x", H5T_STD_I32LE, null);
    }
    EXPECT_EQ(not_numbers("x"), "a.h5[/x]: holds no array: it has neither a shape nor elements");
}

TEST_F(Hdf5Shapes, MayBeTooLarge) {
    {
        Writer file(path());
        const Handle space = space_of({hsize_t{1} << 33U, hsize_t{1} << 29U});
        file.array("x", H5T_IEEE_F64LE, space, Layout::chunked({1, 1}));
        file.array("y", H5T_STD_I8LE, space, Layout::chunked({1, 1}));
    }
    EXPECT_EQ(trouble("x"), "a.h5[/x]: has a shape of more elements than 2^63 bytes hold");
    EXPECT_EQ(open("y")->shape(), (Shape{std::uint64_t{1} << 33U, std::uint64_t{1} << 29U}));
}

// ---- Blocks and slabs

const Shape shape = {6, 7, 5};
constexpr std::size_t count = 210; // the product

const Extents extents(shape.begin(), shape.end());

// An array in each layout; its elements are 1, 2, 3, ...
void write_layouts(Writer& file, const std::string& external) {
    const std::vector<int> values = numbers(count);
    Layout compressed = Layout::chunked({2, 3, 5});
    done(::H5Pset_shuffle(compressed.id()));
    done(::H5Pset_deflate(compressed.id(), 1));
    Layout outside;
    done(::H5Pset_external(outside.id(), external.c_str(), 0, count * sizeof(int)));
    file.write("contiguous", extents, values);
    file.write("chunked", extents, values, Layout::chunked({4, 2, 3}));
    file.write("compressed", extents, values, compressed);
    file.write("compact", extents, values, Layout::compact());
    file.write("external", extents, values, outside);
    Layout virtual_array;
    const Handle space = space_of(extents);
    done(::H5Pset_virtual(virtual_array.id(), space.id(), ".", "chunked", space.id()));
    file.array("virtual", H5T_STD_I32LE, space, virtual_array);
}

struct LayoutCase {
    const char* name;
    Shape block;
};

const LayoutCase layouts[] = {
    {"chunked", {4, 2, 3}},  {"compressed", {2, 3, 5}}, {"compact", {1, 1, 1}},
    {"external", {1, 1, 1}}, {"virtual", {1, 1, 1}},
};

class Hdf5Layouts : public Hdf5Files, public testing::WithParamInterface<NamedCase<LayoutCase>> {
  protected:
    void SetUp() override {
        Writer file(path());
        write_layouts(file, path("raw"));
    }
};

std::vector<int> expected_in(const Slab& slab) {
    std::vector<int> values;
    for (const std::size_t position : positions_of(slab, shape)) {
        values.push_back(static_cast<int>(position) + 1);
    }
    return values;
}

TEST_P(Hdf5Layouts, AreReadInSlabs) {
    const Source source = open(GetParam().name);
    EXPECT_EQ(source->block(), GetParam().block);
    EXPECT_EQ(contents(*source), bytes_of(numbers(count)));
    std::mt19937_64 random(drawn_seed());
    for (int i = 0; i < 200; ++i) {
        const Slab slab = random_slab(shape, random);
        const std::vector<int> expected = expected_in(slab);
        std::vector<int> elements(expected.size());
        source->read_slab(slab, elements.data());
        ASSERT_EQ(elements, expected);
    }
}

INSTANTIATE_TEST_SUITE_P(All, Hdf5Layouts, named_cases(layouts), name_of_case);

class Hdf5Reads : public Hdf5Files {};

TEST_F(Hdf5Reads, AreAtPositionsWhereElementsAreContiguous) {
    for (const hsize_t user_block : {0U, 512U, 4096U}) {
        {
            Writer file(path(), user_block);
            file.write("x", {100}, numbers(100));
        }
        const Source source = open("x");
        EXPECT_TRUE(source->block().empty());
        EXPECT_TRUE(source->random_access());
        EXPECT_FALSE(source->fortran_order());
        std::vector<int> elements(3);
        source->read(97, 3, elements.data());
        EXPECT_EQ(elements, (std::vector<int>{98, 99, 100})) << user_block;
    }
}

TEST_F(Hdf5Reads, GiveTheFillValueWhereNothingWasWritten) {
    const int fill = 5;
    {
        Writer file(path());
        Layout layout;
        done(::H5Pset_fill_value(layout.id(), H5T_NATIVE_INT, &fill));
        const Handle space = space_of({2, 2});
        file.array("x", H5T_STD_I32BE, space, layout);
    }
    EXPECT_EQ(open("x")->block(), (Shape{1, 1}));
    EXPECT_EQ(contents(*open("x")), bytes_of<int>({5, 5, 5, 5}));
}

TEST_F(Hdf5Reads, MayBeByThreads) {
    {
        Writer file(path());
        write_layouts(file, path("raw"));
    }
    const auto file = talcmp::open_array_file(path());
    const Source contiguous = file->open("contiguous");
    const Source compressed = file->open("compressed");
    const std::string expected = bytes_of(numbers(count));
    std::vector<std::thread> threads;
    threads.reserve(4);
    std::atomic<int> right = 0;
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int j = 0; j < 50; ++j) {
                right +=
                    contents(*contiguous) == expected && contents(*compressed) == expected ? 1 : 0;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(right, 200);
}

TEST_F(Hdf5Reads, OfArraysOutliveTheirFile) {
    Writer(path()).write("x", {3}, {1, 2, 3}, Layout::chunked({3}));
    const Source source = open("x");
    EXPECT_EQ(contents(*source), bytes_of<int>({1, 2, 3}));
}

// A filter that changes nothing but counts how often it is undone.
std::atomic<int> undone = 0;

std::size_t count_undone(const unsigned flags, std::size_t /*values*/, const unsigned* /*value*/,
                         const std::size_t bytes, std::size_t* /*size*/, void** /*buffer*/) {
    undone += (flags & H5Z_FLAG_REVERSE) != 0 ? 1 : 0;
    return bytes;
}

constexpr H5Z_filter_t counting_filter = 300; // among the numbers that are for tests

Layout counted_chunks(const Extents& chunk) {
    const H5Z_class2_t filter = {H5Z_CLASS_T_VERS, counting_filter, 1,       1,
                                 "counting",       nullptr,         nullptr, count_undone};
    done(::H5Zregister(&filter));
    Layout layout = Layout::chunked(chunk);
    done(::H5Pset_filter(layout.id(), counting_filter, H5Z_FLAG_MANDATORY, 0, nullptr));
    return layout;
}

TEST_F(Hdf5Reads, UndoTheFiltersOfAChunkOnce) {
    Writer(path()).write("x", {6, 6}, numbers(36), counted_chunks({2, 3}));
    const Source source = open("x");
    const auto undone_by = [&source](const Slab& slab) {
        std::vector<int> elements(36);
        undone = 0;
        source->read_slab(slab, elements.data());
        return undone.load();
    };
    EXPECT_EQ(undone_by({{{0, 6, 1}, {0, 6, 1}}}), 6);
    EXPECT_EQ(undone_by({{{2, 2, 1}, {0, 6, 1}}}), 2);
    EXPECT_EQ(undone_by({{{0, 4, 1}, {3, 3, 1}}}), 2);
    EXPECT_EQ(undone_by({{{0, 4, 1}, {3, 3, 1}}}), 2); // no chunk is kept
    EXPECT_EQ(undone_by({{{0, 3, 2}, {0, 3, 2}}}), 6);
    EXPECT_EQ(undone_by({{{1, 2, 4}, {0, 1, 1}}}), 2);
}

// ---- Broken files

class BrokenHdf5Files : public Hdf5Files {};

TEST_F(BrokenHdf5Files, LackFilters) {
    Writer(path()).write("x", {2}, {1, 2}, counted_chunks({2}));
    done(::H5Zunregister(counting_filter));
    EXPECT_EQ(trouble("x"), "a.h5[/x]: cannot be read: the HDF5 library lacks the filter counting "
                            "(300); set HDF5_PLUGIN_PATH to the folder of its plugin");
}

TEST_F(BrokenHdf5Files, HaveChunksThatDoNotFitTheirSums) {
    Layout layout = Layout::chunked({4});
    done(::H5Pset_fletcher32(layout.id()));
    const std::vector<int> values = {0x11121314, 0x15161718, 0x191A1B1C, 0x1D1E1F20};
    Writer(path()).write("x", {4}, values, layout);
    change([](std::string& bytes) { bytes.at(bytes.find("\x14\x13\x12\x11"))++; });
    EXPECT_EQ(trouble("x"), "a.h5[/x]: cannot be read: data error detected by Fletcher32 "
                            "checksum; is the file complete and undamaged?");
}

TEST_F(BrokenHdf5Files, HaveChunksThatCannotBeDecompressed) {
    Layout layout = Layout::chunked({1000});
    done(::H5Pset_deflate(layout.id(), 1));
    Writer(path()).write("x", {1000}, numbers(1000), layout);
    change([](std::string& bytes) {
        bytes.replace(bytes.find("\x78\x01"), 10, "\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF");
    });
    EXPECT_EQ(trouble("x"), "a.h5[/x]: cannot be read: inflate() failed; is the file complete and "
                            "undamaged?");
}

TEST_F(BrokenHdf5Files, AreCutShort) {
    Writer(path()).write("x", {1000}, numbers(1000));
    change([](std::string& bytes) { bytes.resize(3000); });
    EXPECT_EQ(
        trouble("x"),
        "a.h5: cannot be opened as an HDF5 file: truncated file: eof = 3000, sblock->base_addr"
        " = 0, stored_eof = 6048; is the file complete and undamaged?");
}

TEST_F(BrokenHdf5Files, HaveNothingButTheirSignature) {
    Writer(path()).write("x", {1}, {1});
    change([](std::string& bytes) { bytes.resize(8); });
    EXPECT_EQ(trouble("x"), "a.h5: cannot be opened as an HDF5 file: bad byte number in an "
                            "address; is the file complete and undamaged?");
}

TEST_F(BrokenHdf5Files, AreCutShortWhileTheyAreRead) {
    Writer(path()).write("x", {1000}, numbers(1000));
    const Source source = open("x");
    std::filesystem::resize_file(path(), 4000);
    EXPECT_EQ(without_folder(thrown_message([&] { contents(*source); })),
              "a.h5[/x]: ends after 488 of 1000 elements; is the file complete?");
}

TEST_F(BrokenHdf5Files, LoseTheirLastChunkWhileTheyAreRead) {
    Writer(path()).write("x", {1000}, numbers(1000), Layout::chunked({1000}));
    const Source source = open("x");
    std::filesystem::resize_file(path(), std::filesystem::file_size(path()) - 1);
    EXPECT_EQ(without_folder(thrown_message([&] { contents(*source); })),
              "a.h5[/x]: is in a file that was cut short while it was read");
}

// Where the extent 1000 of an array is in its file, whose header is before its elements. The rank
// is seven bytes before.
std::size_t place_of_extent(const std::string& bytes) {
    return bytes.find(std::string("\xE8\x03\0\0\0\0\0\0", 8));
}

TEST_F(BrokenHdf5Files, HaveLessDataThanTheirShapesSay) {
    for (const auto make : {+[] { return Layout(); }, +[] { return Layout::compact(); }}) {
        const Layout layout = make();
        Writer(path()).write("x", {1000}, numbers(1000), layout);
        change([](std::string& bytes) { bytes.at(place_of_extent(bytes))++; });
        EXPECT_EQ(trouble("x"),
                  "a.h5[/x]: has less data than its shape says; is the file damaged?");
    }
}

TEST_F(BrokenHdf5Files, HaveLessDataInOtherFilesThanTheirShapesSay) {
    Layout outside;
    done(::H5Pset_external(outside.id(), path("raw1").c_str(), 8, 10 * sizeof(int)));
    done(::H5Pset_external(outside.id(), path("raw2").c_str(), 0, H5F_UNLIMITED));
    Writer(path()).write("x", {15}, numbers(15), outside);
    EXPECT_EQ(contents(*open("x")), bytes_of(numbers(15)));
    std::filesystem::resize_file(path("raw2"), 5 * sizeof(int) - 1);
    EXPECT_EQ(trouble("x"), "a.h5[/x]: has less data in raw2 than its shape says; is that file "
                            "complete?");
    std::filesystem::resize_file(path("raw1"), 8 + 10 * sizeof(int) - 1);
    EXPECT_EQ(trouble("x"), "a.h5[/x]: has less data in raw1 than its shape says; is that file "
                            "complete?");
    std::filesystem::remove(path("raw1"));
    std::filesystem::resize_file(path("raw2"), 5 * sizeof(int));
    EXPECT_EQ(trouble("x"), "a.h5[/x]: cannot be read: unable to open external raw data file; is "
                            "the file complete and undamaged?");
}

// A virtual array of {2, 3}, whose rows are those arrays.
void write_virtual(const Writer& file, const std::string& name,
                   const std::vector<std::pair<std::string, std::string>>& sources) {
    Layout layout;
    hsize_t row = 0;
    for (const auto& [path, array] : sources) {
        const Handle part = space_of({2, 3});
        const Extents begin = {row++, 0};
        const Extents extent = {1, 3};
        done(::H5Sselect_hyperslab(part.id(), H5S_SELECT_SET, begin.data(), nullptr, extent.data(),
                                   nullptr));
        done(::H5Pset_virtual(layout.id(), part.id(), path.c_str(), array.c_str(),
                              space_of({3}).id()));
    }
    file.array(name, H5T_STD_I32LE, space_of({2, 3}), layout);
}

TEST_F(BrokenHdf5Files, LackArraysOfWhichTheyAreMade) {
    Writer(path("b.h5")).write("x", {3}, {4, 5, 6});
    {
        const Writer file(path());
        file.write("y", {3}, {1, 2, 3});
        write_virtual(file, "beside", {{".", "y"}, {"b.h5", "x"}});
        write_virtual(file, "absolute", {{".", "y"}, {path("b.h5"), "/x"}});
        write_virtual(file, "moved", {{".", "y"}, {"/no such folder/b.h5", "x"}});
        write_virtual(file, "another", {{".", "y"}, {"b.h5", "z"}});
        write_virtual(file, "none here", {{".", "z"}, {"b.h5", "x"}});
        write_virtual(file, "no file", {{".", "y"}, {"c.h5", "x"}});
    }
    for (const char* const whole : {"beside", "absolute", "moved"}) {
        EXPECT_EQ(contents(*open(whole)), bytes_of<int>({1, 2, 3, 4, 5, 6})) << whole;
    }
    const auto needs = [this](const std::string& member, const std::string& source) {
        EXPECT_EQ(trouble(member), "a.h5[/" + member + "]: is a virtual array that needs " + source
                                       + ", which is missing or unreadable; put it back");
    };
    needs("another", "b.h5[z]");
    needs("none here", ".[z]");
    needs("no file", "c.h5[x]");
    std::filesystem::remove(path("b.h5"));
    needs("beside", "b.h5[x]");
}

TEST_F(BrokenHdf5Files, HaveLargerChunksThanTheirLayoutSays) {
    Writer(path()).write("x", {331, 2}, numbers(662), Layout::chunked({331, 1}));
    change([](std::string& bytes) {
        const std::string size({'\x2C', '\x05', '\0', '\0', '\0', '\0', '\0', '\0'});
        for (auto at = bytes.find(size); at != std::string::npos; at = bytes.find(size)) {
            bytes[at + 2] = '\x10';
        }
    });
    EXPECT_EQ(contents(*open("x")), bytes_of(numbers(662)));
}

TEST_F(BrokenHdf5Files, HaveChunksOfAnotherRank) {
    Writer(path()).write("x", {1000}, numbers(1000), Layout::chunked({10}));
    change([](std::string& bytes) { bytes.at(place_of_extent(bytes) - 7) = 0; });
    EXPECT_EQ(trouble("x"), "a.h5[/x]: has chunks that do not fit its shape; is the file damaged?");
}

TEST_F(BrokenHdf5Files, HavePartsOutsideOfTheirElements) {
    const std::vector<double> values = {1, 2};
    const talcmp::hdf5::LibraryUse use("a.h5");
    const Handle type = complex(H5T_IEEE_F64LE, "r", "i");
    Writer(path()).write("x", type.id(), {1}, type.id(), values.data());
    // After the name and its padding, the place of the part.
    change([](std::string& bytes) {
        bytes.at(bytes.find(std::string("i\0\0\0\0\0\0\0\x08", 9)) + 8) = 9;
    });
    EXPECT_EQ(not_numbers("x"),
              "a.h5[/x]: has elements that are structures, which are not supported; booleans, "
              "integers of 8 to 64 bits, float16 to float64, complex64 and complex128 are");
}

TEST_F(BrokenHdf5Files, HaveBrokenGroups) {
    {
        Writer file(path());
        file.group("g");
        file.write("x", {1}, {1});
    }
    change([](std::string& bytes) { bytes.at(bytes.rfind("TREE")) = 'X'; });
    EXPECT_EQ(talcmp::open_array_file(path())->members(), (Names{"g", "x"}));
    EXPECT_EQ(trouble("g"), "a.h5[/g]: is broken: wrong B-tree signature; is the file damaged?");
    EXPECT_EQ(contents(*open("x")), bytes_of<int>({1}));
}

TEST_F(BrokenHdf5Files, HaveABrokenRoot) {
    Writer(path()).write("x", {1}, {1});
    change([](std::string& bytes) { bytes.at(bytes.find("TREE")) = 'X'; });
    EXPECT_EQ(trouble("x"), "a.h5: is broken: wrong B-tree signature; is the file complete?");
}

// ---- Files on which the library fails

TEST(Hdf5GuardDeathTest, EndsTheProcessAtACrash) {
    for (const int signal : {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT}) {
        const auto crash = [signal] {
            const talcmp::hdf5::LibraryUse use("a\n.h5");
            const talcmp::hdf5::LibraryUse nested("b.h5");
            std::raise(signal);
        };
        EXPECT_EXIT(crash(), testing::ExitedWithCode(2),
                    "^talcmp: a\\?.h5: the HDF5 library failed on it; is the file damaged\\?\n$");
    }
}

TEST(Hdf5GuardDeathTest, EndsTheProcessWhereTheLibraryNeverEnds) {
    const auto loop = [] {
        const talcmp::hdf5::LibraryUse use("a.h5", std::chrono::seconds(1));
        std::ifstream zeros("/dev/zero", std::ios::binary);
        // Each read asks the system, as only then ThreadSanitizer lets signals through.
        for (std::array<char, 65536> bytes = {}; zeros.read(bytes.data(), bytes.size());) {
        }
    };
    EXPECT_EXIT(loop(), testing::ExitedWithCode(2),
                "^talcmp: a.h5: the HDF5 library failed on it; is the file damaged\\?\n$");
}

TEST(Hdf5GuardDeathTest, LeavesOtherCrashesAlone) {
    const auto crash_after_use = [] {
        { const talcmp::hdf5::LibraryUse use("a.h5"); }
        std::raise(SIGABRT);
        std::raise(SIGABRT); // the handler has left the second one alone
    };
    EXPECT_EXIT(crash_after_use(), testing::KilledBySignal(SIGABRT), "");
    const auto crash_of_another_thread = [] {
        const talcmp::hdf5::LibraryUse use("a.h5");
        std::thread(std::abort).join();
    };
    EXPECT_EXIT(crash_of_another_thread(), testing::KilledBySignal(SIGABRT), "");
}

} // namespace
