// Whole calls over long arrays of every pair of element types that has a loop, each next to memcmp
// over as many bytes of similar memory.
//
//   element_loops [--quick]
//
// Writes a JSON object.

#include "array_record.h"
#include "filled_arrays.h"
#include "json_rows.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"
#include "talnumericarray_instruction_sets.h"
#include "turns.h"

#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

namespace {

// ---- What is measured

struct Size {
    const char* name;
    std::size_t bytes; // of both arrays together
    Effort effort;
};

constexpr std::size_t KiB = std::size_t{1} << 10;
constexpr std::size_t MiB = std::size_t{1} << 20;

constexpr Size sizes[] = {
    {"32KiB", 32 * KiB, {100'000, 12}},
    {"256KiB", 256 * KiB, {200'000, 12}},
    {"256MiB", 256 * MiB, {0, 5}},
};
constexpr Size quick_sizes[] = {{"32KiB", 32 * KiB, {0, 1}}};

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

// One block for the two arrays of a comparison, one after the other.
class Block {
  public:
    explicit Block(const std::size_t bytes)
        : bytes_(bytes), storage_(std::vector<unsigned char>(bytes + alignment, 1)) {}

    unsigned char* begin() {
        void* place = storage_.data();
        std::size_t space = storage_.size();
        return static_cast<unsigned char*>(std::align(alignment, bytes_, place, space));
    }

  private:
    static constexpr std::size_t alignment = 2 * MiB; // a large page

    std::size_t bytes_;
    std::vector<unsigned char> storage_;
};

// ---- The two measurements

// The length keeps the second array aligned too.
template <typename T1, typename T2>
constexpr std::size_t length(const std::size_t bytes) {
    constexpr std::size_t granule = 64;
    return bytes / (sizeof(T1) + sizeof(T2)) / granule * granule;
}

template <typename T1, typename T2>
void measure_pair(const Size& size, Block& arrays, Block& equal_bytes, JsonRows& rows) {
    const std::size_t len = length<T1, T2>(size.bytes);
    unsigned char* const data1 = arrays.begin();
    unsigned char* const data2 = data1 + len * sizeof(T1);
    ArrayRecord array1(element_type_id<T1>, data1, len);
    ArrayRecord array2(element_type_id<T2>, data2, len);

    const std::size_t half = len * (sizeof(T1) + sizeof(T2)) / 2;
    const unsigned char* const bytes1 = equal_bytes.begin();
    const unsigned char* const bytes2 = bytes1 + half;

    const Workload* filled = nullptr;
    for (const Workload& workload : workloads) {
        if (!compared_under_tolerance<T1, T2> && !workload.for_integers_too) {
            continue;
        }
        if (filled == nullptr || filled->contents != workload.contents) {
            fill<T1, T2>(workload.contents, data1, data2, len);
            filled = &workload;
        }
        std::vector<Contender> contenders;
        contenders.emplace_back([&] {
            return TalNumericArray_sameQ(workload.tol, 1, array1.handle(), array2.handle())
                   == right_answer(workload.contents);
        });
        contenders.emplace_back([=] { return std::memcmp(bytes1, bytes2, half) == 0; });
        take_turns(contenders, size.effort);
        rows.row()
            .add("size", size.name)
            .add("workload", workload.name)
            .add("type1", type_name<T1>())
            .add("type2", type_name<T2>())
            .add("sameQ", contenders[0].nanoseconds())
            .add("memcmp", contenders[1].nanoseconds());
    }
}

template <std::size_t count>
void measure_all(const Size (&all_sizes)[count], JsonRows& rows) {
    for (const Size& size : all_sizes) {
        Block arrays(size.bytes);
        Block equal_bytes(size.bytes); // for memcmp
        for_each_pair_with_loop([&](auto tag1, auto tag2) {
            measure_pair<typename decltype(tag1)::type, typename decltype(tag2)::type>(
                size, arrays, equal_bytes, rows);
        });
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
    const bool quick = is_quick(count, arguments);
    std::printf(R"({"compiler": "%s", "instruction_set": "%s", "rows": )", COMPILER,
                best_set(talnumericarray::instruction_sets{}));
    JsonRows rows;
    if (quick) {
        measure_all(quick_sizes, rows);
    } else {
        measure_all(sizes, rows);
    }
    std::puts("\n]}");
    return EXIT_SUCCESS;
}
