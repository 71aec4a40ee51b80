// Files that talcmp refuses: each with a message that names the file and says what is wrong.

#include "npy_header.h"

#include "../support/protected_memory.h"
#include "support/memory_bytes.h"
#include "support/named_cases.h"
#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"
#include "support/thrown_message.h"
#include "support/zip_bytes.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <string>
#include <vector>

#include <sys/stat.h>
#include <unistd.h>

namespace {

const std::string two_reals = npy::elements<double>({1, 2});
const std::string real = npy::descr<double>();
const std::string good_dictionary = npy::dictionary(real, "False", "(2,)");
const std::string good_length = npy::little_endian(good_dictionary.size(), 2);

std::string file(const std::string& dictionary) {
    return npy::header(dictionary) + two_reals;
}

std::string with_descr(const std::string& descr) {
    return file(npy::dictionary(descr, "False", "(2,)"));
}

std::string with_order(const std::string& fortran_order) {
    return file(npy::dictionary(real, fortran_order, "(2,)"));
}

std::string with_shape(const std::string& shape) {
    return file(npy::dictionary(real, "False", shape));
}

// A good file, except for its version and the length that its header gives the dictionary.
std::string with_beginning(const int major, const int minor, const std::string& length) {
    return npy::magic + npy::version(major, minor) + length + good_dictionary + two_reals;
}

std::string shape_of_ones(const int rank) {
    std::string shape = "(";
    for (int i = 0; i < rank; ++i) {
        shape += "1, ";
    }
    return shape + ")";
}

std::string quoted(const char byte_order, const std::string& code) {
    return "'" + (byte_order + code) + "'";
}

void expect_errors(const ProcessResult& outcome, const std::string& message) {
    EXPECT_EQ(outcome.status, 2);
    EXPECT_EQ(outcome.output, "");
    EXPECT_EQ(outcome.errors, "talcmp: " + message + "\n");
}

void expect_refused(const TemporaryFolder& folder, const std::string& broken,
                    const std::string& message) {
    const std::string good = folder.write("good.npy", file(good_dictionary));
    expect_errors(run_talcmp({broken, good}), broken + message);
    expect_errors(run_talcmp({good, broken}), broken + message);
}

// ---- Files with something wrong in them

struct BrokenFile {
    const char* name;
    std::string bytes;
    std::string message;     // after the name of the file
    std::string member = {}; // in brackets, if the message is about one
};

std::string short_header(const std::string& there) {
    return "ends inside its header: " + there + "; is the file complete?";
}

std::string unknown_version(const std::string& version) {
    return "has format version " + version + "; versions 1.0, 2.0 and 3.0 are supported";
}

std::string expected(const std::string& what, const int position) {
    return "has a broken header: expected " + what + " at byte " + std::to_string(position)
           + " of the dictionary";
}

std::string too_little(const std::string& count, const int bytes) {
    return "has less data than its shape says (" + count + " elements of 8 bytes, but "
           + std::to_string(bytes) + " bytes); is the file complete?";
}

std::string surplus(const int bytes) {
    return "has more data than its shape says (bytes after the array: " + std::to_string(bytes)
           + "); save one array per file";
}

// The message about a type, which is given with its quotes.
std::string unsupported_type(const std::string& type, const std::string& kind = "") {
    return "has elements of type " + type + kind
           + ", which is not supported; save them as booleans, integers of 8 to 64 bits, float16 "
             "to "
             "float64, complex64 or complex128";
}

std::string orderless(const std::string& type) {
    return "has elements of type " + type + " without a byte order; save the array with NumPy";
}

const BrokenFile beginnings[] = {
    {"Empty", "", "is empty; an .npy file was expected"},
    {"WrongMagic", "\x93NUMPI" + file(good_dictionary).substr(6),
     "is not an .npy file: it does not begin with \\x93NUMPY"},
    {"OneByteShortOfMagic", "\x93NUMP", "is not an .npy file: it does not begin with \\x93NUMPY"},
    {"Archive", "PK\x03\x04 and so on",
     "is a broken .npz archive: Not a zip archive; is the file complete?"},
    {"EmptyArchive", "PK\x05\x06",
     "is a broken .npz archive: Not a zip archive; is the file complete?"},
    {"OnlyMagic", npy::magic, short_header("2 bytes of version expected, 0 there")},
    {"HalfAVersion", npy::magic + std::string("\1"),
     short_header("2 bytes of version expected, 1 there")},
    {"Version0", with_beginning(0, 0, good_length), unknown_version("0.0")},
    {"Version4", with_beginning(4, 0, good_length), unknown_version("4.0")},
    {"Version1_1", with_beginning(1, 1, good_length), unknown_version("1.1")},
    {"Version255", with_beginning(255, 255, good_length), unknown_version("255.255")},
    {"NoLength", npy::magic + npy::version(1, 0),
     short_header("2 bytes of header length expected, 0 there")},
    {"HalfALength1", npy::magic + npy::version(1, 0) + "v",
     short_header("2 bytes of header length expected, 1 there")},
    {"HalfALength2", npy::magic + npy::version(2, 0) + "abc",
     short_header("4 bytes of header length expected, 3 there")},
    {"Length0", with_beginning(1, 0, npy::little_endian(0, 2)), expected("a dictionary", 0)},
    {"Length0Version3", with_beginning(3, 0, npy::little_endian(0, 4)),
     expected("a dictionary", 0)},
    {"LengthBeyondTheFile", with_beginning(1, 0, "\xFF\xFF"),
     short_header("65535 bytes of dictionary expected, 73 there")},
    {"LengthOf4GiB", with_beginning(2, 0, "\xFF\xFF\xFF\xFF"),
     short_header("4294967295 bytes of dictionary expected, 73 there")},
    {"LengthOf2To20And1", npy::header(std::string(1048577, ' '), 2),
     "has a header of 1048577 bytes; 2^20 are supported"},
    {"LengthOf2To20", npy::header(std::string(1048576, ' '), 2), expected("a dictionary", 1048576)},
    {"LengthOneTooLong",
     npy::magic + npy::version(1, 0) + npy::little_endian(good_dictionary.size() + 1, 2)
         + good_dictionary,
     short_header("58 bytes of dictionary expected, 57 there")},
};

const BrokenFile dictionaries[] = {
    {"List", file("['descr', 'fortran_order', 'shape']"), expected("a dictionary", 0)},
    {"Spaces", file("      "), expected("a dictionary", 6)},
    {"Unclosed", file(good_dictionary.substr(0, good_dictionary.size() - 1)),
     expected("a string in quotes", 56)},
    {"UnclosedString", file("{'descr: "), expected("a string with a closing quote", 1)},
    {"MismatchedQuotes", file("{'descr\": 0}"), expected("a string with a closing quote", 1)},
    {"NoColon", file("{'descr' " + real + "}"), expected("':'", 9)},
    {"NoComma", file("{'descr': " + real + " 'shape': (2,)}"), expected("',' or '}'", 16)},
    {"LeadingComma", file("{, 'descr': " + real + "}"), expected("a string in quotes", 1)},
    {"NumberAsKey", file("{1: 2}"), expected("a string in quotes", 1)},
    {"Nothing", file("{}"), "has a header without the key 'descr'"},
    {"NoDescr", file("{'fortran_order': False, 'shape': (2,)}"),
     "has a header without the key 'descr'"},
    {"NoOrder", file("{'descr': " + real + ", 'shape': (2,)}"),
     "has a header without the key 'fortran_order'"},
    {"NoShape", file("{'descr': " + real + ", 'fortran_order': False}"),
     "has a header without the key 'shape'"},
    {"DoubledKey", file("{'shape': (2,), 'shape': (2,)}"),
     "has a header with the key 'shape' twice"},
    {"UnknownKey", file("{'colour': 'red'}"), "has a header with the unknown key 'colour'"},
    {"LongKey", file("{'" + std::string(60000, 'k') + "': 1}"),
     "has a header with the unknown key 'kkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkkk...'"},
    {"TrailingRubbish", file(good_dictionary + " rubbish"),
     expected("nothing after the dictionary", 58)},
    {"TrailingNul", file(good_dictionary + '\0'), expected("nothing after the dictionary", 57)},
    {"NulsOnly", file(std::string(20, '\0')), expected("a dictionary", 0)},
    {"NulInKey", file(std::string("{'sha\0pe': 1}", 13)),
     "has a header with the unknown key 'sha?pe'"},
    {"NonAsciiKey", file("{'sh\xC3\xA4pe': 1}"), "has a header with the unknown key 'sh??pe'"},
    {"NonAsciiDescr", with_descr("'<\xC3\xA4'"), unsupported_type("'<?\?'")},
    {"EscapeInKey", file("{'\x1B[31m\n': 1}"), "has a header with the unknown key '?[31m?'"},
};

const BrokenFile shapes[] = {
    {"NoCommaForOneDimension", with_shape("(2)"),
     expected("a shape of one dimension with a ',' after it", 53)},
    {"List", with_shape("[2]"), expected("a shape in parentheses", 50)},
    {"Number", with_shape("2"), expected("a shape in parentheses", 50)},
    {"String", with_shape("'(2,)'"), expected("a shape in parentheses", 50)},
    {"Unclosed", with_shape("(2, "), expected("a dimension", 54)},
    {"OnlyComma", with_shape("(,)"), expected("a dimension", 51)},
    {"TwoCommas", with_shape("(2,,)"), expected("a dimension", 53)},
    {"NoCommaBetween", with_shape("(1 2)"), expected("',' or ')'", 53)},
    {"Nested", with_shape("((2,),)"), expected("a dimension", 51)},
    {"NameAsDimension", with_shape("(two,)"), expected("a dimension", 51)},
    {"FloatDimension", with_shape("(2.0,)"), expected("',' or ')'", 52)},
    {"HexadecimalDimension", with_shape("(0x2,)"), expected("',' or ')'", 52)},
    {"NegativeDimension", with_shape("(-2,)"), "has a shape with a negative dimension"},
    {"TwoNegativeDimensions", with_shape("(-1, -2)"), "has a shape with a negative dimension"},
    {"MinusZero", with_shape("(-0,)"), "has a shape with a negative dimension"},
    {"DimensionOf2To64And2", with_shape("(18446744073709551618,)"),
     "has a shape with a dimension above 2^64 - 1"},
    {"DimensionOf30Digits", with_shape("(" + std::string(30, '9') + ",)"),
     "has a shape with a dimension above 2^64 - 1"},
    {"CountOf2To65", with_shape("(4294967296, 4294967296, 2)"),
     too_little("more than 2^64 - 1", 16)},
    {"CountOf2To64And2", with_shape("(9223372036854775809, 2)"),
     too_little("more than 2^64 - 1", 16)},
    {"BytesOf2To64", with_shape("(2305843009213693952,)"), too_little("2305843009213693952", 16)},
    {"BytesOf2To64And16", with_shape("(2305843009213693954,)"),
     too_little("2305843009213693954", 16)},
    {"Zero", with_shape("(2, 0)"), surplus(16)},
    {"ZeroTimes2To64", with_shape("(0, 4294967296, 4294967296)"), surplus(16)},
    {"TooManyDimensions", with_shape(shape_of_ones(65)), "has a shape of more than 64 dimensions"},
    {"NoData", npy::header(good_dictionary), too_little("2", 0)},
    {"DataOneByteShort", npy::header(good_dictionary) + two_reals.substr(1), too_little("2", 15)},
    {"DataOneByteLong", file(good_dictionary) + 'x', surplus(1)},
    {"ScalarOneByteLong", with_shape("()") + 'x', surplus(9)},
};

const BrokenFile unsupported[] = {
    {"OrderAsString", with_order("'False'"), expected("True or False", 34)},
    {"OrderAsNumber", with_order("0"), expected("True or False", 34)},
    {"OrderInLowerCase", with_order("false"), expected("True or False", 34)},
    {"OrderWithTail", with_order("Falsehood"), expected("',' or '}'", 39)},
    {"Objects", with_descr("'|O'"), unsupported_type("'|O'", " (Python objects)")},
    {"Structure", with_descr("[('x', '<f8'), ('y', '<f8')]"),
     "has structured elements; save each field as an array of its own"},
    {"NestedStructure", with_descr("[('x', [('y', '<f8')])]"),
     "has structured elements; save each field as an array of its own"},
    {"Subarray", with_descr("('<f8', (2,))"),
     "has structured elements; save each field as an array of its own"},
    {"WideBoolean", with_descr("'<b2'"), unsupported_type("'<b2'")},
    {"HalfComplex", with_descr(npy::descr_of('c', 4)), unsupported_type(npy::descr_of('c', 4))},
    {"LongDouble", with_descr(npy::descr_of('f', 16)),
     unsupported_type(npy::descr_of('f', 16), " (extended precision)")},
    {"LongComplex", with_descr(npy::descr_of('c', 32)),
     unsupported_type(npy::descr_of('c', 32), " (extended precision)")},
    {"WideInteger", with_descr(npy::descr_of('i', 16)), unsupported_type(npy::descr_of('i', 16))},
    {"OddInteger", with_descr(npy::descr_of('i', 3)), unsupported_type(npy::descr_of('i', 3))},
    {"Bytes", with_descr("'|S8'"), unsupported_type("'|S8'", " (text)")},
    {"Characters", with_descr("'<U2'"), unsupported_type("'<U2'", " (text)")},
    {"Void", with_descr("'|V8'"), unsupported_type("'|V8'", " (raw bytes)")},
    {"Dates", with_descr("'<M8[ns]'"), unsupported_type("'<M8[ns]'", " (dates or times)")},
    {"Durations", with_descr("'<m8[s]'"), unsupported_type("'<m8[s]'", " (dates or times)")},
    {"NativeByteOrder", with_descr("'=f8'"), orderless("'=f8'")},
    {"NotApplicableByteOrder", with_descr("'|f8'"), orderless("'|f8'")},
    {"NoByteOrder", with_descr("'f8'"), orderless("'f8'")},
    {"OneCharacter", with_descr("'f'"), orderless("'f'")},
    {"OnlyByteOrder", with_descr(quoted(npy::native, "")),
     unsupported_type(quoted(npy::native, ""))},
    {"EmptyDescr", with_descr("''"), orderless("''")},
    {"SpaceAfterDescr", with_descr(quoted(npy::native, "f8 ")),
     unsupported_type(quoted(npy::native, "f8 "))},
    {"NumberAsDescr", with_descr("8"), expected("a string in quotes", 10)},
    {"NoneAsDescr", with_descr("None"), expected("a string in quotes", 10)},
};

const std::string two_of_one_name = "has two members of the name 'a'";

const BrokenFile archives[] = {
    {"TwoMembersOfOneName", zipped::archive({{"a.npy"}, {"b.npy"}, {"a.npy"}}), two_of_one_name},
    // NumPy gives both arrays this name.
    {"NamesWithAndWithoutSuffix", zipped::archive({{"a"}, {"a.npy"}}), two_of_one_name},
    {"UnknownMethod", zipped::archive({{"a.npy", file(good_dictionary), 0, 97}}),
     "cannot be opened: Compression method not supported", "[a]"},
    {"WrongChecksum", zipped::archive({{"a.npy", file(good_dictionary)}}),
     "cannot be read: CRC error; is the archive damaged?", "[a]"},
};

class BrokenFiles : public NamedCaseTest<BrokenFile> {};

TEST_P(BrokenFiles, AreRefused) {
    const TemporaryFolder folder;
    const std::string broken = folder.write("broken.npy", GetParam().bytes);
    expect_refused(folder, broken, GetParam().member + ": " + GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(Beginning, BrokenFiles, named_cases(beginnings), name_of_case);
INSTANTIATE_TEST_SUITE_P(Dictionary, BrokenFiles, named_cases(dictionaries), name_of_case);
INSTANTIATE_TEST_SUITE_P(Shape, BrokenFiles, named_cases(shapes), name_of_case);
INSTANTIATE_TEST_SUITE_P(Elements, BrokenFiles, named_cases(unsupported), name_of_case);
INSTANTIATE_TEST_SUITE_P(Archive, BrokenFiles, named_cases(archives), name_of_case);

// ---- What cannot be opened

TEST(Operands, ThatCannotBeOpenedAreRefused) {
    const TemporaryFolder folder;
    const std::string path = folder.path_of("broken.npy");
    expect_refused(folder, path, ": cannot be opened: No such file or directory");
    std::filesystem::create_symlink(path, path);
    expect_refused(folder, path, ": cannot be opened: Too many levels of symbolic links");
    std::filesystem::remove(path);
    std::filesystem::create_symlink("/dev/null", path);
    expect_refused(folder, path, ": is neither a file nor a pipe; save the array to a file first");
}

TEST(Operands, ThatMayNotBeReadAreRefused) {
    if (::geteuid() == 0) {
        GTEST_SKIP() << "the superuser can read any file";
    }
    const TemporaryFolder folder;
    const std::string path = folder.write("broken.npy", file(good_dictionary));
    ASSERT_EQ(::chmod(path.c_str(), 0), 0);
    expect_refused(folder, path, ": cannot be opened: Permission denied");
}

// ---- Systematically broken files

TEST(Truncations, AreRefusedAtEveryLength) {
    const TemporaryFolder folder;
    const std::string whole = file(good_dictionary);
    const std::string good = folder.write("good.npy", whole);
    for (std::size_t length = 0; length < whole.size(); ++length) {
        SCOPED_TRACE(length);
        const std::string broken = folder.write("broken.npy", whole.substr(0, length));
        expect_trouble(run_talcmp({broken, good}), broken + ": ", "");
    }
}

// Reads the header where no memory follows, so that a read past the file is noticed.
talcmp::NpyHeader read_at_end(const ProtectedMemory& memory, const std::string& bytes) {
    auto* const place = static_cast<char*>(memory.before_end(bytes.size()));
    std::copy(bytes.begin(), bytes.end(), place);
    MemoryBytes file({place, bytes.size()});
    return talcmp::read_npy_header(file);
}

// Any other exception than NpyError fails the test.
void expect_header_or_error(const ProtectedMemory& memory, const std::string& bytes) {
    try {
        const talcmp::NpyHeader header = read_at_end(memory, bytes);
        EXPECT_NE(header.type.type, nullptr);
        EXPECT_LE(header.element_count, bytes.size() - header.data_offset);
    } catch (const talcmp::NpyError& error) {
        const std::string message = error.what();
        EXPECT_FALSE(message.empty());
        EXPECT_TRUE(std::all_of(message.begin(), message.end(), [](const char c) {
            return c >= ' ' && c <= '~';
        })) << message;
    }
}

class Headers : public testing::TestWithParam<int> {};

TEST_P(Headers, AreReadOrRefusedWithAnyByteChanged) {
    const std::string header = npy::header(good_dictionary, GetParam());
    const ProtectedMemory memory(header.size() + two_reals.size());
    for (std::size_t position = 0; position < header.size(); ++position) {
        for (int value = 0; value < 256; ++value) {
            SCOPED_TRACE("byte " + std::to_string(position) + " is " + std::to_string(value));
            std::string changed = header + two_reals;
            changed[position] = static_cast<char>(value);
            expect_header_or_error(memory, changed);
        }
    }
}

TEST_P(Headers, AreRefusedWithTheDictionaryCutAnywhere) {
    const ProtectedMemory memory(npy::header(good_dictionary, GetParam()).size());
    for (std::size_t length = 0; length <= good_dictionary.size(); ++length) {
        const std::string header = npy::header(good_dictionary.substr(0, length), GetParam());
        EXPECT_THROW(read_at_end(memory, header), talcmp::NpyError) << length;
    }
}

// ---- Files whose length is known only at their end

std::string wrong_in_stream(const std::string& shape) {
    const std::string bytes = npy::header(npy::dictionary(real, "False", shape));
    MemoryStream stream(bytes);
    return thrown_message<talcmp::NpyError>([&stream] { talcmp::read_npy_header(stream); });
}

TEST(Streams, AreRefusedWhereTheirElementsCannotBeCounted) {
    const std::string too_many = "has a shape of more than 2^58 elements";
    EXPECT_EQ(wrong_in_stream("(2, 3)"), "none");
    EXPECT_EQ(wrong_in_stream("(288230376151711744,)"), "none"); // 2^58
    EXPECT_EQ(wrong_in_stream("(288230376151711745,)"), too_many);
    EXPECT_EQ(wrong_in_stream("(4294967296, 4294967296)"), too_many);
}

INSTANTIATE_TEST_SUITE_P(Version, Headers, testing::Values(1, 2, 3));

} // namespace
