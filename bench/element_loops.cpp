// Whole calls over long arrays of every pair of element types that has a loop, each next to memcmp
// over as many bytes of the same memory.

#include "array_record.h"
#include "filled_arrays.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"
#include "talnumericarray_instruction_sets.h"

#include <benchmark/benchmark.h>

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <utility>
#include <vector>

namespace {

// ---- What is measured

struct Size {
    const char* name;
    std::size_t bytes; // of both arrays together
    bool in_cache;
};

constexpr Size sizes[] = {
    {"32KiB", std::size_t{32} << 10, true},
    {"256KiB", std::size_t{256} << 10, true},
    {"256MiB", std::size_t{256} << 20, false},
};

struct Workload {
    const char* name;
    Contents contents;
    talreal tol;
    bool for_integers_too;
};

constexpr Workload workloads[] = {
    {"identical", Contents::identical, whole_tolerance, true},
    {"near", Contents::near, whole_tolerance, false},
    {"near_fractional", Contents::near, fractional_tolerance, false},
    {"last_differs", Contents::last_differs, whole_tolerance, true},
};

// ---- Memory

// One block for all arrays, as large as the largest two. Filling it takes longer than a comparison,
// so that it is filled only where others than those wanted are in it.
class Memory {
  public:
    static constexpr std::size_t bytes = std::size_t{256} << 20;

    template <typename Fill>
    void hold(const std::string& arrays, const Fill& fill_memory) {
        if (held_ != arrays) {
            fill_memory();
            held_ = arrays;
        }
    }

    unsigned char* begin() { return begin_; }

  private:
    static constexpr std::size_t alignment = std::size_t{2} << 20; // a large page

    unsigned char* aligned() {
        void* place = storage_.data();
        std::size_t space = storage_.size();
        return static_cast<unsigned char*>(std::align(alignment, bytes, place, space));
    }

    std::vector<unsigned char> storage_ = std::vector<unsigned char>(bytes + alignment);
    unsigned char* begin_ = aligned();
    std::string held_;
};

Memory& memory() {
    static Memory all;
    return all;
}

// ---- The two measurements

// Both arrays, one behind the other. Their length makes the second one aligned too.
template <typename T1, typename T2>
constexpr std::size_t length(const std::size_t bytes) {
    constexpr std::size_t granule = 64;
    return bytes / (sizeof(T1) + sizeof(T2)) / granule * granule;
}

void count_bytes(benchmark::State& state, const std::size_t bytes) {
    state.SetBytesProcessed(static_cast<std::int64_t>(bytes) * state.iterations());
}

template <typename T1, typename T2>
void measure_sameQ(benchmark::State& state, const std::string& name, const Size& size,
                   const Workload& workload) {
    const std::size_t len = length<T1, T2>(size.bytes);
    unsigned char* const data1 = memory().begin();
    unsigned char* const data2 = data1 + len * sizeof(T1);
    memory().hold(name, [&] { fill<T1, T2>(workload.contents, data1, data2, len); });

    ArrayRecord array1(element_type_id<T1>, data1, len);
    ArrayRecord array2(element_type_id<T2>, data2, len);
    int answer = -1;
    for (auto _ : state) {
        answer = TalNumericArray_sameQ(workload.tol, 1, array1.handle(), array2.handle());
    }
    if (answer != right_answer(workload.contents)) {
        state.SkipWithError("the answer is wrong");
    }
    count_bytes(state, len * (sizeof(T1) + sizeof(T2)));
}

template <typename T1, typename T2>
void measure_memcmp(benchmark::State& state, const Size& size) {
    const std::size_t half = length<T1, T2>(size.bytes) * (sizeof(T1) + sizeof(T2)) / 2;
    unsigned char* const data1 = memory().begin();
    unsigned char* const data2 = data1 + half;
    memory().hold("equal bytes", [&] { std::memset(memory().begin(), 1, Memory::bytes); });

    for (auto _ : state) {
        benchmark::DoNotOptimize(std::memcmp(data1, data2, half));
    }
    count_bytes(state, 2 * half);
}

// ---- The benchmarks

template <typename Measure>
void add(const std::string& name, const Size& size, Measure&& measure) {
    auto* const added = benchmark::RegisterBenchmark(name.c_str(), std::forward<Measure>(measure));
    if (!size.in_cache) {
        added->Iterations(1)->Repetitions(5);
    }
}

template <typename T1, typename T2>
void add_pair(const Size& size) {
    for (const Workload& workload : workloads) {
        if (!compared_under_tolerance<T1, T2> && !workload.for_integers_too) {
            continue;
        }
        const std::string name = std::string("/") + size.name + "/" + workload.name + "/"
                                 + type_name<T1>() + "/" + type_name<T2>();
        add("sameQ" + name, size,
            [=](benchmark::State& state) { measure_sameQ<T1, T2>(state, name, size, workload); });
        add("memcmp" + name, size,
            [=](benchmark::State& state) { measure_memcmp<T1, T2>(state, size); });
    }
}

template <typename... Sets>
const char* best_set(type_list<Sets...> /*sets*/) {
    const char* best = "none";
    (void)(... || (Sets::supported() && (best = Sets::name, true)));
    return best;
}

} // namespace

int main(int count, char** arguments) {
    for (const Size& size : sizes) {
        for_each_pair_with_loop([&](auto tag1, auto tag2) {
            add_pair<typename decltype(tag1)::type, typename decltype(tag2)::type>(size);
        });
    }
    benchmark::Initialize(&count, arguments);
    if (benchmark::ReportUnrecognizedArguments(count, arguments)) {
        return EXIT_FAILURE;
    }
    benchmark::AddCustomContext("compiler", COMPILER);
    benchmark::AddCustomContext("instruction_set", best_set(talnumericarray::instruction_sets{}));
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return EXIT_SUCCESS;
}
