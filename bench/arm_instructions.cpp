// Whole calls of every pair of element types that has a loop, for arm_instructions.py, which runs
// this under an emulator and counts the instructions between the two marks.
//
//   arm_instructions
//
// Prints a line for each call, in order: its types, workload and length.

#include "array_record.h"
#include "filled_arrays.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"
#include "type_properties.h"

#include <complex>
#include <cstddef>
#include <cstdio>
#include <cstdlib>

// C names, so that they can be found among the program's symbols.
extern "C" {
[[gnu::noinline]] void counting_begins() {
    asm volatile("" : : : "memory");
}

[[gnu::noinline]] void counting_ends() {
    asm volatile("" : : : "memory");
}
}

namespace {

constexpr std::size_t lengths[] = {256, 512};
constexpr std::size_t longest = 512;

struct alignas(4096) Memory {
    unsigned char bytes[longest * sizeof(std::complex<double>)];
};

Memory memory1;
Memory memory2;

template <typename T1, typename T2>
void call(const Contents contents, const char* const workload) {
    fill<T1, T2>(contents, memory1.bytes, memory2.bytes, longest);
    for (const std::size_t len : lengths) {
        ArrayRecord array1(element_type_id<T1>, memory1.bytes, len);
        ArrayRecord array2(element_type_id<T2>, memory2.bytes, len);
        counting_begins();
        const int answer =
            TalNumericArray_sameQ(whole_tolerance, 1, array1.handle(), array2.handle());
        counting_ends();
        if (answer != right_answer(contents)) {
            std::fputs("arm_instructions: the answer is wrong\n", stdout);
            std::abort();
        }
        std::printf("%s %s %s %zu\n", type_name<T1>().c_str(), type_name<T2>().c_str(), workload,
                    len);
    }
}

} // namespace

int main() {
    for_each_pair_with_loop([](auto tag1, auto tag2) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        call<T1, T2>(Contents::identical, "identical");
        if constexpr (compared_under_tolerance<T1, T2>) {
            call<T1, T2>(Contents::near, "near");
        }
    });
    return EXIT_SUCCESS;
}
