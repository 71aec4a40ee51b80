#include "hdf5_chunks.h"

#include "box_axis.h"
#include "hdf5_slab.h"

#include <algorithm>
#include <cstring>
#include <memory>
#include <utility>

#include <libdeflate.h>

namespace talcmp::hdf5 {
namespace {

// In bytes. Larger chunks, which are rare or damaged, are the library's matter; so that sizes fit a
// size_t on all platforms.
constexpr std::size_t largest_chunk = std::size_t{1} << 30U;

// In bytes; more than `largest_chunk` for all that are larger.
std::size_t chunk_size(const Shape& extents, const std::size_t element_size) {
    std::size_t size = element_size;
    for (const std::uint64_t extent : extents) {
        if (extent == 0 || size > largest_chunk / extent) {
            return largest_chunk + 1;
        }
        size *= static_cast<std::size_t>(extent);
    }
    return size;
}

// ---- What a slab and a chunk have in common

// Along one axis: `count` indices of the slab from `in_slab`, the first of which is `in_chunk`
// there.
struct CommonPart {
    std::size_t in_slab;
    std::size_t in_chunk;
    std::size_t count;
};

// There is at least one such index.
CommonPart common_part(const Slab::Axis& axis, const std::uint64_t begin,
                       const std::uint64_t extent) {
    const std::uint64_t first =
        begin <= axis.begin ? 0 : (begin - axis.begin + axis.step - 1) / axis.step;
    const std::uint64_t in_chunk = axis.begin + first * axis.step - begin;
    const std::uint64_t count =
        std::min(axis.extent - first, (extent - in_chunk - 1) / axis.step + 1);
    return {static_cast<std::size_t>(first), static_cast<std::size_t>(in_chunk),
            static_cast<std::size_t>(count)};
}

// Where the chunks begin that have elements of the slab, along one axis.
std::vector<std::uint64_t> chunks_along(const Slab::Axis& axis, const std::uint64_t extent) {
    std::vector<std::uint64_t> begins;
    for (std::uint64_t i = 0; i < axis.extent;) {
        const std::uint64_t begin = (axis.begin + i * axis.step) / extent * extent;
        begins.push_back(begin);
        i += common_part(axis, begin, extent).count;
    }
    return begins;
}

// The chunks that have elements of the slab, each by the indices of its first element.
std::vector<Shape> chunks_of(const Slab& slab, const Shape& extents) {
    std::vector<Shape> chunks = {{}};
    for (std::size_t axis = 0; axis < extents.size(); ++axis) {
        const std::vector<std::uint64_t> begins = chunks_along(slab.axes[axis], extents[axis]);
        std::vector<Shape> longer;
        for (const Shape& chunk : chunks) {
            for (const std::uint64_t begin : begins) {
                longer.push_back(chunk);
                longer.back().push_back(begin);
            }
        }
        chunks = std::move(longer);
    }
    return chunks;
}

// ---- Elements of a chunk

// Copies `count` elements that are `step` apart.
template <std::size_t size>
void take(unsigned char* const to, const unsigned char* const from, const std::size_t /*plane*/,
          const std::size_t step, const std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        std::memcpy(to + i * size, from + i * step * size, size);
    }
}

// Shuffling puts the first bytes of all elements before their second ones, which begin `plane`
// bytes later, and so on.
template <std::size_t size>
void take_shuffled(unsigned char* const to, const unsigned char* const from,
                   const std::size_t plane, const std::size_t step, const std::size_t count) {
    for (std::size_t i = 0; i < count; ++i) {
        for (std::size_t byte = 0; byte < size; ++byte) {
            to[i * size + byte] = from[byte * plane + i * step];
        }
    }
}

using Take = void (*)(unsigned char*, const unsigned char*, std::size_t, std::size_t, std::size_t);

Take take_of(const std::size_t element_size, const bool shuffled) {
    static_assert(largest_element_size == 16, "there is a case for each size");
    switch (element_size) {
    case 1:
        return take<1>; // shuffling changes nothing
    case 2:
        return shuffled ? take_shuffled<2> : take<2>;
    case 4:
        return shuffled ? take_shuffled<4> : take<4>;
    case 8:
        return shuffled ? take_shuffled<8> : take<8>;
    default:
        return shuffled ? take_shuffled<16> : take<16>;
    }
}

} // namespace

