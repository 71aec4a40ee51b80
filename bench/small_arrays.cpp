// Whole calls over short arrays of every pair of element types that has a loop, each next to what a
// program could call instead: a plain loop of its own, the rule one by one, or memcmp. Also calls
// over arrays that begin at different places in a page.
//
//   small_arrays [--quick]
//
// Writes a JSON object.

#include "array_record.h"
#include "filled_arrays.h"
#include "json_rows.h"
#include "taldata_array_element_types.h"
#include "talnumericarray_compare.h"
#include "turns.h"
#include "type_properties.h"
#include "user_loops.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <deque>
#include <initializer_list>
#include <limits>
#include <vector>

// From the module built once more, with the rule one by one and no vectors; see
// `TalNumericArray_sameQ`.
extern "C" int one_by_one_sameQ(talreal tol, int compare_different_types, TalNumericArray na1,
                                TalNumericArray na2) noexcept;

namespace {

// ---- What is measured

constexpr talint lengths[] = {1,   2,   3,   4,   5,   6,   7,   8,   9,   12, 15,
                              16,  17,  24,  31,  32,  33,  48,  63,  64,  65, 96,
                              127, 128, 129, 192, 255, 256, 257, 384, 511, 512};
constexpr talint lengths_that_differ[] = {1, 2, 8, 32, 512};
constexpr talint lengths_at_places[] = {32, 100, 512, 4096};
constexpr std::size_t longest = 4096;
constexpr std::size_t page = 4096;
constexpr std::size_t places = 64;

struct Efforts {
    Effort lengths;
    Effort first_differs;
    Effort places;
};

constexpr Efforts full = {{3000, 100}, {3000, 400}, {6000, 30}};
constexpr Efforts quick = {{0, 1}, {0, 1}, {0, 1}};

// ---- Memory

struct alignas(page) Memory {
    unsigned char bytes[page + longest * sizeof(std::complex<double>)];
};

Memory memory1;
Memory memory2;
Memory filled1;
Memory filled2;

// ---- The contenders

// One question, put to each contender.
class Question {
  public:
    Question(const type_t id1, void* const data1, const type_t id2, void* const data2,
             const talint len, const Contents contents)
        : array1_(id1, data1, static_cast<std::size_t>(len)),
          array2_(id2, data2, static_cast<std::size_t>(len)),
          right_answer_(right_answer(contents)) {}

    Contender library(const talreal tol) {
        return Contender([this, tol] {
            return TalNumericArray_sameQ(tol, 1, array1_.handle(), array2_.handle())
                   == right_answer_;
        });
    }

    Contender one_by_one() {
        return Contender([this] {
            return one_by_one_sameQ(whole_tolerance, 1, array1_.handle(), array2_.handle())
                   == right_answer_;
        });
    }

    // `bits` is that of the type in which the elements are compared.
    Contender user(UserLoop (&loop_of)(type_t, type_t), const int bits) {
        const auto* const first = array1_.handle();
        const auto* const second = array2_.handle();
        const UserLoop loop = loop_of(first->data_type, second->data_type);
        const double relative = std::exp2(whole_tolerance - bits);
        const bool right = right_answer_ != 0;
        return Contender(
            [=] { return loop(relative, first->data, second->data, first->nelems) == right; });
    }

    Contender bytes(const std::size_t size) {
        const auto* const first = array1_.handle();
        const auto* const second = array2_.handle();
        return Contender([=] {
            return std::memcmp(first->data, second->data,
                               static_cast<std::size_t>(first->nelems) * size)
                   == 0;
        });
    }

