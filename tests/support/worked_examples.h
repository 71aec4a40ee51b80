// Worked examples of the rule. They let a reader trust the oracle before it judges the module, and
// they test the module directly. No answer depends on what has been compared before.

#pragma once

#include "taldata_array_element_types.h"

#include "tolerances.h"

#include <complex>
#include <cstring>
#include <iterator>
#include <limits>
#include <vector>

// ---- Two reals of one type: -1, 0 (the same) or +1

struct ExampleOfReals {
    const char* name;
    double tolerance;
    double x;
    double y;
    int result;
};

inline constexpr double infinity = std::numeric_limits<double>::infinity();
inline constexpr double nan_of_doubles = std::numeric_limits<double>::quiet_NaN();

inline constexpr ExampleOfReals examples_of_doubles[] = {
    {"below the limit", 10, 1.0, 1.0 + 0x1p-44, 0},
    {"above the limit", 10, 1.0, 1.0 + 0x1p-42, -1},
    {"above the limit, swapped", 10, 1.0 + 0x1p-42, 1.0, 1},
    {"at the limit from below one", 10, 1.0 - 0x1p-43, 1.0, -1},
    {"just inside the limit from below one", 10, 1.0 - 0x1p-43 + 0x1p-53, 1.0, 0},
    {"at the limit below one", 10, 0.5 - 0x1p-44, 0.5, -1},
    {"just inside the limit below one", 10, 0.5 - 0x1p-44 + 0x1p-54, 0.5, 0},
    {"last digit under one digit", 1, 1.0, 1.0 + 0x1p-52, 0},
    {"last digit under half a digit", 0.5, 1.0, 1.0 + 0x1p-52, -1},
    {"last digit under none", 0, 1.0, 1.0 + 0x1p-52, -1},
    {"last digit under minus zero", -0.0, 1.0, 1.0 + 0x1p-52, -1},
    {"last digit under less than none", -7, 1.0 + 0x1p-52, 1.0, 1},
    {"seventh decimal", 30, 5.0, 5.0000001, 0},
    {"fifth decimal", 30, 5.0, 5.00001, -1},
    {"zero and tiny", 60, 0.0, 1e-300, -1},
    {"tiny and zero", 60, 1e-300, 0.0, 1},
    {"zero above negative", 60, 0.0, -1e-300, 1},
    {"negative below zero", 60, -1e-300, 0.0, -1},
    {"zeros of both signs", 10, 0.0, -0.0, 0},
    {"zeros of both signs under none", 0, -0.0, 0.0, 0},
    {"opposite signs", 60, 1.0, -1.0, 1},
    {"two negatives", 10, -1.0, -3.0, 1},
    {"two negatives, swapped", 10, -3.0, -1.0, -1},
    {"two negatives, near", 10, -1.0, -1.0 - 0x1p-44, 0},
    {"two negatives, near, swapped", 10, -1.0 - 0x1p-44, -1.0, 0},
    {"all digits tolerated", 53, 1.0, 1e300, 0},
    {"all digits tolerated up to infinity", 53, 1.0, infinity, 0},
    {"all digits tolerated, NaN", 53, nan_of_doubles, 1.0, 0},
    {"all digits tolerated, zero", 53, 0.0, 1.0, -1},
    {"all digits tolerated, zero second", 53, 1.0, 0.0, 1},
    {"more than all digits", 1e300, 1.0, 1e300, 0},
    {"infinite tolerance", infinity, 1.0, 1e300, 0},
    {"infinity and huge", 10, infinity, 1e308, 1},
    {"huge and infinity", 10, 1e308, infinity, -1},
    {"equal infinities", 10, infinity, infinity, 0},
    {"equal negative infinities", 0, -infinity, -infinity, 0},
    {"opposite infinities", 60, -infinity, infinity, -1},
    {"vanishing", 10, 1.0, 1e-17, 1},
    {"vanishing under nearly all digits", 52.99, 1.0, 1e-17, 1},
    {"NaN and one", 10, nan_of_doubles, 1.0, -1},
    {"one and NaN", 10, 1.0, nan_of_doubles, -1},
    {"NaN and NaN", 10, nan_of_doubles, nan_of_doubles, -1},
    {"NaN and minus one", 10, nan_of_doubles, -1.0, 1},
    {"minus one and NaN", 10, -1.0, nan_of_doubles, -1},
    {"NaN and minus one under none", 0, nan_of_doubles, -1.0, 1},
    {"zero and NaN", 10, 0.0, nan_of_doubles, -1},
    {"NaN and zero", 10, nan_of_doubles, 0.0, 1},
    {"NaN tolerance", nan_of_doubles, 1.0, 1.0 + 0x1p-52, -1},
    {"NaN tolerance, swapped", nan_of_doubles, 1.0 + 0x1p-52, 1.0, 1},
    {"NaN tolerance, equal", nan_of_doubles, 1.5, 1.5, 0},
    {"subnormals", 10, 0x1p-1070, 0x1p-1074, 1},
    {"below one the difference is scaled", 10, 0x1.4p-1031 - 0x1p-1074, 0x1.4p-1031, 0},
    {"leading digit of subnormals", 52, 0x3p-1074, 0x5p-1074, 0},
    {"subnormals, near", 51, 0x1.8p-1070, 0x1.7p-1070, 0},
};

