#include "box_reader.h"

#include <algorithm>
#include <cstring>

namespace talcmp {
namespace {

// Copies elements from one regular slot to another; both strides are in elements.
template <std::size_t size>
void scatter(unsigned char* to, const std::size_t to_stride, const unsigned char* from,
             const std::size_t from_stride, const std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        std::memcpy(to + i * to_stride * size, from + i * from_stride * size, size);
    }
}

void scatter(const std::size_t size, unsigned char* to, const std::size_t to_stride,
             const unsigned char* from, const std::size_t from_stride, const std::size_t count) {
    static_assert(largest_element_size == 16, "there is a case for each size");
    switch (size) {
    case 1:
        return scatter<1>(to, to_stride, from, from_stride, count);
    case 2:
        return scatter<2>(to, to_stride, from, from_stride, count);
    case 4:
        return scatter<4>(to, to_stride, from, from_stride, count);
    case 8:
        return scatter<8>(to, to_stride, from, from_stride, count);
    default:
        return scatter<16>(to, to_stride, from, from_stride, count);
    }
}

class BoxReader {
  public:
    // In `axes`, long strides come first.
    BoxReader(ArraySource& source, const std::vector<BoxAxis>& axes, unsigned char* const buffer)
        : source_(source), element_size_(source.type().size), buffer_(buffer), begin_(axes.data()),
          end_(axes.data() + axes.size()) {}

    void read(const std::uint64_t first) {
        const BoxAxis* const packed = first_packed();
        if (packed == end_) {
            for_each_step(begin_, end_ - 1, first, 0,
                          [this](auto position, auto slot) { read_with_gaps(position, slot); });
            return;
        }
        for_each_step(begin_, packed, first, 0,
                      [&](auto position, auto slot) { read_packed(packed, position, slot); });
    }

  private:
    static constexpr std::size_t longest_stretch = std::size_t{256} * 1024; // bytes with gaps
    static constexpr std::size_t longest_gap = 256;                         // bytes read in vain

    // The first axis from which all elements are stored without gaps.
    const BoxAxis* first_packed() const {
        const BoxAxis* axis = end_;
        std::uint64_t length = 1;
        while (axis != begin_ && (axis[-1].stride == length || axis[-1].extent == 1)) {
            --axis;
            length *= axis->extent;
        }
        return axis;
    }

    void read_packed(const BoxAxis* const packed, const std::uint64_t position,
                     const std::size_t slot) {
        std::size_t count = 1;
        for (const BoxAxis* axis = packed; axis != end_; ++axis) {
            count *= axis->extent;
        }
        const BoxAxis& last = end_[-1];
        if (packed + 1 == end_ && last.slot_stride == 1) {
            source_.read(position, count, buffer_ + slot * element_size_);
            return;
        }
        stretch_.resize(count * element_size_);
        source_.read(position, count, stretch_.data());
        for_each_step(packed, end_ - 1, 0, slot, [&](auto from, auto to) {
            scatter(element_size_, buffer_ + to * element_size_, last.slot_stride,
                    stretch_.data() + static_cast<std::size_t>(from) * element_size_, 1,
                    last.extent);
        });
    }

    // Reads along the last axis, where other elements are stored between those of the box.
    void read_with_gaps(const std::uint64_t position, const std::size_t slot) {
        const BoxAxis& last = end_[-1];
        const bool one_by_one = last.stride > longest_gap / element_size_;
        const auto stride = static_cast<std::size_t>(one_by_one ? 1 : last.stride);
        const std::size_t at_once =
            one_by_one ? 1 : std::max<std::size_t>(longest_stretch / (stride * element_size_), 1);
        for (std::size_t done = 0; done < last.extent; done += at_once) {
            const std::size_t count = std::min(at_once, last.extent - done);
            const std::size_t span = (count - 1) * stride + 1;
            stretch_.resize(span * element_size_);
            source_.read(position + done * last.stride, span, stretch_.data());
            scatter(element_size_, buffer_ + (slot + done * last.slot_stride) * element_size_,
                    last.slot_stride, stretch_.data(), stride, count);
        }
    }

    ArraySource& source_;
    std::size_t element_size_;
    unsigned char* buffer_;
    const BoxAxis* begin_;
    const BoxAxis* end_;
    std::vector<unsigned char> stretch_;
};

} // namespace

void read_box(ArraySource& source, const std::uint64_t first, std::vector<BoxAxis> axes,
              void* const buffer) {
    std::sort(axes.begin(), axes.end(),
              [](const BoxAxis& one, const BoxAxis& other) { return one.stride > other.stride; });
    BoxReader(source, axes, static_cast<unsigned char*>(buffer)).read(first);
}

} // namespace talcmp
