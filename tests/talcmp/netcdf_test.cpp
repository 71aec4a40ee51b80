// Files in the classic netCDF formats: what is read from them, and what is refused.

#include "netcdf_file.h"
#include "trouble.h"

#include "../support/protected_memory.h"
#include "support/memory_bytes.h"
#include "support/named_cases.h"
#include "support/netcdf_bytes.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace {

using netcdf::elements;
using netcdf::File;
using netcdf::padded;

talcmp::NetcdfFile opened(const std::string_view bytes) {
    return {"a.nc", std::make_shared<MemoryBytes>(bytes)};
}

// Elements in this machine's byte order.
std::string read(talcmp::ArraySource& array, const std::uint64_t first, const std::uint64_t count) {
    std::string bytes(static_cast<std::size_t>(count) * array.type().size, '\0');
    array.read(first, count, bytes.data());
    return bytes;
}

std::string read_all(talcmp::ArraySource& array) {
    return read(array, 0, talcmp::element_count(array));
}

std::string text_of_length(const std::size_t length) {
    std::string text(length, '\0');
    for (std::size_t i = 0; i < length; ++i) {
        text[i] = static_cast<char>(i % 251 + i / 251 % 241);
    }
    return text;
}

// ---- What is read

constexpr int all_versions[] = {1, 2, 5};

// Two variables in records, of which one is padded there, and one that is not in records.
File small_file(const int version) {
    return {version,
            2,
            {{"x", 3}, {"time", 0}},
            {{"title", netcdf::type_char, 5, "small"}, {"none", netcdf::type_double, 0, ""}},
            {{"fixed", {0}, netcdf::type_short, 0},
             {"level", {1}, netcdf::type_byte, 8},
             {"field", {1, 0}, netcdf::type_float, 12, {{"n", netcdf::type_short, 1, "ab"}}}}};
}

const std::string small_data = padded(elements<std::int16_t>({1, -2, 300}))
                               + padded(elements<std::int8_t>({-7})) + elements<float>({1, 2, 3})
                               + padded(elements<std::int8_t>({8})) + elements<float>({4, 5, 6});

std::string small_bytes(const int version) {
    return netcdf::header(small_file(version)) + small_data;
}

template <typename T>
void expect_array(talcmp::ArrayFile& file, const std::string& member, const talcmp::Shape& shape,
                  const std::vector<T>& values) {
    SCOPED_TRACE(member);
    const auto array = file.open(member);
    EXPECT_EQ(array->type().id, element_type_id<T>);
    EXPECT_EQ(array->type_name(), array->type().name);
    EXPECT_EQ(array->shape(), shape);
    EXPECT_FALSE(array->fortran_order());
    EXPECT_TRUE(array->random_access());
    EXPECT_TRUE(array->block().empty());
    EXPECT_EQ(read_all(*array), npy::elements(values));
}

void expect_small_arrays(talcmp::ArrayFile& file) {
    expect_array<std::int16_t>(file, "fixed", {3}, {1, -2, 300});
    expect_array<std::int8_t>(file, "level", {2}, {-7, 8});
    expect_array<float>(file, "field", {2, 3}, {1, 2, 3, 4, 5, 6});
}

TEST(NetcdfFiles, AreArchivesOfTheirVariables) {
    for (const int version : all_versions) {
        SCOPED_TRACE(version);
        const std::string bytes = small_bytes(version);
        talcmp::NetcdfFile file = opened(bytes);
        EXPECT_TRUE(file.is_archive());
        EXPECT_STREQ(file.root(), "/");
        EXPECT_EQ(file.members(), (std::vector<std::string>{"field", "fixed", "level"}));
        expect_small_arrays(file);
    }
}

TEST(NetcdfFiles, StayOpenWhileAVariableIs) {
    const std::string bytes = small_bytes(1);
    const auto array = opened(bytes).open("level");
    EXPECT_EQ(read_all(*array), "\xF9\x08");
}