  private:
    ArrayRecord array1_;
    ArrayRecord array2_;
    int right_answer_;
};

// They stay in place, as contenders refer to them.
using Questions = std::deque<Question>;

// ---- Measurements, a list of rows each

// Over arrays of each length, which all begin with the same numbers. `contenders_of(question)`
// makes the contenders, whose times get these names.
template <typename T1, typename T2, typename Lengths, typename ContendersOf>
void measure(const Lengths& all_lengths, const Contents contents, const char* const workload,
             const Effort& effort, const std::initializer_list<const char*> names,
             const ContendersOf& contenders_of, JsonRows& rows) {
    fill<T1, T2>(contents, memory1.bytes, memory2.bytes, longest);
    Questions questions;
    std::vector<Contender> contenders;
    for (const talint len : all_lengths) {
        Question& question = questions.emplace_back(
            element_type_id<T1>, memory1.bytes, element_type_id<T2>, memory2.bytes, len, contents);
        for (const Contender& contender : contenders_of(question)) {
            contenders.push_back(contender);
        }
    }
    take_turns(contenders, effort);
    const Contender* contender = contenders.data();
    for (const talint len : all_lengths) {
        auto row = rows.row();
        row.add("type1", type_name<T1>()).add("type2", type_name<T2>());
        if (workload != nullptr) {
            row.add("workload", workload);
        }
        row.add("len", static_cast<std::size_t>(len));
        for (const char* const name : names) {
            row.add(name, (contender++)->nanoseconds());
        }
    }
}

// Next to the user's loop, in both builds.
template <typename T1, typename T2>
void measure_lengths(const Contents contents, const char* const workload, const Effort& effort,
                     JsonRows& rows) {
    static constexpr int bits =
        std::numeric_limits<type_common_t<to_real_type_t<T1>, to_real_type_t<T2>>>::digits;
    measure<T1, T2>(
        lengths, contents, workload, effort, {"library", "user", "user_native"},
        [](Question& question) -> std::vector<Contender> {
            return {question.library(whole_tolerance), question.user(user_loop, bits),
                    question.user(user_loop_for_this_processor, bits)};
        },
        rows);
}

// A difference in the first element, next to the rule one by one.
template <typename T1, typename T2>
void measure_first_differs(const Effort& effort, JsonRows& rows) {
    measure<T1, T2>(
        lengths_that_differ, Contents::first_differs, nullptr, effort, {"library", "one_by_one"},
        [](Question& question) -> std::vector<Contender> {
            return {question.library(whole_tolerance), question.one_by_one()};
        },
        rows);
}

// What is compared as bytes, next to memcmp.
template <typename T>
void measure_bytes(const Effort& effort, JsonRows& rows) {
    constexpr talreal no_tolerance = 0;
    measure<T, T>(
        lengths, Contents::identical, nullptr, effort, {"library", "memcmp"},
        [](Question& question) -> std::vector<Contender> {
            return {question.library(no_tolerance), question.bytes(sizeof(T))};
        },
        rows);
}

// Somewhere in each cache line of a page, and at each place in a line that alignment allows.
template <typename T>
std::size_t place_in_page(const std::size_t place) {
    constexpr std::size_t line = page / places;
    return place * line + place * alignof(T) % line;
}

// Both arrays at `places` places. Near reals, or identical integers.
template <typename T1, typename T2>
void measure_places(const talint len, const Effort& effort, JsonRows& rows) {
    constexpr Contents contents =
        compared_under_tolerance<T1, T2> ? Contents::near : Contents::identical;
    constexpr std::size_t far_apart = 37;
    const auto count = static_cast<std::size_t>(len);
    fill<T1, T2>(contents, filled1.bytes, filled2.bytes, count);
    Questions questions;
    std::vector<Contender> contenders;
    const auto data1 = [](const std::size_t place) {
        return memory1.bytes + place_in_page<T1>(place);
    };
    const auto data2 = [](const std::size_t place) {
        return memory2.bytes + place_in_page<T2>(place * far_apart % places);
    };
    const auto put = [&](const std::size_t place) {
        std::memcpy(data1(place), filled1.bytes, count * sizeof(T1));
        std::memcpy(data2(place), filled2.bytes, count * sizeof(T2));
    };
    for (std::size_t place = 0; place < places; ++place) {
        Question& question = questions.emplace_back(
            element_type_id<T1>, data1(place), element_type_id<T2>, data2(place), len, contents);
        contenders.push_back(question.library(whole_tolerance));
        put(place);
        contenders.back().choose_calls(effort.batch);
    }
    for (int turn = 0; turn < effort.turns; ++turn) {
        for (std::size_t place = 0; place < places; ++place) {
            put(place);
            contenders[place].take_turn();
        }
    }
    std::vector<double> times;
    times.reserve(places);
    for (const Contender& contender : contenders) {
        times.push_back(contender.nanoseconds());
    }
    std::sort(times.begin(), times.end());
    rows.row()
        .add("type1", type_name<T1>())
        .add("type2", type_name<T2>())
        .add("len", count)
        .add("median", times[places / 2])
        .add("slowest", times.back());
}

// ---- All of them

// Calls `measure` with the tags of each pair, and the rows of a list called `name`.
template <typename Measure>
void list_of_pairs(const char* const name, const Measure& measure) {
    std::printf("\"%s\": ", name);
    JsonRows rows;
    for_each_pair_with_loop([&](auto tag1, auto tag2) { measure(tag1, tag2, rows); });
    std::puts("\n],");
}

void measure_all(const Efforts& efforts) {
    std::puts("{");
    list_of_pairs("lengths", [&](auto tag1, auto tag2, JsonRows& rows) {
        using T1 = typename decltype(tag1)::type;
        using T2 = typename decltype(tag2)::type;
        measure_lengths<T1, T2>(Contents::identical, "identical", efforts.lengths, rows);
        if constexpr (compared_under_tolerance<T1, T2>) {
            measure_lengths<T1, T2>(Contents::near, "near", efforts.lengths, rows);
        }
    });
    list_of_pairs("first_differs", [&](auto tag1, auto tag2, JsonRows& rows) {
        measure_first_differs<typename decltype(tag1)::type, typename decltype(tag2)::type>(
            efforts.first_differs, rows);
    });
    list_of_pairs("places", [&](auto tag1, auto tag2, JsonRows& rows) {
        for (const talint len : lengths_at_places) {
            measure_places<typename decltype(tag1)::type, typename decltype(tag2)::type>(
                len, efforts.places, rows);
        }
    });
    std::printf("\"bytes\": ");
    JsonRows rows;
    for_each_type(
        [&](auto tag) { measure_bytes<typename decltype(tag)::type>(efforts.lengths, rows); });
    std::puts("\n]}");
}

} // namespace

int main(int count, char** arguments) {
    measure_all(is_quick(count, arguments) ? quick : full);
    return EXIT_SUCCESS;
}
