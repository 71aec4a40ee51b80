#include "golden_calls.h"

#include "array_record.h"
#include "element_types.h"
#include "oracle.h"
#include "random_arrays.h"
#include "rounded_factor.h"
#include "talnumericarray_compare.h"
#include "tolerance_shift_factor.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>
#include <set>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace golden {
namespace {

constexpr char title[] =
    "Random calls and their answers; tests/support/golden_calls.h explains the lines";

// ---- Calls

constexpr char digits[] = "0123456789abcdef";
constexpr bool little_endian = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;

std::string hexadecimal(const std::uint64_t value, const int length) {
    std::string text;
    for (int i = length - 1; i >= 0; --i) {
        text += digits[value >> (4 * i) & 15U];
    }
    return text;
}

class Elements {
  public:
    Elements(const ElementType& type, const std::size_t count)
        : type_(&type), count_(static_cast<talint>(count)), bytes_(count * type.size) {}

    // The bits of each part, the most significant first, without separators.
    std::string text() const {
        std::string result;
        for (std::size_t i = 0; i < bytes_.size(); ++i) {
            const std::size_t at = little_endian ? i ^ (type_->part_size - 1) : i;
            result += hexadecimal(bytes_[at], 2);
        }
        return result;
    }

    int type_id() const { return type_->id; }
    void* data() { return bytes_.data(); }

    st_TalDataArray record() { return record_of(type_->id, bytes_.data(), count_); }

    oracle::Array for_oracle() const { return {type_->id, {count_}, count_, bytes_.data()}; }

  private:
    const ElementType* type_;
    talint count_;
    std::vector<unsigned char> bytes_;
};

struct Call {
    double tolerance;
    int any_type;
    Elements first;
    Elements second;
};

std::string text_of(const Call& call) {
    std::uint64_t tolerance = 0;
    std::memcpy(&tolerance, &call.tolerance, sizeof tolerance);
    return "bits of tolerance " + hexadecimal(tolerance, 16) + ", any type "
           + std::to_string(call.any_type) + ", types " + std::to_string(call.first.type_id())
           + " and " + std::to_string(call.second.type_id()) + ", elements " + call.first.text()
           + " and " + call.second.text();
}

int answer_to(Call& call) {
    st_TalDataArray record1 = call.first.record();
    st_TalDataArray record2 = call.second.record();
    return TalNumericArray_sameQ(call.tolerance, call.any_type, &record1, &record2);
}

const ElementType& random_type(oracle::Random& random) {
    return element_types.at(random.below(12));
}

class Calls {
  public:
    explicit Calls(const std::uint64_t seed) : random_(seed) {}

    std::vector<Call> next_block() {
        std::vector<Call> block;
        for (std::uint64_t i = 0; i < calls_per_block; ++i) {
            block.push_back(next());
        }
        return block;
    }

  private:
    Call next() {
        static const std::size_t counts[] = {1, 1, 1, 1, 1, 1, 2, 3};
        const double tolerance = tolerances_.next(random_);
        const std::size_t count = random_.pick(counts);
        const int any_type = random_.one_in(32) ? 0 : 1;
        const ElementType& type1 = random_type(random_);
        const ElementType& type2 = random_type(random_);
        Call call = {tolerance, any_type, {type1, count}, {type2, count}};
        oracle::fill_arrays(random_, tolerance, type1.id, type2.id,
                            static_cast<std::int32_t>(count), call.first.data(),
                            call.second.data());
        return call;
    }

