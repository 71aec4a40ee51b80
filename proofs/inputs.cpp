// Prints the table of inputs on which the formulas of the proofs have to have the values of the
// code: a line each, the instance of a family and, behind a tab, an equation with what the code
// answers.

#include "compare.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_sameq_blocks.h"
#include "talnumericarray_sameq_impl.h"
#include "type_properties.h"

#include <cinttypes>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <limits>
#include <set>
#include <string>
#include <type_traits>
#include <vector>

namespace {

// ---- Literals

template <typename D>
std::string bits_literal(const D bits) {
    char text[24];
    std::snprintf(text, sizeof text, "#x%0*" PRIx64, static_cast<int>(2 * sizeof(D)),
                  static_cast<std::uint64_t>(static_cast<std::make_unsigned_t<D>>(bits)));
    return text;
}

template <typename T>
std::string literal(const T value) {
    if constexpr (std::is_floating_point_v<T>) {
        talnumericarray::unsigned_of_size_t<T> bits = 0;
        std::memcpy(&bits, &value, sizeof bits);
        return "(real " + bits_literal(bits) + ")";
    } else {
        return bits_literal(value);
    }
}

std::string literal(const bool value) {
    return value ? "true" : "false";
}

std::string verdict_literal(const int verdict) {
    return bits_literal(static_cast<std::int8_t>(verdict));
}

// ---- Equations

template <typename... Arguments>
void print_equation(const std::string& instance, const char* formula, const std::string& value,
                    const Arguments... arguments) {
    std::string row = instance + "\t(= (" + formula;
    ((row += " " + literal(arguments)), ...);
    std::puts((row + ") " + value + ")").c_str());
}

// ---- Reals

template <typename T>
constexpr const char* name_of_reals = sizeof(T) == sizeof(float) ? "single" : "double";

// Those at which a step of the rule decides otherwise.
template <typename T>
std::vector<T> numbers() {
    using limits = std::numeric_limits<T>;
    return {0,       limits::denorm_min(), limits::min(),      1,
            T(1.25), limits::max(),        limits::infinity(), limits::quiet_NaN()};
}

template <typename T>
void print_comparisons(const T tol, const T factor, const T x, const T y) {
    constexpr int bits = std::numeric_limits<T>::digits;
    const T other_tol = 0.25;
    for (const bool remembered : {false, true}) {
        // The factor is made from the tolerance where it is not remembered.
        nesk::detail::remember_factor<T>({remembered ? tol : other_tol, factor});
        print_equation(name_of_reals<T>, "compare_impl",
                       verdict_literal(nesk::detail::compare_impl(tol, x, y)), tol, factor,
                       remembered && tol > 0 && tol < bits, x, y);
    }
}

template <typename T>
void print_certainty(const T divisor, const T x, const T y) {
    const bool certain = talnumericarray::doubt(talnumericarray::nearness<T>{divisor}, x, y) == 0;
    print_equation(name_of_reals<T>, "certain", literal(certain), divisor, x, y);
}

// Each number with each, and with those at the limit of the tolerance below and above it.
template <typename T, typename Print>
void for_each_pair_of_reals(const T factor, const Print& print) {
    for (const T x : numbers<T>()) {
        for (const T y : numbers<T>()) {
            print(x, y);
            print(x, -y);
        }
        for (const T limit : {x - x * factor, x / (1 - factor), x / 2}) {
            for (const T y : {limit, std::nextafter(limit, T{0}), std::nextafter(limit, 2 * x)}) {
                print(x, y);
                print(-y, -x);
            }
        }
    }
}

template <typename T>
void print_reals() {
    constexpr int bits = std::numeric_limits<T>::digits;
    for (const T tol : {T{-1}, T{0}, T(0.5), T{1}, T{7}, T(10.5), T{bits - 1}, T(bits - 0.5),
                        T{bits}, std::numeric_limits<T>::quiet_NaN()}) {
        const bool has_factor = tol > 0 && tol < bits;
        const T factor = has_factor ? nesk::ToleranceShiftFactor(tol) : T{1};
        nesk::detail::remember_factor<T>({tol, factor});
        const T divisor = talnumericarray::certain_divisor(tol);
        if (has_factor) {
            print_equation(name_of_reals<T>, "certain_divisor", literal(divisor),
                           std::trunc(tol) == tol, factor);
        }
        for_each_pair_of_reals(factor, [&](const T x, const T y) {
            // What a NaN tolerance makes is no factor of a table.
            if (!std::isnan(tol)) {
                print_comparisons(tol, factor, x, y);
            }
            if (divisor != 0) {
                print_certainty(divisor, x, y);
            }
        });
    }
    for (const T number : numbers<T>()) {
        for (const T imaginary : {number, -number}) {
            using D = talnumericarray::unsigned_of_size_t<T>;
            D bits_of_part = 0;
            std::memcpy(&bits_of_part, &imaginary, sizeof imaginary);
            const D doubt =
                talnumericarray::doubt(talnumericarray::equality{}, T{7}, T{7}, imaginary);
            print_equation(name_of_reals<T>, "imaginary_doubt", literal(doubt), bits_of_part);
        }
    }
}

// ---- Integers

template <typename T>
std::string name_of_integers() {
    return (std::is_signed_v<T> ? "int" : "uint") + std::to_string(8 * sizeof(T));
}

template <typename T>
std::set<T> integers() {
    std::set<T> values = {0, 1, 5};
    for (const int width : {8, 16, 32, 64}) {
        const std::uint64_t greatest = ~std::uint64_t{0} >> (64 - width);
        for (const std::uint64_t value : {greatest, greatest / 2, greatest / 2 + 1}) {
            values.insert(static_cast<T>(value));
        }
    }
    return values;
}

template <typename T1, typename T2>
void print_pair_of_integers() {
    const std::string instance = name_of_integers<T1>() + " " + name_of_integers<T2>();
    for (const T1 x : integers<T1>()) {
        for (const T2 y : integers<T2>()) {
            print_equation(instance, "compare_impl",
                           verdict_literal(nesk::detail::compare_impl(x, y)), x, y);
            print_equation(instance, "doubt",
                           literal(talnumericarray::doubt(talnumericarray::equality{}, x, y)), x,
                           y);
        }
    }
}

template <typename T1, typename... Types>
void print_row_of_integers(type_list<Types...> /*types*/) {
    const auto print = [](auto tag) {
        using T2 = typename decltype(tag)::type;
        if constexpr (std::is_integral_v<T1> && std::is_integral_v<T2>) {
            print_pair_of_integers<T1, T2>();
        }
    };
    (print(type_tag<Types>{}), ...);
}

template <typename... Types>
void print_integers(type_list<Types...> types) {
    (print_row_of_integers<Types>(types), ...);
}

// ---- Element type ids

void print_ids() {
    const auto found = [](auto /*tag*/) { return 1; };
    std::vector<type_t> ids = {std::numeric_limits<type_t>::min(),
                               std::numeric_limits<type_t>::max(), 256 + 5};
    for (type_t id = -2; id <= 15; ++id) {
        ids.push_back(id);
    }
    for (const type_t id : ids) {
        const int answer = talnumericarray::with_element_type(id, element_type_list{}, found);
        print_equation("any", "in_chain", literal(answer == 1), id);
    }
}

} // namespace

int main() {
    print_reals<float>();
    print_reals<double>();
    print_integers(element_type_list{});
    print_ids();
}