TEST(NetcdfFiles, MayBeEmpty) {
    for (const int version : all_versions) {
        const std::string bytes = netcdf::header({version, 0, {}, {}, {}});
        EXPECT_EQ(opened(bytes).members(), std::vector<std::string>());
    }
}

template <typename T>
void expect_scalar(const netcdf::Type type, const T value) {
    const std::string bytes =
        netcdf::header({5, 0, {}, {}, {{"v", {}, type}}}) + elements<T>({value});
    talcmp::NetcdfFile file = opened(bytes);
    expect_array<T>(file, "v", {}, {value});
}

TEST(NetcdfFiles, HaveElementsOfEachType) {
    expect_scalar<std::int8_t>(netcdf::type_byte, -1);
    expect_scalar<std::int16_t>(netcdf::type_short, -2);
    expect_scalar<std::int32_t>(netcdf::type_int, -3);
    expect_scalar<float>(netcdf::type_float, 0.1F);
    expect_scalar<double>(netcdf::type_double, 0.1);
    expect_scalar<std::uint8_t>(netcdf::type_ubyte, 255);
    expect_scalar<std::uint16_t>(netcdf::type_ushort, 65534);
    expect_scalar<std::uint32_t>(netcdf::type_uint, 4294967293U);
    expect_scalar<std::int64_t>(netcdf::type_int64, -4294967298);
    expect_scalar<std::uint64_t>(netcdf::type_uint64, 18446744073709551615U);
}

TEST(NetcdfFiles, HaveUnpaddedRecordsOfOneVariable) {
    const File file = {1, 3, {{"time", 0}, {"x", 3}}, {}, {{"v", {0, 1}, netcdf::type_byte}}};
    const std::string bytes = netcdf::header(file) + "abcdefghi";
    talcmp::NetcdfFile opened_file = opened(bytes);
    expect_array<std::int8_t>(opened_file, "v", {3, 3},
                              {'a', 'b', 'c', 'd', 'e', 'f', 'g', 'h', 'i'});
}

// Headers are read piece by piece.
TEST(NetcdfFiles, MayHaveLongHeaders) {
    for (const int version : all_versions) {
        SCOPED_TRACE(version);
        File file = {
            version, 0, {}, {{"long", netcdf::type_char, 9999, std::string(9999, 'l')}}, {}};
        std::vector<std::string> names;
        for (std::size_t i = 0; i < 300; ++i) {
            const std::string name = std::string(i % 90 + 1, 'n') + std::to_string(i);
            names.push_back(name);
            file.dimensions.push_back({name, i + 1});
            file.variables.push_back({name, {i}, netcdf::type_byte, i});
        }
        const std::string data = text_of_length(600);
        const std::string bytes = netcdf::header(file) + data;
        talcmp::NetcdfFile opened_file = opened(bytes);
        for (std::size_t i = 0; i < 300; ++i) {
            const auto array = opened_file.open(names[i]);
            EXPECT_EQ(array->shape(), talcmp::Shape{i + 1});
            EXPECT_EQ(read_all(*array), data.substr(i, i + 1));
        }
    }
}

TEST(NetcdfFiles, MayHaveNoRecords) {
    File file = small_file(1);
    file.records = 0;
    const std::string bytes = netcdf::header(file) + small_data.substr(0, 8);
    talcmp::NetcdfFile opened_file = opened(bytes);
    expect_array<std::int16_t>(opened_file, "fixed", {3}, {1, -2, 300});
    expect_array<std::int8_t>(opened_file, "level", {0}, {});
    expect_array<float>(opened_file, "field", {0, 3}, {});
}

// Some programs write 0 there until there are elements.
TEST(NetcdfFiles, NeedNotSayWhereNoElementsAre) {
    for (const std::uint64_t place : {std::uint64_t{0} - 1, std::uint64_t{1000}}) {
        const std::string bytes =
            netcdf::header({1, 0, {{"t", 0}}, {}, {{"v", {0}, netcdf::type_int, place}}});
        talcmp::NetcdfFile file = opened(bytes);
        expect_array<std::int32_t>(file, "v", {0}, {});
    }
}

