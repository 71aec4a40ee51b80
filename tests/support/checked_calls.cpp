#include "checked_calls.h"

#include "array_record.h"
#include "oracle.h"
#include "random_arrays.h"
#include "talnumericarray_compare.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <iomanip>
#include <iostream>
#include <random>
#include <sstream>
#include <string>

namespace oracle {
namespace {

constexpr std::uint64_t most_mismatches = 10;
constexpr std::size_t largest_element = 16;

// An array at the end of its storage, where a sanitizer sees a read past the last element, and
// where the alignment follows from the count.
class Operand {
  public:
    Operand() : storage_(largest_element * static_cast<std::size_t>(largest_count)) {}

    void reset(int type_id, std::int32_t count) {
        array_.type_id = type_id;
        array_.element_count = count;
        array_.dimensions.assign(1, count);
        size_ = element_size(type_id) * static_cast<std::size_t>(count);
        array_.data = data();
    }

    unsigned char* data() { return storage_.data() + storage_.size() - size_; }
    std::size_t size() const { return size_; }
    Array& array() { return array_; }
    const Array& array() const { return array_; }

    st_TalDataArray record() {
        return record_of(array_.type_id, data(), array_.dimensions, array_.element_count);
    }

  private:
    std::vector<unsigned char> storage_;
    std::size_t size_ = 0;
    Array array_{};
};

struct Call {
    double tolerance = 0;
    int compare_different_types = 0;
    Operand first;
    Operand second;
};

// Reals and complex numbers come twice as often as integers.
int random_type_id(Draws& draws) {
    const int id = draws.between(1, 16);
    return id > 12 ? id - 4 : id;
}

void disturb(Draws& draws, Call& call) {
    static const int unknown_ids[] = {-1, 0, 13, 256 + 5};
    Array& victim = draws.one_in(2) ? call.first.array() : call.second.array();
    switch (draws.below(5)) {
    case 0:
        victim.type_id = draws.pick(unknown_ids);
        break;
    case 1:
        victim.element_count = 0;
        break;
    case 2:
        victim.dimensions.push_back(1);
        break;
    case 3:
        victim.dimensions.back() += 1;
        break;
    default:
        call.first.array().dimensions.clear();
        call.second.array().dimensions.clear();
    }
}

void draw(Draws& draws, double tolerance, Call& call) {
    const std::int32_t count = random_count(draws);
    call.tolerance = tolerance;
    call.compare_different_types = draws.one_in(32) ? 0 : draws.pick({1, 1, 1, -1, 256});
    call.first.reset(random_type_id(draws), count);
    call.second.reset(random_type_id(draws), count);
    fill_arrays(draws, call.tolerance, call.first.array().type_id, call.second.array().type_id,
                count, call.first.data(), call.second.data());
    if (draws.one_in(64)) {
        disturb(draws, call);
    }
}

std::string described(const char* name, Operand& operand) {
    std::ostringstream text;
    text << "\n  " << name << ": type " << operand.array().type_id << ", count "
         << operand.array().element_count << ", dimensions";
    for (const std::int32_t dimension : operand.array().dimensions) {
        text << ' ' << dimension;
    }
    text << ", bytes" << std::hex << std::setfill('0');
    for (std::size_t i = 0; i < operand.size(); ++i) {
        text << ' ' << std::setw(2) << static_cast<unsigned>(operand.data()[i]);
    }
    return text.str();
}

std::string described(const State& state, Call& call) {
    std::ostringstream text;
    text << std::hexfloat << "\n  tolerance " << call.tolerance << ", compare_different_types "
         << call.compare_different_types << "\n  cached before the call: single "
         << state.of_singles.last_tolerance << " -> " << state.of_singles.factor << ", double "
         << state.of_doubles.last_tolerance << " -> " << state.of_doubles.factor;
    return text.str() + described("first", call.first) + described("second", call.second);
}

bool is_tallied(int type_id) {
    return type_id >= 1 && type_id <= 12;
}

void count(Tally& tally, const Call& call, bool answer) {
    const int first = call.first.array().type_id;
    const int second = call.second.array().type_id;
    ++tally.calls;
    tally.same += answer ? 1 : 0;
    if (is_tallied(first) && is_tallied(second)) {
        tally.answered[answer ? 1 : 0][first - 1][second - 1] = true;
    }
}

// Returns what is wrong, or nothing.
std::string check(State& state, Call& call, Tally& tally) {
    const State before = state;
    st_TalDataArray first = call.first.record();
    st_TalDataArray second = call.second.record();
    const int answer =
        TalNumericArray_sameQ(call.tolerance, call.compare_different_types, &first, &second);
    const int equivalence = TalNumericArray_equivalentQ(&first, &second);
    const bool expected = same(state, call.tolerance, call.compare_different_types != 0,
                               call.first.array(), call.second.array());
    const bool expected_equivalence = equivalent(call.first.array(), call.second.array());
    count(tally, call, expected);
    if (answer == (expected ? 1 : 0) && equivalence == (expected_equivalence ? 1 : 0)) {
        return {};
    }
    std::ostringstream text;
    text << "sameQ " << answer << ", expected " << expected << "; equivalentQ " << equivalence
         << ", expected " << expected_equivalence;
    return text.str() + described(before, call);
}

std::uint64_t from_environment(const char* name, std::uint64_t otherwise) {
    const char* text = std::getenv(name);
    return text == nullptr ? otherwise : std::stoull(text);
}

} // namespace

std::uint64_t requested_calls() {
    return from_environment("TALNUMERICARRAY_RANDOM_CALLS", DEFAULT_RANDOM_CALLS);
}

std::uint64_t requested_seed() {
    return from_environment("TALNUMERICARRAY_SEED", std::random_device{}());
}

std::uint64_t printed_seed() {
    const std::uint64_t seed = requested_seed();
    std::cout << "TALNUMERICARRAY_SEED=" << seed << std::endl;
    return seed;
}

Tally run_checked_calls(std::uint64_t seed, std::uint64_t calls,
                        const std::vector<double>& tolerances) {
    Random random(seed);
    RandomTolerances random_tolerances;
    State state;
    Call call;
    Tally tally;
    const auto choices = static_cast<std::uint32_t>(tolerances.size());
    while (tally.calls < calls && tally.mismatches < most_mismatches) {
        const double tolerance =
            choices == 0 ? random_tolerances.next(random) : tolerances[random.below(choices)];
        draw(random, tolerance, call);
        const std::string wrong = check(state, call, tally);
        if (!wrong.empty()) {
            ++tally.mismatches;
            ADD_FAILURE() << "seed " << seed << ", call " << tally.calls << ": " << wrong;
        }
    }
    return tally;
}

} // namespace oracle
