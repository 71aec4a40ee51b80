// The questions of both programs, with their answers. The threads ask about numbers so close to the
// limits of their tolerances that the factor of one thread would change the answers of another;
// except for the first thread, whose tolerance of zero needs no factor.

#include "questions.h"

#include "taldata_array_element_types.h"

#include <atomic>
#include <complex>
#include <cstddef>
#include <cstdio>
#include <iterator>
#include <thread>
#include <vector>

namespace {

// Under `tolerance` 1 is the same as `close`, and not the same as `apart`.
struct Limit {
    talreal tolerance;
    double close;
    double apart;
};

constexpr Limit limits[] = {
    {0, 1, 1 + 0x1p-52},
    {10, 1 + 0x1p-44, 1 + 0x1p-42},
    {20, 1 + 0x1p-34, 1 + 0x1p-32},
    {30.5, 1 + 0x1p-23, 1 + 0x1p-22},
};

// The record of two elements in one dimension. A record does not own what it points to.
template <typename T>
st_TalDataArray array_of(T (&elements)[2], talint& dimension) {
    st_TalDataArray array = {};
    array.rank = 1;
    array.dims = &dimension;
    array.data_type = element_type_id<T>;
    array.nelems = dimension;
    array.data = elements;
    return array;
}

// The number of wrong answers in one round of questions.
int wrong_answers(BytesToStore bytes_to_store, const Limit& limit) {
    talint two = 2;
    BIT8 integers[] = {1, 1};
    double ones[] = {1, 1};
    double close[] = {1, limit.close};
    double apart[] = {1, limit.apart};
    st_TalDataArray stored = array_of(ones, two);
    st_TalDataArray untyped = stored;
    untyped.data_type = UNINITIALIZED_TYPE;

    int wrong = 0;
    const auto expect = [&](const std::size_t bytes, st_TalDataArray arriving) {
        wrong += bytes_to_store(limit.tolerance, &stored, &arriving) == bytes ? 0 : 1;
    };
    expect(0, array_of(close, two));
    expect(2 * sizeof(double), array_of(apart, two));
    expect(2 * sizeof(BIT8), array_of(integers, two));
    // Only the runtime's own table of element sizes answers this.
    expect(2 * sizeof(std::complex<double>), untyped);
    return wrong;
}

} // namespace

int ask_from_threads(BytesToStore bytes_to_store) {
    // So many that a factor shared by the threads would be caught.
    constexpr int rounds = 200000;
    std::atomic<std::size_t> waiting{std::size(limits)};
    std::atomic<int> wrong{0};
    std::vector<std::thread> threads;
    for (const Limit& limit : limits) {
        threads.emplace_back([&, bytes_to_store] {
            --waiting;
            while (waiting > 0) {
                std::this_thread::yield();
            }
            for (int round = 0; round < rounds; ++round) {
                wrong += wrong_answers(bytes_to_store, limit);
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    std::printf("%zu threads, %d wrong answers\n", threads.size(), wrong.load());
    return wrong == 0 ? 0 : 1;
}