constexpr std::uint64_t unknown_count(const int version) {
    return version == 5 ? 0xFFFFFFFFFFFFFFFFU : 0xFFFFFFFFU;
}

TEST(NetcdfFiles, MayLeaveTheNumberOfRecordsToTheirLength) {
    for (const int version : all_versions) {
        SCOPED_TRACE(version);
        File file = small_file(version);
        file.records = unknown_count(version);
        const std::string header = netcdf::header(file);
        const std::string bytes = header + small_data;
        talcmp::NetcdfFile complete = opened(bytes);
        expect_small_arrays(complete);
        for (const std::size_t length : {0U, 7U, 8U}) { // before the first record
            talcmp::NetcdfFile without =
                opened(std::string_view(bytes).substr(0, header.size() + length));
            EXPECT_EQ(without.open("field")->shape(), (talcmp::Shape{0, 3})) << length;
        }
    }
}

// The last piece may lack its padding, which is not part of any array.
TEST(NetcdfFiles, MayEndWithoutPadding) {
    for (const std::uint64_t records : {std::uint64_t{2}, unknown_count(1)}) {
        const File file = {
            1,
            records,
            {{"t", 0}},
            {},
            {{"one", {0}, netcdf::type_short, 0}, {"two", {0}, netcdf::type_byte, 4}}};
        const std::string data = padded(elements<std::int16_t>({1})) + padded("a")
                                 + padded(elements<std::int16_t>({2})) + "b";
        const std::string bytes = netcdf::header(file) + data;
        talcmp::NetcdfFile opened_file = opened(bytes);
        expect_array<std::int16_t>(opened_file, "one", {2}, {1, 2});
        expect_array<std::int8_t>(opened_file, "two", {2}, {'a', 'b'});
    }
}

// ---- From any place on

struct Records {
    const char* name;
    std::size_t count;
    std::size_t piece;  // shorts in each
    std::size_t others; // between the pieces
};

// Short records are read whole, up to 256 KiB of them at once.
const Records lengths[] = {
    {"WithoutOthers", 1000, 50, 0},
    {"OfSmallPieces", 1000, 2, 2},
    {"Short", 40, 1000, 2000},
    {"OfTheLongestReadWhole", 80, 2048, 2048},
    {"OfTheShortestReadInPieces", 80, 2048, 2050},
    {"ManyAndShort", 70000, 2, 4},
    {"One", 1, 10, 4},
};

class RecordsOf : public NamedCaseTest<Records> {};

File file_of(const Records& sizes) {
    File file = {2,
                 sizes.count,
                 {{"time", 0}, {"piece", sizes.piece}, {"others", sizes.others}},
                 {},
                 {{"v", {0, 1}, netcdf::type_short, 0}}};
    if (sizes.others != 0) {
        file.variables.push_back({"others", {0, 2}, netcdf::type_short, 2 * sizes.piece});
    } else {
        file.dimensions.pop_back();
    }
    return file;
}

