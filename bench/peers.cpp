// Near reals in cache, by this library and by others that compare arrays under a tolerance.
//
//   peers [--quick]
//
// Writes an object of JSON. The other libraries are templates, which take the instructions that
// this file is compiled for: all of the processor's.

#include "array_record.h"
#include "filled_arrays.h"
#include "json_rows.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"
#include "turns.h"

#include <Eigen/Core>
#include <armadillo>
#include <xtensor/xadapt.hpp>
#include <xtensor/xmath.hpp>

#include <cmath>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <string>
#include <vector>

namespace {

constexpr std::size_t sizes[] = {std::size_t{32} << 10, std::size_t{256} << 10}; // of both arrays
constexpr std::size_t lengths[] = {8, 9, 12, 16, 24, 32, 48, 64, 100, 128, 256, 512, 1024};

struct Efforts {
    Effort sizes;
    Effort lengths;
};

constexpr Efforts full = {{200'000, 20}, {3000, 100}};
constexpr Efforts quick = {{0, 1}, {0, 1}};

// The difference, relative to the larger, that `whole_tolerance` stands for.
template <typename T>
T relative_tolerance() {
    return std::ldexp(T{1}, static_cast<int>(whole_tolerance) - std::numeric_limits<T>::digits);
}

// Two near arrays, and the ways to find them the same.
template <typename T>
class NearArrays {
  public:
    explicit NearArrays(const std::size_t len) : first_(len), second_(len) {
        fill<T, T>(Contents::near, first_.data(), second_.data(), len);
    }

    bool by_sameQ() {
        return TalNumericArray_sameQ(whole_tolerance, 0, array1_.handle(), array2_.handle()) != 0;
    }

    bool by_eigen_elementwise() const {
        const auto a = eigen_array(first_);
        const auto b = eigen_array(second_);
        return ((a - b).abs() <= tolerance_ * a.abs().max(b.abs())).all();
    }

    bool by_eigen_isApprox() const {
        return eigen_array(first_).matrix().isApprox(eigen_array(second_).matrix(), tolerance_);
    }

    bool by_xtensor() const {
        return xt::allclose(xt::adapt(first_), xt::adapt(second_), tolerance_, 0.0);
    }

    bool by_armadillo() {
        return arma::approx_equal(armadillo_column(first_), armadillo_column(second_), "reldiff",
                                  tolerance_);
    }

  private:
    static auto eigen_array(const std::vector<T>& elements) {
        using Elements = Eigen::Array<T, Eigen::Dynamic, 1>;
        return Eigen::Map<const Elements>(elements.data(),
                                          static_cast<Eigen::Index>(elements.size()));
    }

    static auto armadillo_column(std::vector<T>& elements) {
        return arma::Col<T>(elements.data(), elements.size(), false, true);
    }

    std::vector<T> first_;
    std::vector<T> second_;
    ArrayRecord array1_ = ArrayRecord(element_type_id<T>, first_.data(), first_.size());
    ArrayRecord array2_ = ArrayRecord(element_type_id<T>, second_.data(), second_.size());
    T tolerance_ = relative_tolerance<T>();
};

void print_row(RowMark& mark, const std::string& type, const std::size_t len,
               const char* const name, const Contender& contender) {
    std::printf(R"(%s{"type": "%s", "len": %zu, "name": "%s", "nanoseconds": %.3f})", mark.next(),
                type.c_str(), len, name, contender.nanoseconds());
}

// All of them, over arrays that fit the cache.
template <typename T>
void measure_sizes(const Effort& effort, RowMark& mark) {
    for (const std::size_t size : sizes) {
        const std::size_t len = size / 2 / sizeof(T);
        NearArrays<T> arrays(len);
        const char* const names[] = {"sameQ", "Eigen elementwise", "Eigen isApprox",
                                     "xtensor allclose", "Armadillo approx_equal"};
        std::vector<Contender> contenders;
        contenders.emplace_back([&] { return arrays.by_sameQ(); });
        contenders.emplace_back([&] { return arrays.by_eigen_elementwise(); });
        contenders.emplace_back([&] { return arrays.by_eigen_isApprox(); });
        contenders.emplace_back([&] { return arrays.by_xtensor(); });
        contenders.emplace_back([&] { return arrays.by_armadillo(); });
        take_turns(contenders, effort);
        for (std::size_t i = 0; i < contenders.size(); ++i) {
            print_row(mark, type_name<T>(), len, names[i], contenders[i]);
        }
    }
}

// The best of them, over short arrays.
template <typename T>
void measure_lengths(const Effort& effort, RowMark& mark) {
    for (const std::size_t len : lengths) {
        NearArrays<T> arrays(len);
        std::vector<Contender> contenders;
        contenders.emplace_back([&] { return arrays.by_sameQ(); });
        contenders.emplace_back([&] { return arrays.by_eigen_elementwise(); });
        take_turns(contenders, effort);
        print_row(mark, type_name<T>(), len, "sameQ", contenders[0]);
        print_row(mark, type_name<T>(), len, "Eigen elementwise", contenders[1]);
    }
}

} // namespace

int main(int count, char** arguments) {
    const std::string option = count == 2 ? arguments[1] : "";
    if (count > 2 || (count == 2 && option != "--quick")) {
        std::fputs("usage: peers [--quick]\n", stderr);
        return 2;
    }
    const Efforts& efforts = option.empty() ? full : quick;
    std::printf("{\"sizes\": ");
    RowMark of_sizes;
    measure_sizes<double>(efforts.sizes, of_sizes);
    measure_sizes<float>(efforts.sizes, of_sizes);
    std::printf("\n], \"lengths\": ");
    RowMark of_lengths;
    measure_lengths<double>(efforts.lengths, of_lengths);
    measure_lengths<float>(efforts.lengths, of_lengths);
    std::puts("\n]}");
    return EXIT_SUCCESS;
}