// ---- Elements of any two types, the same or not in either order

class ExampleElement {
  public:
    template <typename T>
    ExampleElement(const T element) : type_(element_type_id<T>) { // NOLINT(*-explicit-*)
        static_assert(sizeof(T) <= sizeof bytes_);
        std::memcpy(bytes_, &element, sizeof(T));
    }

    type_t type() const { return type_; }
    void* data() { return bytes_; }
    const void* data() const { return bytes_; }

  private:
    type_t type_;
    alignas(16) unsigned char bytes_[16] = {};
};

struct ExampleOfElements {
    std::vector<double> tolerances;
    ExampleElement element1;
    ExampleElement element2;
    bool same;
};

inline std::vector<ExampleOfElements> examples_of_elements() {
    using C32 = std::complex<float>;
    using C64 = std::complex<double>;
    constexpr double nan = nan_of_doubles;
    constexpr float single_nan = std::numeric_limits<float>::quiet_NaN();
    constexpr UBIT64 largest = std::numeric_limits<UBIT64>::max();
    const std::vector<double> all(std::begin(every_tolerance), std::end(every_tolerance));
    // Rounded first to a double it would be midway between two singles and go to the even one.
    constexpr BIT64 above_midway = (BIT64{1} << 60) + (BIT64{1} << 36) + 1;
    return {
        // Integers, by value.
        {all, BIT8{-1}, UBIT8{255}, false},
        {all, BIT8{-1}, largest, false},
        {all, BIT64{-1}, largest, false},
        {all, UBIT8{200}, BIT8{-56}, false},
        {all, UBIT32{4294967295}, BIT64{4294967295}, true},
        {all, BIT16{-5}, BIT64{-5}, true},
        {all, BIT16{5}, BIT32{6}, false},
        {all, BIT64{261}, UBIT8{5}, false},
        {all, BIT16{258}, BIT16{258}, true},
        {all, BIT16{258}, BIT16{259}, false},
        {all, BIT16{258}, BIT16{2}, false},

        // An integer and a real, whose type decides.
        {all, BIT32{16777217}, 16777216.0F, true},
        {{0, 20}, BIT32{16777217}, 16777216.0, false},
        {{30}, BIT32{16777217}, 16777216.0, true},
        {all, BIT64{9007199254740993}, 9007199254740992.0, true},
        {all, UBIT64{9007199254740993}, 9007199254740992.0, true},
        {{0}, BIT64{9007199254740993}, 9007199254740994.0, false},
        {all, BIT32{0}, -0.0, true},
        {{30}, BIT32{5}, 5.0000001, true},
        {{30}, BIT32{5}, 5.00001, false},
        {{30}, BIT64{1}, 1000.0F, true},
        {{30}, BIT64{1}, 1000.0, false},
        {{0}, above_midway, 0x1.000002p60F, true},
        {{0}, above_midway, 0x1p60F, false},

        // Reals, by their bits under a tolerance of zero.
        {{0, -0.0}, 0.0, -0.0, false},
        {{-1, 1e-300, 1e-10, 1, 53, nan}, 0.0, -0.0, true},
        {{0}, nan, nan, true},
        {{0}, nan, -nan, false},
        {{1e-10, 10, -10}, nan, nan, false},
        {{53}, nan, nan, true}, // neither is zero nor negative
        {{53}, nan, 1.0, true},
        {{53}, nan, -1.0, false},
        {{53}, nan, 0.0, false},
        {{0}, single_nan, single_nan, true},
        {{0}, single_nan, -single_nan, false},
        {{10}, single_nan, single_nan, false},

        // A tolerance that is zero only as a single.
        {{1e-300}, 0.0F, -0.0F, true},
        {{1e-300}, 1.0F, 1.0F + 0x1p-23F, false},
        {{1e-300}, single_nan, single_nan, false},

        // Reals of two widths, never by their bits.
        {{0}, 1.0F, 1.0, true},
        {{0}, 0.0F, -0.0, true},
        {{0, 20}, 0.1F, 0.1, false},
        {{30}, 0.1F, 0.1, true},

        // A complex number and another, whose imaginary part must be zero.
        {all, BIT8{5}, C64(5, 0), true},
        {all, BIT8{5}, C64(5, -0.0), true},
        {all, BIT8{5}, C64(5, 1e-300), false},
        {all, BIT8{5}, C64(5, nan), false},
        {all, BIT16{2}, C32(2, 3), false},
        {all, BIT32{16777217}, C32(16777216, 0), true},
        {{0}, BIT32{16777217}, C64(16777216, 0), false},
        {{30}, BIT32{5}, C64(5.0000001, 0), true},
        {{10}, BIT32{5}, C64(5.0000001, 0), false},
        {{30}, 5.0, C64(5.0000001, 0), true},
        {{10}, 5.0, C64(5.0000001, 0), false},
        {{20}, 0.1, C32(0.1F, 0), false}, // a double decides here too
        {{20}, 0.1F, C32(0.1F, 0), true},

        // Two complex numbers, part by part.
        {all, C64(1, 0), C64(1, 1e-300), false},
        {{10}, C64(1e10, 1.0), C64(1e10, 1.001), false}, // though near each other beside 1e10
        {{10}, C64(1.0, 1e10), C64(1.001, 1e10), false},
        {{45}, C64(1.0, 1e10), C64(1.001, 1e10), true},
        {{0}, C64(0.0, 0), C64(-0.0, 0), false},
        {{1e-10}, C64(0.0, 0), C64(-0.0, 0), true},
        {{0}, C64(0, 0.0), C64(0, -0.0), false},
        {{1e-10}, C64(0, 0.0), C64(0, -0.0), true},
        {{0}, C32(single_nan, 1), C32(single_nan, 1), true},
        {{1e-10}, C32(single_nan, 1), C32(single_nan, 1), false},
        {{0}, C32(1.5F, -2), C64(1.5, -2), true},
        {{0}, C32(0.0F, -0.0F), C64(-0.0, 0.0), true},
        {{0}, C32(1, 0.0F), C64(1, -0.0), true},
        {{20}, C32(0.1F, 0), C64(0.1, 0), false},
        {{30}, C32(0.1F, 0), C64(0.1, 0), true},
        {{1e-46}, C32(0.0F, 0), C32(-0.0F, 0), true},
        {{1e-46, 0x1p-150}, C32(1, 0), C32(1.0000001F, 0), false},
        {{1e300}, C32(1, 2), C32(1000, 2000), true},
        {{1e300}, C32(1, 2), C32(1000, -2), false},
    };
}