TEST_P(RecordsOf, AreReadFromAnyPlaceOn) {
    const Records& sizes = GetParam();
    const std::string data = text_of_length(sizes.count * 2 * (sizes.piece + sizes.others));
    const std::string bytes = netcdf::header(file_of(sizes)) + data;
    std::string expected;
    for (std::size_t record = 0; record < sizes.count; ++record) {
        expected += data.substr(2 * record * (sizes.piece + sizes.others), 2 * sizes.piece);
    }
    for (std::size_t i = 0; i < expected.size(); i += 2) {
        std::swap(expected[i], expected[i + (npy::native == '<' ? 1 : 0)]);
    }
    const auto array = opened(bytes).open("v");
    const std::size_t all = sizes.count * sizes.piece;
    for (const std::size_t first : {std::size_t{0}, std::size_t{1}, sizes.piece - 1, sizes.piece,
                                    3 * sizes.piece, all / 2, all - 1}) {
        for (const std::size_t count : {std::size_t{0}, std::size_t{1}, std::size_t{2}, sizes.piece,
                                        2 * sizes.piece, 5 * sizes.piece + 3, all}) {
            if (first <= all && count <= all - first) {
                EXPECT_TRUE(read(*array, first, count) == expected.substr(2 * first, 2 * count))
                    << count << " from " << first << " on";
            }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Netcdf, RecordsOf, named_cases(lengths), name_of_case);

// ---- How often something is read

using Reads = std::vector<std::pair<std::uint64_t, std::size_t>>; // offsets and numbers of bytes

// Notes what is read.
class NotedBytes : public MemoryBytes {
  public:
    using MemoryBytes::MemoryBytes;

    std::size_t read(const std::uint64_t offset, void* const bytes,
                     const std::size_t count) override {
        reads_.emplace_back(offset, count);
        return MemoryBytes::read(offset, bytes, count);
    }

    const Reads& reads() const { return reads_; }
    void forget() { reads_.clear(); }

  private:
    Reads reads_;
};

TEST(NetcdfHeaders, AreReadAtOnceIfFilesKeepThem) {
    const std::string data = text_of_length(5000);
    const std::string bytes = netcdf::header(small_file(1)) + data;
    NotedBytes file(bytes);
    talcmp::read_netcdf_header(file);
    EXPECT_EQ(file.reads(), (Reads{{0, 4096}}));
}

// The reads of a whole variable that begins its file's data.
Reads reads_of(const Records& sizes) {
    const std::string header = netcdf::header(file_of(sizes));
    const std::string data = text_of_length(sizes.count * 2 * (sizes.piece + sizes.others));
    const std::string bytes = header + data;
    const auto file = std::make_shared<NotedBytes>(bytes);
    const auto array = talcmp::NetcdfFile("a.nc", file).open("v");
    file->forget();
    read_all(*array);
    Reads reads = file->reads();
    for (auto& [offset, count] : reads) {
        offset -= header.size();
    }
    return reads;
}

TEST(NetcdfVariables, AreReadAtOnceWhereNothingIsBetween) {
    EXPECT_EQ(reads_of({"", 10, 5000, 0}), (Reads{{0, 100000}}));
    EXPECT_EQ(reads_of({"", 1, 10, 4}), (Reads{{0, 20}}));
}

TEST(NetcdfVariables, AreReadInSpansOfShortRecords) {
    EXPECT_EQ(reads_of({"", 3, 2, 4}), (Reads{{0, 28}}));
    EXPECT_EQ(reads_of({"", 3, 2048, 2048}), (Reads{{0, 20480}}));
    // 21845 records of 12 bytes are nearly 256 KiB.
    EXPECT_EQ(reads_of({"", 70000, 2, 4}),
              (Reads{{0, 262132}, {262140, 262132}, {524280, 262132}, {786420, 53572}}));
}

TEST(NetcdfVariables, AreReadPieceByPieceOfLongRecords) {
    EXPECT_EQ(reads_of({"", 3, 2048, 2050}), (Reads{{0, 4096}, {8196, 4096}, {16392, 4096}}));
}

// ---- What is refused

// What a program says that reads everything: the first trouble, or "none".
std::string trouble_with(const std::string_view bytes) {
    return thrown_message([bytes] {
        talcmp::NetcdfFile file = opened(bytes);
        for (const std::string& member : file.members()) {
            read_all(*file.open(member));
        }
    });
}

std::string with_dimensions(const std::vector<netcdf::Dimension>& dimensions) {
    return netcdf::header({1, 0, dimensions, {}, {}});
}

std::string with_attribute(const netcdf::Attribute& attribute) {
    return netcdf::header({1, 0, {}, {attribute}, {}});
}

std::string with_variable(const netcdf::Variable& variable, const int version = 1) {
    return netcdf::header({version, 0, {{"x", 2}, {"t", 0}}, {}, {variable}});
}

constexpr std::uint64_t two_to_32 = std::uint64_t{1} << 32U;

// Of bytes, in the version that has 64-bit sizes.
std::string with_large_dimensions(const std::vector<std::uint64_t>& dimensions) {
    File file = {5, 0, {}, {}, {{"v", {}, netcdf::type_byte}}};
    for (const std::uint64_t length : dimensions) {
        file.variables[0].dimensions.push_back(file.dimensions.size());
        file.dimensions.push_back({"d", length});
    }
    return netcdf::header(file);
}

std::string with_records(const std::uint64_t records, const std::vector<std::uint64_t>& pieces) {
    File file = {5, records, {{"t", 0}}, {}, {}};
    for (const std::uint64_t piece : pieces) {
        const std::uint64_t id = file.dimensions.size();
        file.variables.push_back({"v" + std::to_string(id), {0, id}, netcdf::type_byte});
        file.dimensions.push_back({"d", piece});
    }
    return netcdf::header(file);
}

std::string in_a_stream(const std::string& data) {
    File file = small_file(1);
    file.records = unknown_count(1);
    return netcdf::header(file) + data;
}

struct BrokenFile {
    const char* name;
    std::string bytes;
    std::string message; // after the name of the file
};

std::string short_header(const std::string& there) {
    return ": ends inside its header (" + there + "); is the file complete?";
}

std::string expected_list(const std::string& what, const int position) {
    return ": has a broken header: expected a list of " + what + " at byte "
           + std::to_string(position);
}

const std::string no_netcdf =
    ": is not a netCDF file: it does not begin with CDF and the byte 1, 2 or 5";

const BrokenFile headers[] = {
    {"Empty", "", short_header("bytes of format and version expected: 4, bytes there: 0")},
    {"OneByteShortOfMagic", "CDF",
     short_header("bytes of format and version expected: 4, bytes there: 3")},
    {"WrongMagic", "CDG\1" + std::string(100, '\0'), no_netcdf},
    {"Version3", "CDF\3" + std::string(100, '\0'), no_netcdf},
    {"OnlyMagic", netcdf::magic(1), short_header("bytes of a number expected: 4, bytes there: 0")},
    {"OnlyMagic5", netcdf::magic(5), short_header("bytes of a number expected: 8, bytes there: 0")},
    {"NoLists", netcdf::magic(1) + netcdf::big_endian(0, 4),
     short_header("bytes of a number expected: 4, bytes there: 0")},
    {"WrongTagOfDimensions",
     netcdf::magic(1) + netcdf::big_endian(0, 4) + netcdf::big_endian(11, 4)
         + netcdf::big_endian(1, 4),
     expected_list("dimensions", 8)},
    {"WrongTagOfAttributes",
     netcdf::magic(1) + std::string(12, '\0') + netcdf::big_endian(10, 4)
         + netcdf::big_endian(0, 4),
     expected_list("attributes", 16)},
    {"WrongTagOfVariables",
     netcdf::magic(1) + std::string(20, '\0') + netcdf::big_endian(12, 4)
         + netcdf::big_endian(0, 4),
     expected_list("variables", 24)},
    {"EntriesWithoutTag",
     netcdf::magic(1) + std::string(8, '\0') + netcdf::big_endian(1, 4) + std::string(30, '\0'),
     expected_list("dimensions", 8)},
    {"TooManyDimensions",
     netcdf::magic(1) + netcdf::big_endian(0, 4) + netcdf::big_endian(10, 4)
         + netcdf::big_endian(1048577, 4),
     ": has a list of 1048577 dimensions; 1048576 are supported"},
    {"MoreDimensionsThanThere",
     netcdf::magic(1) + netcdf::big_endian(0, 4) + netcdf::big_endian(10, 4)
         + netcdf::big_endian(1048576, 4),
     short_header("bytes of a number expected: 4, bytes there: 0")},
    {"NegativeNumberOfDimensions",
     netcdf::magic(1) + netcdf::big_endian(0, 4) + netcdf::big_endian(10, 4)
         + netcdf::big_endian(0xFFFFFFFF, 4),
     ": has a list of 4294967295 dimensions; 1048576 are supported"},
    {"NegativeNumberOfDimensions5",
     netcdf::magic(5) + netcdf::big_endian(0, 8) + netcdf::big_endian(10, 4)
         + std::string(8, '\xFF'),
     ": has a list of 18446744073709551615 dimensions; 1048576 are supported"},
    {"LongName", with_dimensions({{std::string(1025, 'n'), 1}}),
     ": has a name of 1025 bytes; 1024 are supported"},
    {"NameBeyondTheFile", with_dimensions({{std::string(1024, 'n'), 1}}).substr(0, 1000),
     short_header("bytes of a name expected: 1024, bytes there: 980")},
    {"NoPaddingOfAName", with_dimensions({{"name1", 1}}).substr(0, 26),
     short_header("bytes of padding expected: 3, bytes there: 1")},
    {"TwoRecordDimensions", with_dimensions({{"t", 0}, {"x", 1}, {"u", 0}}),
     ": has a second record dimension, 'u'"},
    {"AttributeOfType0", with_attribute({"units", 0, 1, "m"}),
     ": has the attribute 'units' of the unknown type 0"},
    {"AttributeOfType7", with_attribute({"units", 7, 1, "m"}),
     ": has the attribute 'units' of the unknown type 7"},
    {"AttributeBeyondTheFile", with_attribute({"units", netcdf::type_double, 4294967295, "metres"}),
     short_header("values of an attribute expected: 4294967295, bytes there: 16")},
    {"AttributeOf2To64Bytes",
     netcdf::header({5, 0, {}, {{"u", netcdf::type_double, two_to_32 << 29U, ""}}, {}}),
     short_header("values of an attribute expected: 2305843009213693952, bytes there: 12")},
    {"AttributeWithoutPadding",
     with_attribute({"u", netcdf::type_byte, 1, ""}).substr(0, 40) + "12",
     short_header("bytes of padding expected: 3, bytes there: 1")},
};

const BrokenFile variables[] = {
    {"WithoutName", with_variable({"", {}, netcdf::type_int}), ": has a variable without a name"},
    {"OfOneName",
     netcdf::header({1, 0, {}, {}, {{"v", {}, netcdf::type_int}, {"v", {}, netcdf::type_int}}})
         + "data",
     ": has two variables of the name 'v'"},
    {"OfType0", with_variable({"v", {}, 0}), ": has the variable 'v' of the unknown type 0"},
    {"OfType7InVersion2", with_variable({"v", {}, 7}, 2),
     ": has the variable 'v' of the unknown type 7"},
    {"OfType12", with_variable({"v", {}, 12}, 5), ": has the variable 'v' of the unknown type 12"},
    {"OfTypeMinus1", with_variable({"v", {}, 0xFFFFFFFF}, 5),
     ": has the variable 'v' of the unknown type 4294967295"},
    {"OfUnknownDimension", with_variable({"v", {0, 2}, netcdf::type_int}),
     ": has the variable 'v' of the unknown dimension 2"},
    {"OfDimensionMinus1", with_variable({"v", {0xFFFFFFFF}, netcdf::type_int}),
     ": has the variable 'v' of the unknown dimension 4294967295"},
    {"OfTooManyDimensions",
     with_variable({"v", std::vector<std::uint64_t>(1025), netcdf::type_int}),
     ": has the variable 'v' of 1025 dimensions; 1024 are supported"},
    {"WithRecordsLast", with_variable({"v", {0, 1}, netcdf::type_int}),
     ": has the variable 'v', of which the record dimension is not the first"},
    {"WithRecordsTwice", with_variable({"v", {1, 1}, netcdf::type_int}),
     ": has the variable 'v', of which the record dimension is not the first"},
    {"InsideTheHeader", with_variable({"v", {0}, netcdf::type_int, std::uint64_t{0} - 4}) + "data",
     ": has the variable 'v' at byte 88, inside the header"},
    {"OfText", with_variable({"v", {0}, netcdf::type_char}) + "te",
     "[/v]: has elements of type char (text), which is not supported; save them as integers of 8 "
     "to 64 bits, float or double"},
    {"WithControlsInTheName", with_variable({"a\x1B[2Jb\n", {0, 2}, netcdf::type_int}),
     ": has the variable 'a?[2Jb?' of the unknown dimension 2"},
};

std::string too_little(const std::string& variable, const std::string& end,
                       const std::size_t file_size) {
    return "[/" + variable + "]: has less data than its shape says (its elements end at byte " + end
           + ", the file at byte " + std::to_string(file_size) + "); is the file complete?";
}

const std::string unfinished_record =
    ": ends inside a record, and does not say how many there are; is the file complete?";

const BrokenFile sizes[] = {
    {"OneByteShort", with_variable({"v", {0}, netcdf::type_int}) + "1234567",
     too_little("v", "100", 99)},
    {"WithoutData", with_variable({"v", {0}, netcdf::type_int}), too_little("v", "100", 92)},
    {"BeginBeyondTheFile",
     with_variable({"v", {0}, netcdf::type_int, 4294967295U - 92}) + "12345678",
     too_little("v", "4294967303", 100)},
    {"Begin2To64Minus1",
     with_variable({"v", {0}, netcdf::type_int, std::uint64_t{0} - 97}, 2) + "12345678",
     too_little("v", "2^64 or later", 104)},
    {"BytesOf2To64", with_large_dimensions({two_to_32, two_to_32}),
     ": has the variable 'v' of more than 2^64 - 1 bytes"},
    {"BytesOf2To64Minus1", with_large_dimensions({two_to_32 - 1, two_to_32 + 1}),
     too_little("v", "2^64 or later", 156)},
    {"RecordOf2To64", with_records(0, {two_to_32 << 31U, two_to_32 << 31U}),
     ": has records of more than 2^64 - 1 bytes"},
    {"RecordOf2To64WithItsPadding", with_records(0, {1, std::uint64_t{0} - 1}),
     ": has records of more than 2^64 - 1 bytes"},
    {"RecordsOf2To64", with_records(two_to_32, {two_to_32}),
     too_little("v1", "2^64 or later", 156)},
    {"ManyRecords", with_records(0xFFFFFFFFFFFFFFFE, {1}), too_little("v1", "2^64 or later", 156)},
    {"RecordsThatAreMissing", with_records(1000000, {1, 3}), too_little("v1", "8000237", 244)},
    {"LastPieceOneByteShort", small_bytes(1).substr(0, small_bytes(1).size() - 1),
     too_little("field", std::to_string(small_bytes(1).size()), small_bytes(1).size() - 1)},
    {"StreamOneByteShort", in_a_stream(small_data.substr(0, small_data.size() - 1)),
     unfinished_record},
    {"StreamOneByteLong", in_a_stream(small_data + 'x'), unfinished_record},
    {"StreamWithHalfARecord", in_a_stream(small_data.substr(0, 12)), unfinished_record},
};

class BrokenNetcdf : public NamedCaseTest<BrokenFile> {};

TEST_P(BrokenNetcdf, IsRefused) {
    EXPECT_EQ(trouble_with(GetParam().bytes), "a.nc" + GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(Header, BrokenNetcdf, named_cases(headers), name_of_case);
INSTANTIATE_TEST_SUITE_P(Variable, BrokenNetcdf, named_cases(variables), name_of_case);
INSTANTIATE_TEST_SUITE_P(Size, BrokenNetcdf, named_cases(sizes), name_of_case);

TEST(BrokenNetcdfFiles, HaveVariablesThatCanBeReadNevertheless) {
    const std::string bytes = small_bytes(1);
    talcmp::NetcdfFile file = opened(std::string_view(bytes).substr(0, bytes.size() - 1));
    expect_array<std::int16_t>(file, "fixed", {3}, {1, -2, 300});
    expect_array<std::int8_t>(file, "level", {2}, {-7, 8});
}

// Text is no reason to refuse other variables.
TEST(BrokenNetcdfFiles, AreNotThoseWithText) {
    const std::string bytes =
        netcdf::header({1, 0, {}, {}, {{"a", {}, netcdf::type_char}, {"b", {}, netcdf::type_byte}}})
        + "xy";
    talcmp::NetcdfFile file = opened(bytes);
    EXPECT_THROW(file.open("a"), talcmp::NotNumbers);
    expect_array<std::int8_t>(file, "b", {}, {'x'});
}

// Bytes of which some have gone since the size was asked for.
class ShortenedBytes : public MemoryBytes {
  public:
    ShortenedBytes(const std::string_view bytes, const std::uint64_t size)
        : MemoryBytes(bytes), size_(size) {}
    std::optional<std::uint64_t> size() const override { return size_; }

  private:
    std::uint64_t size_;
};

TEST(ShortenedNetcdfFiles, AreRefusedAtEveryLength) {
    const std::string bytes = small_bytes(1);
    for (std::size_t length = 0; length < bytes.size(); ++length) {
        SCOPED_TRACE(length);
        const std::string_view there = std::string_view(bytes).substr(0, length);
        const std::string message = thrown_message([&] {
            talcmp::NetcdfFile file("a.nc", std::make_shared<ShortenedBytes>(there, bytes.size()));
            for (const std::string& member : file.members()) {
                read_all(*file.open(member));
            }
        });
        if (length < bytes.size() - small_data.size()) {
            EXPECT_EQ(message.substr(0, 30), "a.nc: ends inside its header (") << message;
        } else {
            EXPECT_EQ(message, "a.nc[/field]: has become shorter since it was opened; is it still "
                               "being written?");
        }
    }
}

// ---- Systematically broken files

// Where no memory follows, so that a read past the file is noticed.
std::string_view at_end(const ProtectedMemory& memory, const std::string& bytes) {
    auto* const place = static_cast<char*>(memory.before_end(bytes.size()));
    std::copy(bytes.begin(), bytes.end(), place);
    return {place, bytes.size()};
}

class NetcdfVersions : public testing::TestWithParam<int> {};

TEST_P(NetcdfVersions, AreRefusedAtEveryLength) {
    const std::string whole = small_bytes(GetParam());
    const ProtectedMemory memory(whole.size());
    for (std::size_t length = 0; length < whole.size(); ++length) {
        const std::string message = trouble_with(at_end(memory, whole.substr(0, length)));
        EXPECT_NE(message.find("is the file complete?"), std::string::npos)
            << length << ": " << message;
    }
}

// Any other exception than Trouble fails the test, and so would a large allocation.
TEST_P(NetcdfVersions, AreReadOrRefusedWithAnyByteChanged) {
    const std::string whole = small_bytes(GetParam());
    const ProtectedMemory memory(whole.size());
    for (std::size_t position = 0; position < whole.size(); ++position) {
        for (int value = 0; value < 256; ++value) {
            SCOPED_TRACE("byte " + std::to_string(position) + " is " + std::to_string(value));
            std::string changed = whole;
            changed[position] = static_cast<char>(value);
            const std::string message = trouble_with(at_end(memory, changed));
            EXPECT_TRUE(message == "none" || message.substr(0, 4) == "a.nc") << message;
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Version, NetcdfVersions, testing::ValuesIn(all_versions));

} // namespace
