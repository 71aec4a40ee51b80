#include "difference.h"

#include "element_type.h"
#include "talnumericarray_compare.h"

#include <algorithm>

namespace talcmp {
namespace {

// Small enough that a slice is still in the cache when a difference in it is located, and that its
// count fits a record; large enough that the cost of a call does not show.
constexpr std::uint64_t elements_per_slice = std::uint64_t{1} << 16U;

// `count` elements as a record of rank 1, which points into itself and so stays where it is.
class Record {
  public:
    Record(const type_t type, const void* elements, const std::uint64_t count)
        : count_(static_cast<talint>(count)) {
        record_.dims = &count_;
        record_.rank = 1;
        record_.data_type = type;
        record_.nelems = count_;
        record_.data = const_cast<void*>(elements); // the predicates only read
    }
    Record(const Record&) = delete;
    Record& operator=(const Record&) = delete;
    ~Record() = default;

    TalNumericArray handle() { return &record_; }

  private:
    talint count_;
    st_TalDataArray record_ = {};
};

// One slice of both arrays, for questions about its parts.
class Slice {
  public:
    Slice(ArraySource& first, ArraySource& second, const talreal tolerance,
          const std::uint64_t start, const std::uint64_t count)
        : type1_(element_type(first.element_type())), type2_(element_type(second.element_type())),
          tolerance_(tolerance), count_(count),
          data1_(static_cast<const unsigned char*>(first.elements(start, count))),
          data2_(static_cast<const unsigned char*>(second.elements(start, count))) {}

    bool same() const { return same(0, count_); }

    // The position in the slice of the first pair that differs, given that there is one.
    //
    // The pairs are asked about once more, in order. That matters for tolerances whose answers
    // depend on whether a factor is remembered. A pair that was the same is so with the factor
    // remembered too. The first pair that was not either needed the factor, and then is not the
    // same with it, or did not; and then it left the factor as the pairs in front of it had made
    // it, which they make it again. Only a file that changes meanwhile can leave no pair to find.
    std::uint64_t first_different() const {
        std::uint64_t position = 0;
        while (position + 1 < count_ && same(position, 1)) {
            ++position;
        }
        return position;
    }

  private:
    bool same(const std::uint64_t start, const std::uint64_t count) const {
        Record record1(type1_.id, data1_ + start * type1_.size, count);
        Record record2(type2_.id, data2_ + start * type2_.size, count);
        constexpr int compare_different_types = 1;
        return TalNumericArray_sameQ(tolerance_, compare_different_types, record1.handle(),
                                     record2.handle())
               != 0;
    }

    const ElementType& type1_;
    const ElementType& type2_;
    talreal tolerance_;
    std::uint64_t count_;
    const unsigned char* data1_;
    const unsigned char* data2_;
};

} // namespace

std::optional<Difference> first_difference(ArraySource& first, ArraySource& second,
                                           const Question& question) {
    // Not by the records' dimensions, which are 32-bit: those of a file may be larger.
    if (first.shape() != second.shape()) {
        return Difference{Difference::Kind::shape, 0};
    }
    if (question.strict_type && first.element_type() != second.element_type()) {
        return Difference{Difference::Kind::type, 0};
    }
    const std::uint64_t total = first.element_count();
    for (std::uint64_t start = 0; start < total; start += elements_per_slice) {
        const std::uint64_t count = std::min(elements_per_slice, total - start);
        const Slice slice(first, second, question.tolerance, start, count);
        if (!slice.same()) {
            return Difference{Difference::Kind::element, start + slice.first_different()};
        }
    }
    return std::nullopt;
}

} // namespace talcmp