// What has been read of a chunk.
struct Chunks::Bytes {
    std::vector<unsigned char> stored;
    std::vector<unsigned char> inflated; // unused if they were not deflated
    const unsigned char* elements = nullptr;
    Shape extents; // of the elements, which may end where the array does
    bool shuffled = false;
    std::unique_ptr<libdeflate_decompressor, void (*)(libdeflate_decompressor*)> decompressor = {
        ::libdeflate_alloc_decompressor(), ::libdeflate_free_decompressor};
};

Chunks::Chunks(const hid_t dataset, Shape shape, Shape chunk, const std::size_t element_size,
               std::string name)
    : dataset_(dataset), shape_(std::move(shape)), element_size_(element_size),
      size_(chunk_size(chunk, element_size)), name_(std::move(name)) {
    const LibraryUse use(name_);
    type_ = Handle(checked(::H5Dget_type(dataset), name_, "has elements of an unreadable type"));
    const Handle creation(::H5Dget_create_plist(dataset));
    if (size_ <= largest_chunk && know_filters(creation.id())) {
        extents_ = std::move(chunk);
    }
}

// Notes the filters. Returns false if others, or others in this order, were applied.
bool Chunks::know_filters(const hid_t creation) {
    unsigned options = 0;
    if (::H5Pget_chunk_opts(creation, &options) < 0 || options != 0) {
        return false;
    }
    const int count = ::H5Pget_nfilters(creation);
    for (int i = 0; i < count; ++i) {
        unsigned flags = 0;
        unsigned parameter = 0; // the first one: when shuffling, the size of an element
        std::size_t parameters = 1;
        const H5Z_filter_t filter = ::H5Pget_filter2(creation, static_cast<unsigned>(i), &flags,
                                                     &parameters, &parameter, 0, nullptr, nullptr);
        const std::uint32_t bit = std::uint32_t{1} << static_cast<unsigned>(i);
        if (filter == H5Z_FILTER_SHUFFLE && i == 0 && parameter == element_size_) {
            shuffle_ = bit;
        } else if (filter == H5Z_FILTER_DEFLATE && i == count - 1) {
            deflate_ = bit;
        } else {
            return false;
        }
    }
    return count >= 0;
}

bool Chunks::read(const Slab& slab, void* const elements) const {
    if (extents_.empty()) {
        return false;
    }
    const std::vector<Shape> chunks = chunks_of(slab, extents_);
    const bool filtered = deflate_ != 0 || shuffle_ != 0;
    if (filtered ? !are_written(chunks) : !is_worth_reading(slab, chunks.size())) {
        return false;
    }
    Bytes bytes;
    return std::all_of(chunks.begin(), chunks.end(), [&](const Shape& chunk) {
        if (filtered ? !fetch(chunk, bytes) : !fetch_plain(chunk, bytes)) {
            return false;
        }
        copy(chunk, slab, bytes, static_cast<unsigned char*>(elements));
        return true;
    });
}

// Parts of chunks without filters the library reads from where they are, one after another. That
// is faster than to read them whole if the parts are few, or long, or little of all.
bool Chunks::is_worth_reading(const Slab& slab, const std::size_t chunks) const {
    constexpr std::uint64_t most_in_vain = 64;
    constexpr std::uint64_t long_part = std::uint64_t{64} * 1024;
    constexpr std::uint64_t few_parts = 16;
    std::uint64_t wanted = 1;
    for (const Slab::Axis& axis : slab.axes) {
        wanted *= axis.extent;
    }
    const std::uint64_t part =
        slab.axes.back().step == 1 ? std::min(slab.axes.back().extent, extents_.back()) : 1;
    return part * element_size_ < long_part && wanted / part >= few_parts * chunks
           && wanted >= chunks * (size_ / element_size_) / most_in_vain;
}

// The elements of a chunk that was never written have a value that the library knows.
bool Chunks::are_written(const std::vector<Shape>& chunks) const {
    const LibraryUse use(name_);
    return std::all_of(chunks.begin(), chunks.end(),
                       [this](const Shape& chunk) { return stored_size(chunk) != 0; });
}

// How many bytes of a chunk with filters there are in the file.
std::size_t Chunks::stored_size(const Shape& chunk) const {
    const std::vector<hsize_t> begin(chunk.begin(), chunk.end());
    hsize_t size = 0;
    // Deflating makes nothing much longer: there are such sizes in damaged files alone.
    if (::H5Dget_chunk_storage_size(dataset_, begin.data(), &size) < 0
        || size > size_ + size_ / 8 + 1024) {
        return 0;
    }
    return static_cast<std::size_t>(size);
}

