// Near reals in cache, by this library and by others that compare arrays under a tolerance.
//
//   peers [--quick]
//
// Writes a JSON object. The other libraries are templates, which use the instructions that this
// file is compiled for: all of the processor's.

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
#include <initializer_list>
#include <limits>
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

template <typename T>
void measure(const std::size_t len, std::vector<Contender> contenders,
             const std::initializer_list<const char*> names, const Effort& effort, JsonRows& rows) {
    take_turns(contenders, effort);
    const Contender* contender = contenders.data();
    for (const char* const name : names) {
        rows.row()
            .add("type", type_name<T>())
            .add("len", len)
            .add("name", name)
            .add("nanoseconds", (contender++)->nanoseconds());
    }
}

// All of them, over arrays that fit into the cache.
template <typename T>
void measure_sizes(const Effort& effort, JsonRows& rows) {
    for (const std::size_t size : sizes) {
        const std::size_t len = size / 2 / sizeof(T);
        NearArrays<T> arrays(len);
        measure<T>(len,
                   {Contender([&] { return arrays.by_sameQ(); }),
                    Contender([&] { return arrays.by_eigen_elementwise(); }),
                    Contender([&] { return arrays.by_eigen_isApprox(); }),
                    Contender([&] { return arrays.by_xtensor(); }),
                    Contender([&] { return arrays.by_armadillo(); })},
                   {"sameQ", "Eigen elementwise", "Eigen isApprox", "xtensor allclose",
                    "Armadillo approx_equal"},
                   effort, rows);
    }
}

// The best of them, over short arrays.
template <typename T>
void measure_lengths(const Effort& effort, JsonRows& rows) {
    for (const std::size_t len : lengths) {
        NearArrays<T> arrays(len);
        measure<T>(len, {Contender([&] { return arrays.by_sameQ(); }), Contender([&] {
                             return arrays.by_eigen_elementwise();
                         })},
                   {"sameQ", "Eigen elementwise"}, effort, rows);
    }
}

} // namespace

int main(int count, char** arguments) {
    const Efforts& efforts = is_quick(count, arguments) ? quick : full;
    std::printf("{\"sizes\": ");
    JsonRows of_sizes;
    measure_sizes<double>(efforts.sizes, of_sizes);
    measure_sizes<float>(efforts.sizes, of_sizes);
    std::printf("\n], \"lengths\": ");
    JsonRows of_lengths;
    measure_lengths<double>(efforts.lengths, of_lengths);
    measure_lengths<float>(efforts.lengths, of_lengths);
    std::puts("\n]}");
    return EXIT_SUCCESS;
}