    oracle::Random random_;
    oracle::RandomTolerances tolerances_;
};

// 64-bit FNV-1a of the text of the calls.
std::string digest_of(const std::vector<Call>& calls) {
    std::uint64_t digest = 0xcbf29ce484222325;
    for (const Call& call : calls) {
        for (const char character : text_of(call)) {
            digest = (digest ^ static_cast<unsigned char>(character)) * 0x100000001b3;
        }
    }
    return hexadecimal(digest, 16);
}

// ---- Answers

int oracle_answer_to(const Call& call, oracle::State& state) {
    const bool same = oracle::same(state, call.tolerance, call.any_type != 0,
                                   call.first.for_oracle(), call.second.for_oracle());
    return same ? 1 : 0;
}

// Four answers to a digit.
std::string answers_to(std::vector<Call>& block, oracle::State& state) {
    std::string answers;
    std::size_t four_answers = 0;
    for (std::size_t i = 0; i < block.size(); ++i) {
        const int answer = answer_to(block[i]);
        if (answer != oracle_answer_to(block[i], state)) {
            throw std::runtime_error("the oracle answers otherwise: " + text_of(block[i]));
        }
        four_answers = four_answers % 8 * 2 + static_cast<std::size_t>(answer);
        if (i % 4 == 3) {
            answers += digits[four_answers];
        }
    }
    return answers;
}

class Checker {
  public:
    explicit Checker(const std::uint64_t seed) : calls_(seed) {}

    void check_block(const std::string& digest, const std::string& answers) {
        std::vector<Call> block = calls_.next_block();
        if (digest_of(block) != digest) {
            ADD_FAILURE() << "other calls are drawn than were recorded after the first "
                          << tally_.calls;
        } else if (4 * answers.size() != block.size()) {
            ADD_FAILURE() << "not the answers of a block: " << answers;
        }
        for (std::size_t i = 0; i < block.size() && !testing::Test::HasFailure(); ++i) {
            const int four_answers = std::stoi(answers.substr(i / 4, 1), nullptr, 16);
            check_call(block[i], four_answers / (8 >> i % 4) % 2);
        }
    }

    Tally tally() const {
        Tally result = tally_;
        result.pairs_of_types = pairs_.size();
        return result;
    }

  private:
    void check_call(Call& call, const int recorded) {
        ++tally_.calls;
        if (!std::isnan(call.tolerance) && tolerances_.insert(call.tolerance).second) {
            check_factor<double>(call.tolerance);
            check_factor<float>(call.tolerance);
        }
        const int answer = answer_to(call);
        tally_.same += answer == 1 ? 1U : 0U;
        pairs_.insert({call.first.type_id(), call.second.type_id()});
        EXPECT_EQ(answer, recorded) << "call " << tally_.calls << ", tolerance " << std::hexfloat
                                    << call.tolerance << ", " << text_of(call);
    }

    template <typename Real>
    void check_factor(const double wide_tolerance) {
        const Real tolerance = static_cast<Real>(wide_tolerance);
        if (!(tolerance > 0 && tolerance < std::numeric_limits<Real>::digits)) {
            return; // comparisons do not ask for its factor
        }
        ++tally_.factors;
        const Real found = nesk::ToleranceShiftFactor(tolerance);
        const Real rounded = oracle::rounded_factor(tolerance);
        if (found != rounded) {
            const bool needs_pow = tolerance != std::trunc(tolerance);
            EXPECT_TRUE(needs_pow && std::nextafter(found, rounded) == rounded)
                << std::hexfloat << "the factor of " << tolerance << " is " << found
                << ", the rounded one " << rounded;
            ++tally_.factors_rounded_otherwise;
        }
    }

    Calls calls_;
    std::set<double> tolerances_;
    std::set<std::pair<int, int>> pairs_;
    Tally tally_;
};

} // namespace

void record(std::ostream& records, const std::uint64_t seed, const std::uint64_t blocks) {
    Calls calls(seed);
    oracle::State state;
    records << title << "\nseed " << seed << '\n';
    for (std::uint64_t i = 0; i < blocks; ++i) {
        std::vector<Call> block = calls.next_block();
        records << digest_of(block) << ' ' << answers_to(block, state) << '\n';
    }
}

Tally check(std::istream& records) {
    std::string word;
    std::uint64_t seed = 0;
    std::getline(records, word); // the title
    records >> word >> seed;
    EXPECT_EQ(word, "seed");

    Checker checker(seed);
    std::string digest;
    std::string answers;
    while (!testing::Test::HasFailure() && records >> digest >> answers) {
        checker.check_block(digest, answers);
    }
    return checker.tally();
}

} // namespace golden