bool Chunks::fetch(const Shape& chunk, Bytes& bytes) const {
    const std::vector<hsize_t> begin(chunk.begin(), chunk.end());
    std::uint32_t left_out = 0; // filters that were not applied to this chunk
    {
        const LibraryUse use(name_);
        bytes.stored.resize(stored_size(chunk));
        if (::H5Dread_chunk(dataset_, H5P_DEFAULT, begin.data(), &left_out, bytes.stored.data())
            < 0) {
            return false;
        }
    }
    bytes.extents = extents_;
    bytes.shuffled = (shuffle_ & ~left_out) != 0;
    if ((deflate_ & ~left_out) != 0) {
        return inflate(bytes);
    }
    bytes.elements = bytes.stored.data();
    return has_all_bytes(bytes.stored.size());
}

// Not as above: without filters, a damaged file may have larger chunks than the library says.
bool Chunks::fetch_plain(const Shape& chunk, Bytes& bytes) const {
    Slab slab;
    bytes.extents = extents_;
    for (std::size_t axis = 0; axis < chunk.size(); ++axis) {
        bytes.extents[axis] = std::min(bytes.extents[axis], shape_[axis] - chunk[axis]);
        slab.axes.push_back({chunk[axis], bytes.extents[axis], 1});
    }
    bytes.stored.resize(size_);
    bytes.elements = bytes.stored.data();
    return !read_slab(dataset_, type_.id(), slab, bytes.stored.data(), name_);
}

bool Chunks::inflate(Bytes& bytes) const {
    constexpr std::size_t best_ratio = 1032; // that the format allows
    if (bytes.stored.size() < size_ / best_ratio) {
        return has_all_bytes(0); // and no memory is taken for what cannot be there
    }
    if (bytes.decompressor == nullptr) {
        return false; // there was no memory for it
    }
    bytes.inflated.resize(size_);
    bytes.elements = bytes.inflated.data();
    std::size_t inflated = 0;
    const libdeflate_result result =
        ::libdeflate_zlib_decompress(bytes.decompressor.get(), bytes.stored.data(),
                                     bytes.stored.size(), bytes.inflated.data(), size_, &inflated);
    return result == LIBDEFLATE_SUCCESS && has_all_bytes(inflated);
}

// Throws Trouble if a chunk has fewer bytes than it should have. The library would read what is
// after them in memory.
bool Chunks::has_all_bytes(const std::size_t bytes) const {
    if (bytes < size_) {
        throw Trouble(name_, "has a chunk that is too short; is the file damaged?");
    }
    return bytes == size_;
}

void Chunks::copy(const Shape& chunk, const Slab& slab, const Bytes& bytes,
                  unsigned char* const elements) const {
    std::vector<BoxAxis> axes(extents_.size());
    std::size_t first_in_chunk = 0;
    std::size_t first_in_slab = 0;
    std::size_t chunk_stride = 1;
    std::size_t slab_stride = 1;
    for (std::size_t i = axes.size(); i-- > 0;) {
        const Slab::Axis& axis = slab.axes[i];
        const CommonPart part = common_part(axis, chunk[i], bytes.extents[i]);
        first_in_chunk += part.in_chunk * chunk_stride;
        first_in_slab += part.in_slab * slab_stride;
        axes[i] = {part.count, axis.step * chunk_stride, slab_stride};
        chunk_stride *= static_cast<std::size_t>(bytes.extents[i]);
        slab_stride *= static_cast<std::size_t>(axis.extent);
    }
    const BoxAxis& run = axes.back();
    const Take take_run = take_of(element_size_, bytes.shuffled);
    const std::size_t bytes_apart = bytes.shuffled ? 1 : element_size_;
    const std::size_t plane = size_ / element_size_;
    for_each_step(axes.data(), &run, first_in_chunk, first_in_slab,
                  [&](const std::uint64_t from, const std::size_t to) {
                      take_run(elements + to * element_size_,
                               bytes.elements + static_cast<std::size_t>(from) * bytes_apart, plane,
                               static_cast<std::size_t>(run.stride), run.extent);
                  });
}

} // namespace talcmp::hdf5
