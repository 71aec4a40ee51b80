// Prints the table of inputs on which the formulas of the proofs must have the values that the code
// has. Each line is the instance of a family and, after a tab, an equation with the code's answer.

#include "compare.h"
#include "factor_cache.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_certainty.h"
#include "talnumericarray_sameq_impl.h"
#include "type_pairs.h"
#include "type_properties.h"

#include <cfenv>
#include <cinttypes>
#include <cmath>
#include <complex>
#include <cstddef>
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
        talnumericarray::unsigned_of_size<sizeof(T)> bits = 0;
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

// ---- What vectors answer for a pair

template <typename Set, typename Bound, typename T1, typename T2>
bool certain_by(const Bound bound, const T1& x, const T2& y) {
    constexpr std::size_t count = Set::template elements<T1, T2>;
    const std::vector<T1> xs(count, x);
    const std::vector<T2> ys(count, y);
    return Set::certain_prefix(bound, xs.data(), ys.data(), count, count) == count;
}

// Calls `print` with every answer, and with whether fused operations gave it.
template <typename Bound, typename T1, typename T2, typename Print, typename... Sets>
void for_each_answer(const Bound bound, const T1& x, const T2& y, const Print& print,
                     type_list<Sets...> /*sets*/) {
    const auto ask = [&](auto tag) {
        using Set = typename decltype(tag)::type;
        if constexpr (Set::template has_loop<Bound, T1, T2>) {
            if (Set::supported()) {
                print(std::string(Set::name) != "baseline", certain_by<Set>(bound, x, y));
            }
        }
    };
    (ask(type_tag<Sets>{}), ...);
}

template <typename Bound, typename T1, typename T2, typename Print>
void for_each_answer(const Bound bound, const T1& x, const T2& y, const Print& print) {
    for_each_answer(bound, x, y, print, talnumericarray::instruction_sets{});
}

// ---- Reals

struct Direction {
    const char* name;
    int mode;
};

constexpr Direction directions[] = {
    {"RTP", FE_UPWARD}, {"RTN", FE_DOWNWARD}, {"RTZ", FE_TOWARDZERO}, {"RNE", FE_TONEAREST}};

template <typename T>
std::string name_of_reals(const Direction& direction) {
    return std::string(sizeof(T) == sizeof(float) ? "single " : "double ") + direction.name;
}

// Those at which a step of the rule changes its decision.
template <typename T>
std::vector<T> numbers() {
    using limits = std::numeric_limits<T>;
    return {0,       limits::denorm_min(), limits::min(),      1,
            T(1.25), limits::max(),        limits::infinity(), limits::quiet_NaN()};
}

template <typename T>
void print_comparisons(const std::string& instance, const T tol, const T factor, const T x,
                       const T y) {
    constexpr int bits = std::numeric_limits<T>::digits;
    const T other_tol = 0.25;
    for (const bool remembered : {false, true}) {
        // The factor is made from the tolerance where it is not remembered.
        nesk::remember_factor<T>({remembered ? tol : other_tol, factor});
        print_equation(instance, "compare_impl",
                       verdict_literal(nesk::detail::compare_impl(tol, x, y)), tol, factor,
                       remembered && tol > 0 && tol < bits, x, y);
    }
}

// Calls `print(fused, x, y, answer)` for two reals, and for the second one as an imaginary part
// beside a real.
template <typename Bound, typename T, typename Print>
void for_each_answer_of_reals(const Bound bound, const T x, const T y, const Print& print) {
    print(false, x, y, talnumericarray::certainly_same(bound, x, y));
    for_each_answer(bound, x, y,
                    [&](const bool fused, const bool answer) { print(fused, x, y, answer); });
    for_each_answer(bound, T{7}, std::complex<T>(7, y),
                    [&](const bool fused, const bool answer) { print(fused, T{0}, y, answer); });
}

template <typename T>
void print_certainty(const std::string& instance, const T divisor, const T x, const T y) {
    for_each_answer_of_reals(
        talnumericarray::nearness<T>{divisor}, x, y,
        [&](const bool fused, const T part1, const T part2, const bool answer) {
            print_equation(instance, "certain", literal(answer), fused, divisor, part1, part2);
        });
}

template <typename T>
void print_equality(const std::string& instance, const T x, const T y) {
    for_each_answer_of_reals(talnumericarray::equality{}, x, y,
                             [&](bool /*fused*/, const T part1, const T part2, const bool answer) {
                                 print_equation(instance, "fp.eq", literal(answer), part1, part2);
                             });
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

// Those at the limit of the test, where it matters whether the product is rounded.
template <typename T>
void print_certainty_at_limit(const std::string& instance, const T divisor) {
    for (int k = 1; k <= 8; ++k) {
        const T y = 1 + T(k) / 11;
        const T limit = y + y / (divisor + 1);
        print_certainty(instance, divisor, limit, y);
        print_certainty(instance, divisor, std::nextafter(limit, T{0}), y);
    }
}

template <typename T>
void print_reals(const std::string& instance, const std::vector<T>& tolerances) {
    constexpr int bits = std::numeric_limits<T>::digits;
    for (const T tol : tolerances) {
        const bool has_factor = tol > 0 && tol < bits;
        const T factor = has_factor ? nesk::ToleranceShiftFactor(tol) : T{1};
        nesk::remember_factor<T>({tol, factor});
        const T divisor = talnumericarray::certain_divisor(tol);
        if (has_factor) {
            print_equation(instance, "certain_divisor", literal(divisor), factor);
            print_certainty_at_limit(instance, divisor);
        }
        for_each_pair_of_reals(factor, [&](const T x, const T y) {
            // The table has no factors of NaN tolerances.
            if (!std::isnan(tol)) {
                print_comparisons(instance, tol, factor, x, y);
            }
            if (divisor != 0) {
                print_certainty(instance, divisor, x, y);
            } else {
                print_equality(instance, x, y);
            }
        });
    }
}

// For directions other than to nearest, the tolerances with a rounded factor are enough.
template <typename T>
void print_reals(const Direction& direction) {
    constexpr int bits = std::numeric_limits<T>::digits;
    std::vector<T> tolerances = {T(10.5), T(bits - 0.5)};
    if (direction.mode == FE_TONEAREST) {
        for (const T tol : {T{-1}, T{0}, T(0.5), T{1}, T{7}, T{bits - 1}, T{bits},
                            std::numeric_limits<T>::quiet_NaN()}) {
            tolerances.push_back(tol);
        }
    }
    std::fesetround(direction.mode);
    print_reals(name_of_reals<T>(direction), tolerances);
    std::fesetround(FE_TONEAREST);
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
            for_each_answer(talnumericarray::equality{}, x, y,
                            [&](bool /*fused*/, const bool answer) {
                                print_equation(instance, "certain", literal(answer), x, y);
                            });
        }
    }
}

void print_integers() {
    for_each_pair_of_types([](auto tag1, auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        if constexpr (std::is_integral_v<T1> && std::is_integral_v<T2>) {
            print_pair_of_integers<T1, T2>();
        }
    });
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
    for (const Direction& direction : directions) {
        print_reals<float>(direction);
        print_reals<double>(direction);
    }
    print_integers();
    print_ids();
}
