// What talcmp answers about arrays that it can read, and to command lines that it cannot.

#include "taldata_array_element_types.h"

#include "../support/element_types.h"
#include "../support/emulation.h"
#include "support/named_cases.h"
#include "support/npy_bytes.h"
#include "support/run_talcmp.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <string>
#include <utility>
#include <vector>

namespace {

using npy::array;
using Options = std::vector<std::string>;
using Reals = std::vector<double>;

// Arrays of rank 1.
const auto i8 = npy::row<std::int8_t>;
const auto u8 = npy::row<std::uint8_t>;
const auto i16 = npy::row<std::int16_t>;
const auto i32 = npy::row<std::int32_t>;
const auto i64 = npy::row<std::int64_t>;
const auto u64 = npy::row<std::uint64_t>;
const auto f32 = npy::row<float>;
const auto f64 = npy::row<double>;
const auto c64 = npy::row<std::complex<float>>;
const auto c128 = npy::row<std::complex<double>>;

// What is said of a tolerance that may be meant as an error.
std::string note_of(const Options& arguments) {
    for (const char* const tolerance : {"0.5", "1e-10"}) {
        if (arguments.front() == std::string("--tol=") + tolerance) {
            return std::string("talcmp: note: --tol ") + tolerance + " means " + tolerance
                   + " binary digits; a relative error is --relative " + tolerance + "\n";
        }
    }
    return "";
}

// Writes both files and expects the answer, which is nothing where `difference` is empty.
void expect_answer(const TemporaryFolder& folder, Options arguments, const std::string& first,
                   const std::string& second, const std::string& difference) {
    const std::string path1 = folder.write("a.npy", first);
    const std::string path2 = folder.write("b.npy", second);
    arguments.insert(arguments.end(), {path1, path2});
    const ProcessResult outcome = run_talcmp(arguments);
    const bool same = difference.empty();
    EXPECT_EQ(outcome.status, same ? 0 : 1);
    EXPECT_EQ(outcome.output, same ? "" : path1 + " " + path2 + " differ: " + difference + "\n");
    EXPECT_EQ(outcome.errors, note_of(arguments));
}

// ---- Pairs of files

struct Answer {
    const char* name;
    std::string first; // the bytes of the files
    std::string second;
    std::string difference = {}; // empty where the arrays are the same
    std::string option = {};
};

// An array of one element that is given by its bits.
template <typename T, typename Bits>
std::string of_bits(const Bits bits) {
    return npy::header(npy::dictionary(npy::descr<T>(), "False", "(1,)")) + npy::element(bits);
}

const std::string nan1 = of_bits<double>(std::uint64_t{0x7FF8000000000123});
const std::string nan2 = of_bits<double>(std::uint64_t{0xFFF8000000000456});
constexpr double infinity = std::numeric_limits<double>::infinity();

const Answer values[] = {
    {"SeveralDifferences", f64({1, 2, 3, 4}), f64({1, 9, 8, 4}),
     "[1]: 2 and 9 (no digit in common)"},
    {"TenthAsSingle", f32({0.1F}), f32({0.3F}), "[0]: 0.1 and 0.3 (no digit in common)"},
    {"TenthAsDouble", f64({0.1}), f64({0.1F}),
     "[0]: 0.1 and 0.10000000149011612 (the same from --tol 27 on)"},
    {"LeastSingle", f32({1e-45F}), f32({std::nextafter(1.0F, 2.0F)}),
     "[0]: 1e-45 and 1.0000001 (no digit in common)"},
    {"NextDouble", f64({1}), f64({std::nextafter(1.0, 2.0)}),
     "[0]: 1 and 1.0000000000000002 (the same from --tol 1 on)"},
    {"OneDigitInCommon", f64({1, 3}), f64({std::nextafter(2.0, 1.0), 2}),
     "[0]: 1 and 1.9999999999999998 (the same from --tol 52 on)"},
    {"OneDigitInCommonOfSingles", f32({1}), f32({std::nextafter(2.0F, 1.0F)}),
     "[0]: 1 and 1.9999999 (the same from --tol 23 on)"},
    {"NoDigitInCommon", f64({0.709}), f64({1.709}), "[0]: 0.709 and 1.709 (no digit in common)"},
    {"NoDigitInCommonOfNegatives", f64({-1}), f64({-2}), "[0]: -1 and -2 (no digit in common)"},
    {"NoDigitInCommonWithAnInfinity", f64({5}), f64({infinity}),
     "[0]: 5 and inf (no digit in common)"},
    {"NoDigitInCommonOfRealParts", c128({{1, 1}}), c128({{2, 3}}),
     "[0]: 1+1j and 2+3j (real parts: no digit in common)"},
    {"NoDigitInCommonOfImaginaryParts", c64({{1, 1}}), c64({{1.5F, 2}}),
     "[0]: 1+1j and 1.5+2j (imaginary parts: no digit in common)"},
    {"RealPartsBeforeImaginaryOnes", c64({{1, 1}}), c64({{2, -1}}),
     "[0]: 1+1j and 2-1j (real parts: no digit in common)"},
    {"NoDigitInCommonOfHugeRealParts", c128({{1e300, 1}}), c128({{4e300, 1.5}}),
     "[0]: 1e+300+1j and 4e+300+1.5j (real parts: no digit in common)"},
    {"NumberAndNaN", f64({-1}), nan1, "[0]: -1 and nan(0x7ff8000000000123) (a NaN)"},
    {"ZeroAndNaN", f64({0}), nan1, "[0]: 0 and nan(0x7ff8000000000123) (a NaN)"},
    {"IntegerAndNaN", i32({1}), nan1, "[0]: 1 and nan(0x7ff8000000000123) (a NaN)"},
    {"LimitsOfDouble", f64({5e-324}), f64({-1.7976931348623157e308}),
     "[0]: 5e-324 and -1.7976931348623157e+308 (opposite signs)"},
    {"Infinities", f64({infinity}), f64({-infinity}), "[0]: inf and -inf (opposite signs)"},
    {"Bytes", i8({-128}), i8({127}), "[0]: -128 and 127 (different integers)"},
    {"UnsignedBytes", u8({65}), u8({255}), "[0]: 65 and 255 (different integers)"},
    {"LimitsOfInt64", i64({INT64_MIN}), i64({INT64_MAX}),
     "[0]: -9223372036854775808 and 9223372036854775807 (different integers)"},
    {"LimitOfUint64", u64({UINT64_MAX}), u64({0}),
     "[0]: 18446744073709551615 and 0 (different integers)"},
    {"ComplexSingles", c64({{0.1F, -2}}), c64({{0.1F, 2}}),
     "[0]: 0.1-2j and 0.1+2j (imaginary parts: opposite signs)"},
    {"ComplexMinusZero", c128({{1, -0.0}}), c128({{1, 0.0}}),
     "[0]: 1-0j and 1+0j (the same from --tol 1 on)"},
    {"Zeros", f64({-0.0}), f64({0.0}), "[0]: -0 and 0 (the same from --tol 1 on)"},
    {"EqualNaNs", nan1, nan1},
    {"UnequalNaNs", nan1, nan2,
     "[0]: nan(0x7ff8000000000123) and nan(0xfff8000000000456) (two NaNs)"},
    {"SingleNaN", of_bits<float>(std::uint32_t{0x7FC00ABC}), f32({1}),
     "[0]: nan(0x7fc00abc) and 1 (a NaN)"},
};

const std::string near_far = f64({1.1, 2.5});
const std::string far_near = f64({2.5, 1.1});

const Answer tolerances[] = {
    {"Within", f64({1}), f64({1 + 0x1p-52}), "", "--tol=2"},
    {"Outside", f64({1}), f64({1 + 0x1p-51}),
     "[0]: 1 and 1.0000000000000004 (the same from --tol 2 on)", "--tol=1"},
    {"WithinAsSingles", f32({1}), f32({1 + 0x1p-23F}), "", "--tol=2"},
    {"OutsideAsSingles", f32({1}), f32({1 + 0x1p-22F}),
     "[0]: 1 and 1.0000002 (the same from --tol 2 on)", "--tol=1"},
    {"Half", f64({1, 1}), f64({1, 2}), "[1]: 1 and 2 (no digit in common)", "--tol=0.5"},
    {"AllDigits", f64({1}), f64({2}), "", "--tol=53"},
    {"NegativeForZeros", f64({-0.0}), f64({0.0}), "", "--tol=-1"},
    {"Negative", f64({1}), f64({1 + 0x1p-52}),
     "[0]: 1 and 1.0000000000000002 (the same from --tol 1 on)", "--tol=-1"},
    {"Huge", f64({1}), f64({1e300}), "", "--tol=1e300"},
    {"Infinite", f64({1}), f64({1e300}), "", "--tol=inf"},
    {"InfiniteForZero", f64({1}), f64({0}), "[0]: 1 and 0 (zero is the same only as zero)",
     "--tol=inf"},
    {"ZerosUnderZero", f64({-0.0}), f64({0.0}), "[0]: -0 and 0 (the same from --tol 1 on)",
     "--tol=0"},
    {"ZerosUnderTiny", f64({-0.0}), f64({0.0}), "", "--tol=1e-10"},
    {"NaNsUnderZero", nan1, nan1, "", "--tol=0.0"},
    {"NaNsUnderOne", nan1, nan1,
     "[0]: nan(0x7ff8000000000123) and nan(0x7ff8000000000123) "
     "(NaNs of the same bits are the same under --tol 0)",
     "--tol=1"},
    {"Integers", i32({7}), i32({8}), "[0]: 7 and 8 (different integers)", "--tol=100"},
    {"NearThenFar", f64({1, 1}), near_far, "", "--tol=52.5"},
    {"FarThenNear", f64({1, 1}), far_near, "", "--tol=52.5"},
    {"NearFarThenNegative", f64({1, 1, 1, 1, 1}), f64({1, 1.1, 2.5, 2.5, -1}),
     "[4]: 1 and -1 (opposite signs)", "--tol=52.5"},
};

const std::string no_singles = f32({});
const std::string no_doubles = f64({});

const Answer types_and_shapes[] = {
    {"IntegersAndReals", i16({-3, 0}), f32({-3, -0.0F})},
    {"IntegerAndReal", u8({3}), f64({3.5}), "[0]: 3 and 3.5 (the same from --tol 51 on)"},
    {"IntegerAndSingle", i64({1}), f32({2}), "[0]: 1 and 2 (no digit in common)"},
    {"SingleAndInteger", f32({2}), i8({3}), "[0]: 2 and 3 (the same from --tol 23 on)"},
    {"IntegerAndDouble", i8({1}), f64({2}), "[0]: 1 and 2 (no digit in common)"},
    {"SingleAndDouble", f32({1}), f64({1.25}), "[0]: 1 and 1.25 (the same from --tol 51 on)"},
    {"SinglesAndComplexSingles", f32({1}), c64({{2, 0}}),
     "[0]: 1 and 2+0j (real parts: no digit in common)"},
    {"ComplexNaN", c128({{1, std::numeric_limits<double>::quiet_NaN()}}), f64({1}),
     "[0]: 1+nan(0x7ff8000000000000)j and 1 (imaginary parts: a NaN)"},
    {"IntegersOfOnePattern", i64({-1}), u64({UINT64_MAX}),
     "[0]: -1 and 18446744073709551615 (different integers)"},
    {"RealsAndComplex", f32({2}), c128({{2, -0.0}})},
    {"RealAndComplex", f64({2}), c64({{2, 1}}),
     "[0]: 2 and 2+1j (imaginary parts: zero is the same only as zero)"},
    {"OneTextInTwoTypes", f32({0.1F}), f64({0.1}),
     "[0]: 0.10000000149011612 and 0.1 (the same from --tol 27 on)"},
    {"OneTextInTwoComplexTypes", c64({{1, 0.1F}}), c128({{1, 0.1}}),
     "[0]: 1+0.10000000149011612j and 1+0.1j (the same from --tol 27 on)"},
    {"TwoTypesWithinTolerance", f64({0.1}), f32({0.1F}), "", "--tol=30"},
    {"StrictType", f32({1}), f64({1}), "type float32 and float64", "--strict-type"},
    {"StrictTypeOfOneType", f32({1}), f32({1}), "", "--strict-type"},
    {"NoElements", no_singles, no_doubles},
    {"StrictTypeOfNoElements", no_singles, no_doubles, "type float32 and float64", "--strict-type"},
    {"Shapes", array("(2, 3)", Reals(6)), array("(3, 2)", Reals(6)), "shape (2, 3) and (3, 2)"},
    {"Ranks", array("(1,)", Reals(1)), array("()", Reals(1)), "shape (1,) and ()"},
    {"ShapesBeforeTypes", f32({1}), f64({1, 2}), "shape (1,) and (2,)", "--strict-type"},
    {"ShapesWithoutElements", array("(0, 2)", Reals()), array("(0, 3)", Reals()),
     "shape (0, 2) and (0, 3)"},
    {"ShapesEqualIn32Bits", array("(0, 4294967297)", Reals()), array("(0, 1)", Reals()),
     "shape (0, 4294967297) and (0, 1)"},
    {"HugeShapesWithoutElements", array("(0, 18446744073709551615, 2)", Reals()),
     array("(0, 18446744073709551615, 2)", Reals())},
    {"Scalars", array("()", Reals{1}), array("()", Reals{1})},
    {"ThreeAxes", array("(1, 2, 2)", Reals{1, 1, 1, 1}), array("(1, 2, 2)", Reals{1, 1, 2, 1}),
     "[0, 1, 0]: 1 and 2 (no digit in common)"},
    {"DifferentScalars", array("()", Reals{1}), array("()", Reals{2}),
     "[]: 1 and 2 (no digit in common)"},
};

// The array [1. 2.], with the text before and after its element type in the dictionary.
std::string spelled(const std::string& before, const std::string& after) {
    const std::string descr = npy::native + std::string("f8");
    return npy::header(before + descr + after) + npy::elements<double>({1, 2});
}

const std::string one_two = f64({1, 2});

const Answer spellings[] = {
    {"LongOfPython2", one_two,
     spelled("{'descr': '", "', 'fortran_order': False, 'shape': (2L,), }")},
    {"DoubleQuotes", one_two,
     spelled(R"({"descr": ")", R"(", "fortran_order": False, "shape": (2,)})")},
    {"OtherOrder", one_two, spelled("{'shape': (2,), 'fortran_order': False, 'descr': '", "'}")},
    {"NoSpaces", one_two, spelled("{'descr':'", "','fortran_order':False,'shape':(2,)}")},
    {"ManySpaces", one_two,
     spelled("  { 'descr'\t: '", "' , 'fortran_order' : False , 'shape' : ( 2 , ) , }  \n \n")},
    {"LeadingZeros", one_two,
     spelled("{'descr': '", "', 'fortran_order': False, 'shape': (00000000000000000000002,)}")},
    {"ScalarWithSpace", array("()", Reals{1}), array("( )", Reals{1})},
};

class Answers : public NamedCaseTest<Answer> {};

TEST_P(Answers, AreGiven) {
    const Answer& answer = GetParam();
    expect_answer(TemporaryFolder(), answer.option.empty() ? Options() : Options{answer.option},
                  answer.first, answer.second, answer.difference);
}

INSTANTIATE_TEST_SUITE_P(Value, Answers, named_cases(values), name_of_case);
INSTANTIATE_TEST_SUITE_P(Tolerance, Answers, named_cases(tolerances), name_of_case);
INSTANTIATE_TEST_SUITE_P(Record, Answers, named_cases(types_and_shapes), name_of_case);
INSTANTIATE_TEST_SUITE_P(Spelling, Answers, named_cases(spellings), name_of_case);

// ---- Parts of arrays

struct Part {
    const char* name;
    std::string slice;
    std::string difference = {}; // empty where the parts are the same
};

// Of arrays of the shape (3, 4) that differ in [1, 2] and [2, 0].
const Part parts[] = {
    {"Whole", ":", "[1, 2]: 0 and 5 (different integers)"},
    {"FirstRow", "0"},
    {"LastRow", "-1", "[2, 0]: 0 and 7 (different integers)"},
    {"Column", ":,2", "[1, 2]: 0 and 5 (different integers)"},
    {"OneElement", "1,2", "[1, 2]: 0 and 5 (different integers)"},
    {"EverySecondRow", "::2", "[2, 0]: 0 and 7 (different integers)"},
    {"EverySecondColumn", ":,1::2"},
    {"Spaces", " 1 : 2 , : 2 "},
    {"PastTheEnd", "1:100,3:9223372036854775807"},
    {"BeforeTheBeginning", "-9223372036854775808:1"},
    {"Nothing", "2:1"},
    {"LongStep", "1::9223372036854775807", "[1, 2]: 0 and 5 (different integers)"},
};

class Parts : public NamedCaseTest<Part> {};

TEST_P(Parts, AreComparedAlone) {
    const std::vector<std::int32_t> zeros(12);
    std::vector<std::int32_t> others(12);
    others[6] = 5;
    others[8] = 7;
    expect_answer(TemporaryFolder(), {"--slice=" + GetParam().slice}, array("(3, 4)", zeros),
                  array("(3, 4)", others), GetParam().difference);
}

INSTANTIATE_TEST_SUITE_P(Slice, Parts, named_cases(parts), name_of_case);

TEST(Parts, MayBeOfArraysOfDifferentShapes) {
    const TemporaryFolder folder;
    expect_answer(folder, {"--slice=:2"}, f64({1, 2, 3}), f64({1, 2}), "");
    expect_answer(folder, {"--slice=1:"}, f64({1, 2, 3}), f64({1, 2}), "shape (2,) and (1,)");
    expect_answer(folder, {"--slice=0"}, array("(1, 2)", Reals(2)), f64({0, 0}),
                  "shape (2,) and ()");
}

// ---- All types, versions, places and alignments

// talcmp starts slowly in an emulator. A stride of seven leaves out no version of the format and no
// type.
constexpr std::size_t stride = std::min<std::size_t>(emulated_stride, 7);

const std::string type_names[] = {"int8",    "uint8",   "int16",     "uint16",
                                  "int32",   "uint32",  "int64",     "uint64",
                                  "float32", "float64", "complex64", "complex128"};

const std::string& name_of_type(const type_t id) {
    return type_names[id - 1];
}

// The array [1, 100] of each type, with `spaces` spaces after the dictionary.
template <typename... Types>
std::vector<std::string> files_of(type_list<Types...> /*types*/, const int version,
                                  const std::size_t spaces, const char byte_order = npy::native) {
    const auto header = [&](const std::string& descr) {
        const std::string dictionary = npy::dictionary(descr, "False", "(2,)");
        return npy::header(dictionary + std::string(spaces, ' '), version);
    };
    return {header(npy::descr<Types>(byte_order))
            + npy::elements<Types>({Types(1), Types(100)}, byte_order)...};
}

TEST(EveryType, IsReadInEveryVersionAndAtEveryOffset) {
    const TemporaryFolder folder;
    const auto plain = files_of(element_type_list{}, 1, 0);
    for (std::size_t variant = 0; variant < 24; variant += stride) {
        const int version = 1 + static_cast<int>(variant % 3);
        const auto files = files_of(element_type_list{}, version, variant / 3);
        for (std::size_t i = 0; i < files.size(); ++i) {
            SCOPED_TRACE(type_names[i] + std::to_string(variant));
            expect_answer(folder, {"--strict-type"}, plain[i], files[i], "");
        }
    }
}

TEST(EveryType, IsReadInEitherByteOrder) {
    const TemporaryFolder folder;
    const auto native = files_of(element_type_list{}, 1, 0);
    for (const std::size_t spaces : {0U, 1U}) {
        const auto swapped = files_of(element_type_list{}, 1, spaces, npy::swapped);
        for (std::size_t i = 0; i < swapped.size(); ++i) {
            SCOPED_TRACE(type_names[i] + std::to_string(spaces));
            expect_answer(folder, {"--strict-type"}, native[i], swapped[i], "");
            expect_answer(folder, {"--strict-type"}, swapped[i], native[i], "");
        }
    }
}

TEST(OtherByteOrder, IsNotSeenInTheAnswer) {
    const TemporaryFolder folder;
    using Complex = std::complex<float>;
    std::vector<Complex> row(200000, Complex(1, 2));
    const std::string dictionary =
        npy::dictionary(npy::descr<Complex>(npy::swapped), "False", "(200000,)");
    const std::string first = npy::header(dictionary) + npy::elements(row, npy::swapped);
    row[199998] = Complex(1, 3);
    expect_answer(folder, {}, first, npy::row(row),
                  "[199998]: 1+2j and 1+3j (the same from --tol 23 on)");
}

TEST(EveryType, IsComparedByValueWithEveryOther) {
    const TemporaryFolder folder;
    const auto files = files_of(element_type_list{}, 1, 0);
    std::size_t pairs = 0;
    for_each_pair([&](const ElementType& type1, const ElementType& type2) {
        if (++pairs % stride != 0) {
            return;
        }
        const std::string name1 = name_of_type(type1.id);
        const std::string name2 = name_of_type(type2.id);
        const std::string& first = files[static_cast<std::size_t>(type1.id - 1)];
        const std::string& second = files[static_cast<std::size_t>(type2.id - 1)];
        expect_answer(folder, {}, first, second, "");
        expect_answer(folder, {"--strict-type"}, first, second,
                      name1 == name2 ? "" : "type " + name1 + " and " + name2);
    });
}

// Far more elements than are compared at once, at an offset that is or is not a multiple of 8.
class Slices : public testing::TestWithParam<std::size_t> {
  protected:
    static std::string file(const Reals& elements) {
        const std::string shape = "(" + std::to_string(elements.size()) + ",)";
        std::string dictionary = npy::dictionary(npy::descr<double>(), "False", shape);
        while (npy::header(dictionary).size() % 8 != GetParam()) {
            dictionary += ' ';
        }
        return npy::header(dictionary) + npy::elements(elements);
    }
};

TEST_P(Slices, DifferWhereTheArraysDo) {
    const TemporaryFolder folder;
    const Reals ones(200000, 1.0);
    expect_answer(folder, {}, file(ones), file(ones), "");
    for (const unsigned position : {0U, 65535U, 65536U, 65537U, 199999U}) {
        Reals elements = ones;
        elements[position] = elements.back() = 2.5;
        expect_answer(folder, {}, file(ones), file(elements),
                      "[" + std::to_string(position) + "]: 1 and 2.5 (no digit in common)");
    }
}

// The answer about a pair does not depend on earlier pairs, even under a tolerance that leaves less
// than one digit.
TEST_P(Slices, DoNotDependOnEachOther) {
    const TemporaryFolder folder;
    const Reals ones(131072, 1.0);
    for (const unsigned position : {5U, 70000U}) {
        const auto expect = [&](const double near, const double far, const std::string& answer) {
            Reals elements = ones;
            elements[10] = near;
            elements[position] = far;
            expect_answer(folder, {"--tol=52.5"}, file(ones), file(elements), answer);
        };
        expect(1, 2.5, "");
        expect(1.1, 2.5, "");
        expect(1.1, 4, "[" + std::to_string(position) + "]: 1 and 4 (no digit in common)");
    }
}

INSTANTIATE_TEST_SUITE_P(Offset, Slices, testing::Values(0U, 1U, 4U));

// ---- Command lines

TEST(CommandLine, AsksForHelpOrTheVersion) {
    const std::pair<const char*, const char*> questions[] = {
        {"--help", "--strict-type"}, {"-h", "Exit status: 0"}, {"--version", "talcmp "}};
    for (const auto& [option, answer] : questions) {
        const ProcessResult outcome = run_talcmp({option});
        EXPECT_EQ(outcome.status, 0) << option;
        EXPECT_NE(outcome.output.find(answer), std::string::npos) << outcome.output;
        EXPECT_EQ(outcome.errors, "");
    }
}

TEST(CommandLine, MayAskForAnAnswerAboutEqualArraysToo) {
    const TemporaryFolder folder;
    const std::string path = folder.write("a.npy", f64({1, 2}));
    EXPECT_EQ(run_talcmp({"-v", path, path}).output, path + " " + path + " are the same\n");
    EXPECT_EQ(run_talcmp({"-v", "--slice=5:", path, path}).output,
              path + " " + path + " are the same (no elements)\n");
}

// ---- A standard output that takes nothing

class Outputs : public testing::TestWithParam<Output> {
  protected:
    void SetUp() override {
        if (GetParam() == Output::full && !std::filesystem::exists("/dev/full")) {
            GTEST_SKIP() << "there is no /dev/full";
        }
    }

