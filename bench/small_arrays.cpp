// What looking at blocks costs short arrays: the loops of the library against the plain loop over
// the same element test, for every pair of element types that has a loop.
//
//   small_arrays [--quick]
//
// Writes an array of JSON. The two are to be told apart by a few hundredths, so that they take
// turns in short batches of calls, and the shortest time of each counts.

#include "filled_arrays.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_instruction_sets.h"
#include "talnumericarray_sameq_impl.h"
#include "type_properties.h"

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <string>

namespace {

// ---- The two loops

template <typename T1, typename T2>
using Loop = int (*)(const talreal& tol, const T1* data1, const T2* data2, talint len);

template <typename T1, typename T2>
[[gnu::noinline]] int loop_of_library(const talreal& tol, const T1* data1, const T2* data2,
                                      const talint len) {
    return talnumericarray::elements_sameQ<talnumericarray::instruction_sets>(tol, data1, data2,
                                                                              len);
}

// ---- What is measured

constexpr talint lengths[] = {1,  2,  3,  4,  7,  8,  12, 16,  24,  31,
                              32, 33, 48, 63, 64, 65, 96, 128, 129, 256};
constexpr std::size_t longest = 256;

struct Workload {
    const char* name;
    Contents contents;
    bool for_integers_too;
};

constexpr Workload workloads[] = {
    {"identical", Contents::identical, true},
    {"near", Contents::near, false},
    {"first_differs", Contents::first_differs, true},
    {"last_differs", Contents::last_differs, true},
};

// How long to measure.
struct Effort {
    double batch; // nanoseconds
    int turns;
    int rounds; // more than one only where the library looks slower
};

constexpr Effort full = {10000, 25, 8};
constexpr Effort quick = {200, 2, 1};
constexpr double looks_slower = 1.03;

// ---- Time

template <typename T1, typename T2>
struct Call {
    const T1* data1;
    const T2* data2;
    talint len;
    int right_answer;
};

template <typename T1, typename T2>
[[gnu::noinline]] double nanoseconds(const Loop<T1, T2> loop, const Call<T1, T2>& call,
                                     const int calls) {
    const talreal tol = whole_tolerance;
    // Read anew for each call, so that a loop that is known is not found to answer the same again.
    const Loop<T1, T2> volatile called = loop;
    int wrong = 0;
    const auto start = std::chrono::steady_clock::now();
    for (int i = 0; i < calls; ++i) {
        wrong |= called(tol, call.data1, call.data2, call.len) ^ call.right_answer;
    }
    const std::chrono::duration<double, std::nano> time = std::chrono::steady_clock::now() - start;
    if (wrong != 0) {
        std::fputs("small_arrays: an answer is wrong\n", stderr);
        std::abort();
    }
    return time.count();
}

struct Times {
    double library = std::numeric_limits<double>::infinity(); // nanoseconds a call
    double plain = std::numeric_limits<double>::infinity();
};

template <typename T1, typename T2>
Times measure(const Loop<T1, T2> library, const Loop<T1, T2> plain, const Call<T1, T2>& call,
              const Effort& effort) {
    int calls = 1;
    while (nanoseconds(plain, call, calls) < effort.batch) {
        calls *= 2;
    }
    Times best;
    for (int round = 0; round < effort.rounds; ++round) {
        for (int turn = 0; turn < effort.turns; ++turn) {
            best.library = std::min(best.library, nanoseconds(library, call, calls) / calls);
            best.plain = std::min(best.plain, nanoseconds(plain, call, calls) / calls);
        }
        if (best.library < looks_slower * best.plain) {
            break;
        }
    }
    return best;
}

// ---- Output

class Rows {
  public:
    void add(const std::string& type1, const std::string& type2, const Workload& workload,
             const talint len, const Times& times) {
        std::printf(R"(%s{"type1": "%s", "type2": "%s", "workload": "%s", "len": %d, )"
                    R"("library": %.3f, "plain": %.3f})",
                    separator_, type1.c_str(), type2.c_str(), workload.name, static_cast<int>(len),
                    times.library, times.plain);
        separator_ = ",\n";
    }

  private:
    const char* separator_ = "";
};

template <typename T1, typename T2>
void measure_pair(const Effort& effort, Rows& rows) {
    constexpr std::size_t page = 4096;
    alignas(page) static T1 data1[longest];
    alignas(page) static T2 data2[longest];
    for (const Workload& workload : workloads) {
        if (!compared_under_tolerance<T1, T2> && !workload.for_integers_too) {
            continue;
        }
        for (const talint len : lengths) {
            fill<T1, T2>(workload.contents, data1, data2, static_cast<std::size_t>(len));
            const Call<T1, T2> call = {data1, data2, len, right_answer(workload.contents)};
            const Times times = measure<T1, T2>(loop_of_library<T1, T2>,
                                                talnumericarray::each_sameQ<T1, T2>, call, effort);
            rows.add(type_name<T1>(), type_name<T2>(), workload, len, times);
        }
    }
}

} // namespace

int main(int count, char** arguments) {
    const std::string option = count == 2 ? arguments[1] : "";
    if (count > 2 || (count == 2 && option != "--quick")) {
        std::fputs("usage: small_arrays [--quick]\n", stderr);
        return 2;
    }
    const Effort& effort = option.empty() ? full : quick;
    Rows rows;
    std::puts("[");
    for_each_pair_with_loop([&](auto tag1, auto tag2) {
        measure_pair<typename decltype(tag1)::type, typename decltype(tag2)::type>(effort, rows);
    });
    std::puts("\n]");
    return EXIT_SUCCESS;
}
