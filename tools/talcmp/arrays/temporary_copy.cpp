#include "temporary_copy.h"

#include <algorithm>
#include <functional>
#include <numeric>
#include <vector>

namespace talcmp {
TemporaryCopy::TemporaryCopy(std::unique_ptr<ArraySource> source, const Copied& copied)
    : source_(std::move(source)) {
    copy_all(copied);
}

void TemporaryCopy::copy_all(const Copied& copied) {
    if (!source_->block().empty()) {
        copy_blocks(copied);
        return;
    }
    constexpr std::uint64_t elements_at_once = std::uint64_t{1} << 14U;
    const std::size_t size = source_->type().size;
    const std::uint64_t total = element_count(*source_);
    std::vector<char> buffer(static_cast<std::size_t>(std::min(elements_at_once, total)) * size);
    for (std::uint64_t first = 0; first < total; first += elements_at_once) {
        const std::uint64_t count = std::min(elements_at_once, total - first);
        const auto bytes = static_cast<std::size_t>(count) * size;
        source_->read(first, count, buffer.data());
        file_.write(first * size, buffer.data(), bytes);
        copied(bytes);
    }
    source_->check_to_end();
}

// Along the last axis as many blocks at once as a few MiB hold, so that runs in the file are long.
void TemporaryCopy::copy_blocks(const Copied& copied) {
    constexpr std::uint64_t bytes_at_once = std::uint64_t{2} << 20U;
    const Shape& shape = source_->shape();
    Shape tile = source_->block();
    const std::uint64_t bytes_of_block = std::accumulate(
        tile.begin(), tile.end(), std::uint64_t{source_->type().size}, std::multiplies<>());
    tile.back() *= std::max<std::uint64_t>(bytes_at_once / bytes_of_block, 1);

    std::vector<char> buffer;
    Shape begin(shape.size());
    while (begin[0] < shape[0]) {
        Slab slab;
        std::uint64_t count = 1;
        for (std::size_t axis = 0; axis < shape.size(); ++axis) {
            slab.axes.push_back({begin[axis], std::min(tile[axis], shape[axis] - begin[axis]), 1});
            count *= slab.axes[axis].extent;
        }
        buffer.resize(static_cast<std::size_t>(count) * source_->type().size);
        copy_slab(slab, buffer);
        copied(buffer.size());
        for (std::size_t axis = shape.size(); axis-- > 0;) {
            begin[axis] += tile[axis];
            if (axis == 0 || begin[axis] < shape[axis]) {
                break;
            }
            begin[axis] = 0;
        }
    }
}

void TemporaryCopy::copy_slab(const Slab& slab, std::vector<char>& buffer) {
    source_->read_slab(slab, buffer.data());
    const Shape& shape = source_->shape();
    const std::size_t run =
        static_cast<std::size_t>(slab.axes.back().extent) * source_->type().size;
    for (std::size_t done = 0; done < buffer.size(); done += run) {
        // The run's indices within the slab, from the last axis but one outwards.
        std::uint64_t number = done / run;
        std::uint64_t position = slab.axes.back().begin;
        std::uint64_t stride = shape.back();
        for (std::size_t axis = shape.size() - 1; axis-- > 0;) {
            const Slab::Axis& part = slab.axes[axis];
            position += (part.begin + number % part.extent) * stride;
            number /= part.extent;
            stride *= shape[axis];
        }
        file_.write(position * source_->type().size, buffer.data() + done, run);
    }
}

void TemporaryCopy::read(const std::uint64_t first, const std::uint64_t count,
                         void* const elements) {
    const std::size_t size = source_->type().size;
    const std::size_t bytes = static_cast<std::size_t>(count) * size;
    if (read_at(file_.descriptor().number(), file_.folder(), first * size, elements, bytes)
        < bytes) {
        throw Trouble(file_.folder(), "the temporary copy of the array there was cut short");
    }
}

} // namespace talcmp
