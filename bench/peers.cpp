// Near reals in cache, by this library and by others that compare arrays under a tolerance.
//
// The other libraries are templates, which take the instructions that this file is compiled for:
// all of the processor's.

#include "array_record.h"
#include "filled_arrays.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"

#include <Eigen/Core>
#include <armadillo>
#include <benchmark/benchmark.h>
#include <xtensor/xadapt.hpp>
#include <xtensor/xmath.hpp>

#include <cmath>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <string>
#include <vector>

namespace {

constexpr std::size_t bytes = std::size_t{256} << 10; // of both arrays together

// The difference, relative to the larger, that `whole_tolerance` stands for.
template <typename T>
T relative_tolerance() {
    return std::ldexp(T{1}, static_cast<int>(whole_tolerance) - std::numeric_limits<T>::digits);
}

// Measures `same(first, second)`, which is to find two near arrays the same.
template <typename T, typename Same>
void add(const std::string& name, const Same& same) {
    const std::string full_name = type_name<T>() + "/" + name;
    benchmark::RegisterBenchmark(full_name.c_str(), [same](benchmark::State& state) {
        std::vector<T> first(bytes / 2 / sizeof(T));
        std::vector<T> second(first.size());
        fill<T, T>(Contents::near, first.data(), second.data(), first.size());
        bool answer = false;
        for (auto _ : state) {
            answer = same(first, second);
            benchmark::DoNotOptimize(answer);
            benchmark::ClobberMemory();
        }
        if (!answer) {
            state.SkipWithError("near arrays are not found the same");
        }
        state.SetBytesProcessed(static_cast<std::int64_t>(bytes) * state.iterations());
    });
}

template <typename T>
auto eigen_array(const std::vector<T>& elements) {
    using Elements = Eigen::Array<T, Eigen::Dynamic, 1>;
    return Eigen::Map<const Elements>(elements.data(), static_cast<Eigen::Index>(elements.size()));
}

template <typename T>
auto armadillo_column(std::vector<T>& elements) {
    return arma::Col<T>(elements.data(), elements.size(), false, true);
}

template <typename T>
void add_all() {
    using Elements = std::vector<T>;
    const T tolerance = relative_tolerance<T>();

    add<T>("sameQ", [](Elements& first, Elements& second) {
        ArrayRecord array1(element_type_id<T>, first.data(), first.size());
        ArrayRecord array2(element_type_id<T>, second.data(), second.size());
        return TalNumericArray_sameQ(whole_tolerance, 0, array1.handle(), array2.handle()) != 0;
    });
    add<T>("Eigen_elementwise", [tolerance](const Elements& first, const Elements& second) {
        const auto a = eigen_array(first);
        const auto b = eigen_array(second);
        return ((a - b).abs() <= tolerance * a.abs().max(b.abs())).all();
    });
    add<T>("Eigen_isApprox", [tolerance](const Elements& first, const Elements& second) {
        return eigen_array(first).matrix().isApprox(eigen_array(second).matrix(), tolerance);
    });
    add<T>("xtensor_allclose", [tolerance](const Elements& first, const Elements& second) {
        return xt::allclose(xt::adapt(first), xt::adapt(second), tolerance, 0.0);
    });
    add<T>("Armadillo_approx_equal", [tolerance](Elements& first, Elements& second) {
        return arma::approx_equal(armadillo_column(first), armadillo_column(second), "reldiff",
                                  tolerance);
    });
}

} // namespace

int main(int count, char** arguments) {
    add_all<double>();
    add_all<float>();
    benchmark::Initialize(&count, arguments);
    if (benchmark::ReportUnrecognizedArguments(count, arguments)) {
        return EXIT_FAILURE;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return EXIT_SUCCESS;
}