    static void expect_no_answer(const std::vector<std::string>& arguments) {
        SCOPED_TRACE(arguments[0].substr(0, 40));
        expect_trouble(run_talcmp(arguments, GetParam()), "standard output: ", "");
    }
};

TEST_P(Outputs, AreTroubleWhenThereIsSomethingToSay) {
    const TemporaryFolder folder;
    const std::string one = folder.write("a.npy", f64({1}));
    const std::string two = folder.write("b.npy", f64({2}));
    expect_no_answer({one, two});
    expect_no_answer({"--help"});
    expect_no_answer({"--version"});
    EXPECT_EQ(run_talcmp({one, one}, GetParam()).status, 0);
}

// An answer that does not fit the buffer of standard output is written before it is complete.
TEST_P(Outputs, AreTroubleForALongAnswer) {
    const TemporaryFolder folder;
    const std::string one = folder.write("a.npy", f64(Reals(1000, 1)));
    const std::string two = folder.write("b.npy", f64(Reals(1000, 2)));
    expect_no_answer({"-n1000", one, two});
}

std::string name_of_output(const testing::TestParamInfo<Output>& output) {
    return output.param == Output::full ? "Full" : "Closed";
}

INSTANTIATE_TEST_SUITE_P(Standard, Outputs, testing::Values(Output::closed, Output::full),
                         name_of_output);

} // namespace
