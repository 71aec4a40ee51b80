#include "oracle.h"

#include <algorithm>
#include <cfenv>
#include <cmath>
#include <cstring>
#include <limits>

namespace oracle {
namespace {

// ---- Element types

enum class Kind { signed_integer, unsigned_integer, real, complex };

struct ElementType {
    Kind kind;
    std::size_t part_size;
};

bool is_known(int type_id) {
    return type_id >= 1 && type_id <= 12;
}

ElementType element_type(int type_id) {
    static const ElementType types[] = {
        {Kind::signed_integer, 1}, {Kind::unsigned_integer, 1},
        {Kind::signed_integer, 2}, {Kind::unsigned_integer, 2},
        {Kind::signed_integer, 4}, {Kind::unsigned_integer, 4},
        {Kind::signed_integer, 8}, {Kind::unsigned_integer, 8},
        {Kind::real, 4},           {Kind::real, 8},
        {Kind::complex, 4},        {Kind::complex, 8},
    };
    return types[type_id - 1];
}

bool is_integer(ElementType type) {
    return type.kind == Kind::signed_integer || type.kind == Kind::unsigned_integer;
}

bool is_wide_real(ElementType type) {
    return !is_integer(type) && type.part_size == 8;
}

// ---- Numbers: an integer by its sign and magnitude, a real by its value

struct Number {
    bool is_integer;
    bool negative;
    std::uint64_t magnitude;
    double real;
    std::size_t size; // of an integer, in bytes
};

Number integer_number(std::int64_t value, std::size_t size) {
    const auto bits = static_cast<std::uint64_t>(value);
    return value < 0 ? Number{true, true, 0 - bits, 0, size} : Number{true, false, bits, 0, size};
}

Number natural_number(std::uint64_t value, std::size_t size) {
    return {true, false, value, 0, size};
}

Number real_number(double value) {
    return {false, false, 0, value, 0};
}

struct Element {
    Number real;
    Number imaginary;
};

// ---- Decoding

template <typename T>
T load(const unsigned char* at) {
    T value;
    std::memcpy(&value, at, sizeof value);
    return value;
}

// One of the four integers, by its size.
template <typename I8, typename I16, typename I32, typename I64>
I64 load_integer(const unsigned char* at, std::size_t size) {
    switch (size) {
    case 1:
        return load<I8>(at);
    case 2:
        return load<I16>(at);
    case 4:
        return load<I32>(at);
    default:
        return load<I64>(at);
    }
}

constexpr auto load_signed = load_integer<std::int8_t, std::int16_t, std::int32_t, std::int64_t>;
constexpr auto load_unsigned =
    load_integer<std::uint8_t, std::uint16_t, std::uint32_t, std::uint64_t>;

double load_real(const unsigned char* at, std::size_t size) {
    return size == 4 ? static_cast<double>(load<float>(at)) : load<double>(at);
}

// An element that is not complex gets an imaginary part of zero.
Element decode(ElementType type, const unsigned char* at) {
    const std::size_t size = type.part_size;
    const Number zero = real_number(0);
    switch (type.kind) {
    case Kind::signed_integer:
        return {integer_number(load_signed(at, size), size), zero};
    case Kind::unsigned_integer:
        return {natural_number(load_unsigned(at, size), size), zero};
    case Kind::real:
        return {real_number(load_real(at, size)), zero};
    default:
        return {real_number(load_real(at, size)), real_number(load_real(at + size, size))};
    }
}

Element element_at(const Array& array, std::int32_t index) {
    const auto* bytes = static_cast<const unsigned char*>(array.data);
    const std::size_t offset = static_cast<std::size_t>(index) * element_size(array.type_id);
    return decode(element_type(array.type_id), bytes + offset);
}

// 32-bit ARM has no instruction that converts an integer of 64 bits, and the routine that does it
// rounds to nearest whatever the direction of rounding.
#if defined(__arm__)
constexpr std::size_t widest_converted_by_instruction = 4;
#else
constexpr std::size_t widest_converted_by_instruction = 8;
#endif

// Whether the direction of rounding takes a magnitude between two reals to the greater one; to
// nearest, a magnitude midway goes to the even one.
bool goes_up(const Number& integer, std::uint64_t kept, std::uint64_t rest, std::uint64_t half) {
    const bool by_instruction = integer.size <= widest_converted_by_instruction;
    switch (by_instruction ? std::fegetround() : FE_TONEAREST) {
    case FE_UPWARD:
        return !integer.negative;
    case FE_DOWNWARD:
        return integer.negative;
    case FE_TOWARDZERO:
        return false;
    default:
        return rest > half || (rest == half && kept % 2 == 1);
    }
}

// Rounds to `digits` binary digits in integer arithmetic, so that an integer becomes a single in
// one rounding, whatever conversion the compiler would choose.
double rounded(const Number& integer, int digits) {
    const std::uint64_t magnitude = integer.magnitude;
    int dropped = 0;
    while (((magnitude >> dropped) >> digits) != 0) {
        ++dropped;
    }
    std::uint64_t kept = magnitude >> dropped;
    if (dropped > 0) {
        const std::uint64_t rest = magnitude - (kept << dropped);
        const std::uint64_t half = std::uint64_t{1} << (dropped - 1);
        kept += rest > 0 && goes_up(integer, kept, rest, half) ? 1 : 0;
    }
    return std::ldexp(static_cast<double>(kept), dropped);
}

double value_of(const Number& number, int digits) {
    if (!number.is_integer) {
        return number.real;
    }
    const double magnitude = rounded(number, digits);
    return number.negative ? -magnitude : magnitude;
}

// ---- Tolerant comparison

// Called through volatile pointers, because a compiler may replace pow(2, x) by exp2(x), and the
// two differ in the last digit.
double (*volatile power_of_doubles)(double, double) = std::pow;
float (*volatile power_of_singles)(float, float) = std::pow;

// The factor is looked up last, and a pair whose leading digits differ returns before it replaces
// the cached one. Doubling the difference rounds only when it overflows, and then it is the larger.
template <typename Real>
int compare_reals(FactorCache& cache, Real (*factor_of)(Real), Real tolerance, Real x, Real y) {
    constexpr Real digits = std::numeric_limits<Real>::digits;
    if (x == y) {
        return 0;
    }
    if (x == 0) {
        return y < 0 ? 1 : -1;
    }
    if (y == 0 || (x < 0) != (y < 0)) {
        return x < 0 ? -1 : 1;
    }
    const int order = x > y ? 1 : -1;
    if (tolerance <= 0) {
        return order;
    }
    if (tolerance >= digits) {
        return 0;
    }
    const Real larger = std::max(std::fabs(x), std::fabs(y));
    // Not the absolute value of x - y, as a negative difference may be rounded differently.
    const Real difference = x > y ? x - y : y - x;
    if (difference == larger) {
        return order;
    }
    if (!(tolerance == static_cast<Real>(cache.last_tolerance))) {
        if (difference + difference >= larger) {
            return order;
        }
        cache = {static_cast<double>(tolerance), static_cast<double>(factor_of(tolerance))};
    }
    const Real factor = static_cast<Real>(cache.factor);
    const bool within = larger >= 1 ? difference < larger * factor : difference / factor < larger;
    return within ? 0 : order;
}

bool same_numbers(State& state, double tolerance, bool wide, const Number& x, const Number& y) {
    if (x.is_integer && y.is_integer) {
        return x.negative == y.negative && x.magnitude == y.magnitude;
    }
    if (wide) {
        return compare_doubles(state, tolerance, value_of(x, 53), value_of(y, 53)) == 0;
    }
    const auto narrow = [](double value) { return static_cast<float>(value); };
    return compare_singles(state, narrow(tolerance), narrow(value_of(x, 24)),
                           narrow(value_of(y, 24)))
           == 0;
}

// ---- Arrays

bool same_elements(State& state, double tolerance, const Array& first, const Array& second,
                   std::int32_t index) {
    const ElementType first_type = element_type(first.type_id);
    const ElementType second_type = element_type(second.type_id);
    const bool wide = is_wide_real(first_type) || is_wide_real(second_type);
    const Element x = element_at(first, index);
    const Element y = element_at(second, index);
    if (!same_numbers(state, tolerance, wide, x.real, y.real)) {
        return false;
    }
    if (first_type.kind == Kind::complex && second_type.kind == Kind::complex) {
        return same_numbers(state, tolerance, wide, x.imaginary, y.imaginary);
    }
    return x.imaginary.real == 0 && y.imaginary.real == 0;
}

bool same_bytes(const Array& first, const Array& second) {
    const auto* x = static_cast<const unsigned char*>(first.data);
    const auto* y = static_cast<const unsigned char*>(second.data);
    const auto count = static_cast<std::size_t>(first.element_count);
    return std::equal(x, x + count * element_size(first.type_id), y);
}

} // namespace

bool same(State& state, double tolerance, bool compare_different_types, const Array& first,
          const Array& second) {
    if (first.dimensions != second.dimensions) {
        return false;
    }
    if (first.element_count == 0) {
        return true;
    }
    const bool same_type = first.type_id == second.type_id;
    if (!same_type && !compare_different_types) {
        return false;
    }
    if (!is_known(first.type_id) || !is_known(second.type_id)) {
        return false;
    }
    if (same_type && (is_integer(element_type(first.type_id)) || tolerance == 0)) {
        return same_bytes(first, second);
    }
    for (std::int32_t i = 0; i < first.element_count; ++i) {
        if (!same_elements(state, tolerance, first, second, i)) {
            return false;
        }
    }
    return true;
}

bool equivalent(const Array& first, const Array& second) {
    return first.type_id == second.type_id && first.dimensions == second.dimensions;
}

int compare_doubles(State& state, double tolerance, double x, double y) {
    return compare_reals(state.of_doubles, double_factor, tolerance, x, y);
}

int compare_singles(State& state, float tolerance, float x, float y) {
    return compare_reals(state.of_singles, single_factor, tolerance, x, y);
}

double double_factor(double tolerance) {
    if (std::isnan(tolerance)) {
        return tolerance;
    }
    const double whole = std::trunc(tolerance);
    const double fraction = tolerance - whole;
    const double power = fraction == 0 ? 1 : power_of_doubles(2, fraction);
    return std::ldexp(power, static_cast<int>(whole) - 53);
}

float single_factor(float tolerance) {
    if (std::isnan(tolerance)) {
        return tolerance;
    }
    const float whole = std::trunc(tolerance);
    const float fraction = tolerance - whole;
    const float power = fraction == 0 ? 1 : power_of_singles(2, fraction);
    return std::ldexp(power, static_cast<int>(whole) - 24);
}

std::size_t element_size(int type_id) {
    const ElementType type = element_type(type_id);
    return type.kind == Kind::complex ? 2 * type.part_size : type.part_size;
}

} // namespace oracle
