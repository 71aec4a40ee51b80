#include "module_templates.h"

#include "loops.h"
#include "type_pairs.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace {

using talnumericarray::none;

template <typename... Sets>
std::vector<InstructionSet> listed(type_list<Sets...> /*sets*/) {
    return {InstructionSet{Sets::name, Sets::supported()}...};
}

template <typename T>
RememberedFactor<T> remembered_of() {
    const nesk::factor_cache<T>& cache = nesk::factor_cache_of_thread<T>();
    const auto& kept = cache.factors[cache.slot(cache.state)];
    return {kept.lasttol, kept.tolfactor};
}

template <typename T>
RememberedFactor<T> factor_of(const double tol) {
    constexpr int digits = std::numeric_limits<T>::digits;
    const T rounded = static_cast<T>(tol);
    return rounded > 0 && rounded < digits
               ? RememberedFactor<T>{rounded, nesk::ToleranceShiftFactor(rounded)}
               : RememberedFactor<T>{digits, 1};
}

template <typename T>
bool same_factor(const RememberedFactor<T>& factor1, const RememberedFactor<T>& factor2) {
    const auto same = [](const T x, const T y) {
        return x == y || (std::isnan(x) && std::isnan(y));
    };
    return same(factor1.tolerance, factor2.tolerance) && same(factor1.factor, factor2.factor);
}

template <typename T1, typename T2>
bool element_loop(const double tol, const void* data1, const void* data2, const talint count) {
    return talnumericarray::each_sameQ(tol, static_cast<const T1*>(data1),
                                       static_cast<const T2*>(data2), count)
           == 1;
}

template <typename Sets, typename T1, typename T2>
bool loop_of_sets(const double tol, const void* data1, const void* data2, const talint count) {
    return talnumericarray::elements_sameQ<Sets>(tol, static_cast<const T1*>(data1),
                                                 static_cast<const T2*>(data2), count)
           == 1;
}

// By all sets together, by each of them alone, and without vectors.
template <typename T1, typename T2, typename... Sets>
std::vector<LoopOfSets> loops_of(type_list<Sets...> all) {
    std::vector<LoopOfSets> loops = {{"all sets", loop_of_sets<decltype(all), T1, T2>},
                                     {none::name, loop_of_sets<type_list<none>, T1, T2>}};
    if constexpr (sizeof...(Sets) > 1) {
        (void)(..., (Sets::supported()
                         ? loops.push_back({Sets::name, loop_of_sets<type_list<Sets>, T1, T2>})
                         : void()));
    }
    return loops;
}

std::vector<Pair> make_pairs() {
    std::vector<Pair> pairs;
    for_each_pair_with_loop([&](auto tag1, auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        const ElementType& type1 = element_type_of<T1>();
        const ElementType& type2 = element_type_of<T2>();
        pairs.push_back({type1, type2, compared_digits(type1, type2), element_loop<T1, T2>,
                         loops_of<T1, T2>(talnumericarray::instruction_sets{})});
    });
    return pairs;
}

} // namespace

std::vector<InstructionSet> instruction_sets_of_build() {
    return listed(talnumericarray::instruction_sets{});
}

Remembered remembered() {
    return {remembered_of<float>(), remembered_of<double>()};
}

void remember(const Remembered& factors) {
    nesk::remember_factor<float>({factors.of_singles.tolerance, factors.of_singles.factor});
    nesk::remember_factor<double>({factors.of_doubles.tolerance, factors.of_doubles.factor});
}

Remembered factors_of(const double tol) {
    return {factor_of<float>(tol), factor_of<double>(tol)};
}

double factor_of_reals(const int digits, const Remembered& factors) {
    return digits == std::numeric_limits<float>::digits ? factors.of_singles.factor
                                                        : factors.of_doubles.factor;
}

bool same_factors(const Remembered& factors1, const Remembered& factors2) {
    return same_factor(factors1.of_singles, factors2.of_singles)
           && same_factor(factors1.of_doubles, factors2.of_doubles);
}

const std::vector<Pair>& pairs_with_loop() {
    static const std::vector<Pair> pairs = make_pairs();
    return pairs;
}

std::vector<double> tolerances_of(const Pair& pair) {
    if (pair.digits == 0) {
        return {0.0};
    }
    const double digits = pair.digits;
    return {-1,     0,           1e-46,
            0.5,    1,           10,
            10.5,   digits - 1,  digits - 0.5,
            digits, digits + 10, std::numeric_limits<double>::quiet_NaN()};
}

bool as_element_loop(const Pair& pair, const Remembered& before, const double tol,
                     const void* data1, const void* data2, const std::size_t count) {
    const auto length = static_cast<talint>(count);
    remember(before);
    const bool expected = pair.element_loop(tol, data1, data2, length);
    const Remembered expected_after = remembered();
    const auto as_expected = [&](const LoopOfSets& other) {
        remember(before);
        const bool answer = other.loop(tol, data1, data2, length);
        const bool same_memory = same_factors(remembered(), expected_after);
        if (answer != expected || !same_memory) {
            ADD_FAILURE() << other.sets << " answers " << answer << " instead of " << expected
                          << (same_memory ? "" : " and remembers another factor") << "; tolerance "
                          << tol << ", " << count << " elements, remembered before: tolerance "
                          << before.of_singles.tolerance << " of singles, "
                          << before.of_doubles.tolerance << " of doubles";
        }
        return answer == expected && same_memory;
    };
    return std::all_of(pair.loops.begin(), pair.loops.end(), as_expected);
}

std::vector<unsigned char> sevens(const ElementType& type, const std::size_t count) {
    std::vector<unsigned char> bytes(count * type.size);
    for (std::size_t i = 0; i < count; ++i) {
        type.store(bytes.data() + i * type.size, 7);
    }
    return bytes;
}

double least_subnormal(const Pair& pair) {
    return pair.digits == std::numeric_limits<float>::digits
               ? std::numeric_limits<float>::denorm_min()
               : std::numeric_limits<double>::denorm_min();
}
