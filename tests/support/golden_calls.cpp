#include "golden_calls.h"

#include "element_types.h"
#include "random_arrays.h"
#include "talnumericarray_compare.h"
#include "tolerance_shift_factor.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstdlib>
#include <limits>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

namespace golden {
namespace {

// ---- Elements as text

constexpr char digits[] = "0123456789abcdef";
constexpr bool little_endian = __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;

// Where in a part of an element its byte of this significance lies, 0 being the most significant.
std::size_t place(const std::size_t significance, const std::size_t part_size) {
    return little_endian ? part_size - 1 - significance : significance;
}

class Elements {
  public:
    Elements(const ElementType& type, const std::size_t count)
        : type_(&type), count_(static_cast<talint>(count)), bytes_(count * type.size) {}

    Elements(const ElementType& type, const std::string& text)
        : Elements(type, text.size() / (2 * type.size)) {
        if (text.size() != 2 * bytes_.size() || bytes_.empty()) {
            throw std::runtime_error("no whole number of elements: " + text);
        }
        for (std::size_t i = 0; i < bytes_.size(); ++i) {
            const std::string byte = text.substr(2 * i, 2);
            bytes_[in_memory(i)] = static_cast<unsigned char>(std::stoi(byte, nullptr, 16));
        }
    }

    std::string text() const {
        std::string result;
        for (std::size_t i = 0; i < bytes_.size(); ++i) {
            const unsigned byte = bytes_[in_memory(i)];
            result += digits[byte >> 4U];
            result += digits[byte & 15U];
        }
        return result;
    }

    int type_id() const { return type_->id; }
    void* data() { return bytes_.data(); }

    st_TalDataArray record() {
        st_TalDataArray result = {};
        result.dims = &count_;
        result.rank = 1;
        result.data_type = type_->id;
        result.nelems = count_;
        result.data = bytes_.data();
        return result;
    }

  private:
    // The byte in memory of the byte in the text.
    std::size_t in_memory(const std::size_t i) const {
        const std::size_t in_part = i % type_->part_size;
        return i - in_part + place(in_part, type_->part_size);
    }

    const ElementType* type_;
    talint count_;
    std::vector<unsigned char> bytes_;
};

const ElementType& type_of(const int id) {
    return element_types.at(static_cast<std::size_t>(id) - 1);
}

// ---- Calls and factors

struct Call {
    double tolerance;
    int any_type;
    Elements first;
    Elements second;
};

int answer_to(Call& call) {
    st_TalDataArray record1 = call.first.record();
    st_TalDataArray record2 = call.second.record();
    return TalNumericArray_sameQ(call.tolerance, call.any_type, &record1, &record2);
}

// Whether comparisons of this type ask for the factor of this tolerance.
template <typename Real>
bool has_factor(const double tolerance) {
    const Real rounded = static_cast<Real>(tolerance);
    return rounded > 0 && rounded < std::numeric_limits<Real>::digits;
}

template <typename Real>
Real factor_of(const double tolerance) {
    return nesk::ToleranceShiftFactor(static_cast<Real>(tolerance));
}

template <typename Real>
void record_factor(std::ostream& records, const char* name, const double tolerance) {
    if (has_factor<Real>(tolerance)) {
        records << name << ' ' << tolerance << ' ' << factor_of<Real>(tolerance) << '\n';
    }
}

Call random_call(oracle::Random& random, const double tolerance) {
    static const std::size_t counts[] = {1, 1, 1, 1, 1, 1, 2, 3};
    const std::size_t count = random.pick(counts);
    const int any_type = random.one_in(32) ? 0 : 1;
    const ElementType& type1 = type_of(random.between(1, 12));
    const ElementType& type2 = type_of(random.between(1, 12));
    Call call = {tolerance, any_type, {type1, count}, {type2, count}};
    oracle::fill_arrays(random, tolerance, type1.id, type2.id, static_cast<std::int32_t>(count),
                        call.first.data(), call.second.data());
    return call;
}

double read_number(std::istream& line) {
    std::string text;
    line >> text;
    char* end = nullptr;
    const double number = std::strtod(text.c_str(), &end);
    if (text.empty() || *end != '\0') {
        throw std::runtime_error("no number: " + text);
    }
    return number;
}

Call read_call(std::istream& line) {
    const double tolerance = read_number(line);
    int any_type = 0;
    int id1 = 0;
    int id2 = 0;
    std::string elements1;
    std::string elements2;
    line >> any_type >> id1 >> elements1 >> id2 >> elements2;
    return {tolerance, any_type, {type_of(id1), elements1}, {type_of(id2), elements2}};
}

class Checker {
  public:
    void check(const std::string& text) {
        std::istringstream line(text);
        std::string kind;
        line >> kind;
        if (kind == "call") {
            check_call(line);
        } else if (kind == "double") {
            check_factor<double>(line);
        } else if (kind == "single") {
            check_factor<float>(line);
        } else {
            ADD_FAILURE() << "no kind of record";
        }
    }

    Tally tally() const {
        Tally result = tally_;
        result.pairs_of_types = pairs_.size();
        return result;
    }

  private:
    template <typename Real>
    void check_factor(std::istream& line) {
        const double tolerance = read_number(line);
        const Real recorded = static_cast<Real>(read_number(line));
        const Real found = factor_of<Real>(tolerance);
        ++tally_.factors;
        if (found == recorded) {
            return;
        }
        EXPECT_NE(tolerance, std::trunc(tolerance)) << "the factor needs no pow";
        EXPECT_EQ(std::nextafter(found, recorded), recorded) << "differs beyond the last place";
        ++tally_.factors_of_other_pow;
    }

    void check_call(std::istream& line) {
        Call call = read_call(line);
        int recorded = -1;
        line >> recorded;
        const int answer = answer_to(call);
        ++tally_.calls;
        tally_.same += answer == 1 ? 1U : 0U;
        pairs_.insert({call.first.type_id(), call.second.type_id()});
        EXPECT_EQ(answer, recorded);
    }

    Tally tally_;
    std::set<std::pair<int, int>> pairs_;
};

} // namespace

void record(std::ostream& records, const std::uint64_t seed, const std::uint64_t calls) {
    oracle::Random random(seed);
    oracle::RandomTolerances tolerances;
    std::set<double> with_factors;
    records << std::hexfloat;
    for (std::uint64_t i = 0; i < calls; ++i) {
        const double tolerance = tolerances.next(random);
        if (!std::isnan(tolerance) && with_factors.insert(tolerance).second) {
            record_factor<double>(records, "double", tolerance);
            record_factor<float>(records, "single", tolerance);
        }
        Call call = random_call(random, tolerance);
        records << "call " << tolerance << ' ' << call.any_type << ' ' << call.first.type_id()
                << ' ' << call.first.text() << ' ' << call.second.type_id() << ' '
                << call.second.text() << ' ' << answer_to(call) << '\n';
    }
}

Tally check(std::istream& records) {
    Checker checker;
    std::string line;
    while (std::getline(records, line)) {
        SCOPED_TRACE(line);
        checker.check(line);
        if (testing::Test::HasFailure()) {
            break; // the first of many says it all
        }
    }
    return checker.tally();
}

} // namespace golden
