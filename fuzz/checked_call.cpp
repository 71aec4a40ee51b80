#include "checked_call.h"

#include "array_record.h"
#include "talnumericarray_compare.h"

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <iomanip>
#include <sstream>
#include <utility>

#include <sanitizer/asan_interface.h>

namespace fuzz {
namespace {

// A complex number is aligned as its parts are.
std::size_t alignment_of(const int type_id) {
    const std::size_t size = is_known(type_id) ? oracle::element_size(type_id) : 1;
    return type_id == 11 || type_id == 12 ? size / 2 : size;
}

template <typename T>
void compare_one_pair(const double tolerance, const int type_id, const T x, const T y) {
    Operand first(type_id, {}, 1, 0);
    Operand second(type_id, {}, 1, 0);
    std::memcpy(first.element(0), &x, sizeof x);
    std::memcpy(second.element(0), &y, sizeof y);
    if (TalNumericArray_sameQ(tolerance, 0, &first.record(), &second.record()) != 1) {
        fail("two numbers that are near are not the same");
    }
}

void append(std::vector<unsigned char>& bytes, const void* from, const std::size_t count) {
    const auto* const begin = static_cast<const unsigned char*>(from);
    bytes.insert(bytes.end(), begin, begin + count);
}

} // namespace

bool is_known(const int type_id) {
    return type_id >= 1 && type_id <= 12;
}

Operand::Operand(const int type_id, std::vector<talint> dimensions, const talint count,
                 const std::size_t place)
    : array_{type_id, std::move(dimensions), count, nullptr},
      element_size_(is_known(type_id) ? oracle::element_size(type_id) : 1),
      place_(place - place % alignment_of(type_id)),
      bytes_(element_size_ * static_cast<std::size_t>(count)),
      block_(static_cast<unsigned char*>(
          ::operator new (place_ + bytes_, std::align_val_t{page_bytes}))) {
    ASAN_POISON_MEMORY_REGION(block_.get(), place_);
    std::memset(data(), 0, bytes_);
    array_.data = data();
    record_ = record_of(type_id, data(), array_.dimensions, count);
    record_.prec = 0.5;
    record_.refcount = 1;
}

std::string Operand::described() const {
    constexpr std::size_t longest = 256;
    std::ostringstream text;
    text << "type " << array_.type_id << ", count " << array_.element_count << ", dimensions";
    for (const std::int32_t dimension : array_.dimensions) {
        text << ' ' << dimension;
    }
    text << ", place in page " << place_ << ", bytes" << std::hex << std::setfill('0');
    for (std::size_t i = 0; i < std::min(bytes_, longest); ++i) {
        text << ' ' << std::setw(2) << static_cast<unsigned>(data()[i]);
    }
    return text.str() + (bytes_ > longest ? " ..." : "");
}

std::vector<unsigned char> Operand::contents() const {
    std::vector<unsigned char> bytes;
    bytes.reserve(sizeof record_ + array_.dimensions.size() * sizeof(talint) + bytes_);
    append(bytes, &record_, sizeof record_);
    append(bytes, array_.dimensions.data(), array_.dimensions.size() * sizeof(talint));
    append(bytes, data(), bytes_);
    return bytes;
}

oracle::State known_state() {
    constexpr double tolerance = 10;
    compare_one_pair(tolerance, 9, 1.0F, 1.0F + 0x1p-20F);
    compare_one_pair(tolerance, 10, 1.0, 1.0 + 0x1p-50);
    return {{tolerance, 0x1p-14}, {tolerance, 0x1p-43}};
}

void check_call(oracle::State& state, const double tolerance, const int compare_different_types,
                Operand& first, Operand& second) {
    const oracle::State before = state;
    const std::vector<unsigned char> contents1 = first.contents();
    const std::vector<unsigned char> contents2 = second.contents();
    const int answer = TalNumericArray_sameQ(tolerance, compare_different_types, &first.record(),
                                             &second.record());
    const int equivalence = TalNumericArray_equivalentQ(&first.record(), &second.record());
    const int expected = static_cast<int>(oracle::same(
        state, tolerance, compare_different_types != 0, first.array(), second.array()));
    const int expected_equivalence =
        static_cast<int>(oracle::equivalent(first.array(), second.array()));
    const bool unchanged = contents1 == first.contents() && contents2 == second.contents();
    if (answer == expected && equivalence == expected_equivalence && unchanged) {
        return;
    }
    std::ostringstream text;
    text << "sameQ " << answer << ", expected " << expected << "; equivalentQ " << equivalence
         << ", expected " << expected_equivalence << "; the arrays are "
         << (unchanged ? "unchanged" : "changed") << std::hexfloat << "\n  tolerance " << tolerance
         << ", compare_different_types " << compare_different_types
         << "\n  remembered before the call: single " << before.of_singles.last_tolerance << " -> "
         << before.of_singles.factor << ", double " << before.of_doubles.last_tolerance << " -> "
         << before.of_doubles.factor;
    fail(text.str() + "\n  first: " + first.described() + "\n  second: " + second.described());
}

void fail(const std::string& what_is_wrong) {
    std::fprintf(stderr, "%s\n", what_is_wrong.c_str());
    std::abort();
}

} // namespace fuzz
