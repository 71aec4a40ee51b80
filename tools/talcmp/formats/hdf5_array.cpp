#include "hdf5_array.h"

#include "descriptor.h"
#include "hdf5_other_files.h"
#include "hdf5_slab.h"

#include <algorithm>
#include <array>
#include <limits>
#include <utility>

#include <sys/stat.h>

namespace talcmp {
namespace {

using hdf5::checked;
using hdf5::Handle;
using hdf5::LibraryUse;

// ---- What the library says about an array

Handle open_dataset(const hid_t file, const std::string& location, const std::string& name) {
    const LibraryUse use(name);
    constexpr const char* what_failed = "cannot be opened";
    const Handle access(checked(::H5Pcreate(H5P_DATASET_ACCESS), name, what_failed));
    // The library keeps no chunks: each is asked for once, and one alone may be large.
    checked(::H5Pset_chunk_cache(access.id(), 0, 0, 0), name, what_failed);
    return Handle(checked(::H5Dopen2(file, location.c_str(), access.id()), name, what_failed));
}

Shape shape_of(const hid_t dataset, const std::string& name) {
    const LibraryUse use(name);
    constexpr const char* what_failed = "has a shape that cannot be read";
    const Handle space(checked(::H5Dget_space(dataset), name, what_failed));
    if (::H5Sget_simple_extent_type(space.id()) == H5S_NULL) {
        throw NotNumbers(name, "holds no array: it has neither a shape nor elements");
    }
    const int rank = checked(::H5Sget_simple_extent_ndims(space.id()), name, what_failed);
    std::vector<hsize_t> extents(static_cast<std::size_t>(rank));
    checked(::H5Sget_simple_extent_dims(space.id(), extents.data(), nullptr), name, what_failed);
    return {extents.begin(), extents.end()};
}

// Checks that the elements can be counted in bytes.
void check_countable(const Shape& shape, const std::size_t element_size, const std::string& name) {
    std::uint64_t most = std::numeric_limits<std::int64_t>::max() / element_size;
    for (std::size_t i = 0; has_elements(shape) && i < shape.size(); ++i) {
        most /= shape[i];
    }
    if (most == 0) {
        throw Trouble(name, "has a shape of more elements than 2^63 bytes hold");
    }
}

// The extents of a chunk. The library would crash, or never end, where they do not fit the shape.
Shape chunk_of(const hid_t creation, const Shape& shape, const std::string& name) {
    std::vector<hsize_t> extents(shape.size() + 1); // and room for one too many
    const int rank = ::H5Pget_chunk(creation, static_cast<int>(extents.size()), extents.data());
    if (rank < 0 || static_cast<std::size_t>(rank) != shape.size()) {
        throw Trouble(name, "has chunks that do not fit its shape; is the file damaged?");
    }
    extents.pop_back();
    return {extents.begin(), extents.end()};
}

bool is_contiguous(const hid_t creation) {
    return ::H5Pget_layout(creation) == H5D_CONTIGUOUS && ::H5Pget_nfilters(creation) == 0;
}

// How many bytes all elements take in the file.
std::uint64_t bytes_in_file(const hid_t dataset, const std::uint64_t count,
                            const std::string& name) {
    const Handle type(checked(::H5Dget_type(dataset), name, "has elements of an unreadable type"));
    return count * ::H5Tget_size(type.id());
}

// Checks that there is room in the file for all elements where they are one after another, or
// for none where nothing was written. The library would read what is after them.
void check_room(const hid_t dataset, const hid_t creation, const std::uint64_t bytes,
                const std::string& name) {
    if (!is_contiguous(creation) && ::H5Pget_layout(creation) != H5D_COMPACT) {
        return;
    }
    const hsize_t room = ::H5Dget_storage_size(dataset);
    if (room != 0 && room < bytes) {
        throw Trouble(name, "has less data than its shape says; is the file damaged?");
    }
}

std::uint64_t size_of_file(const int descriptor, const std::string& name) {
    struct stat status = {};
    if (::fstat(descriptor, &status) != 0) {
        throw_system_trouble(name, "cannot be read");
    }
    return static_cast<std::uint64_t>(status.st_size);
}

// ---- Filters

// A filter that the library lacks: "lzf (32000)"; empty if it has all that the array needs.
std::string missing_filter(const hid_t dataset) {
    const Handle creation(::H5Dget_create_plist(dataset));
    const int count = ::H5Pget_nfilters(creation.id());
    for (int i = 0; i < count; ++i) {
        std::array<char, 64> name = {};
        unsigned flags = 0;
        std::size_t values = 0;
        const H5Z_filter_t filter =
            ::H5Pget_filter2(creation.id(), static_cast<unsigned>(i), &flags, &values, nullptr,
                             name.size() - 1, name.data(), nullptr);
        if (::H5Zfilter_avail(filter) <= 0) {
            return name.data() + (" (" + std::to_string(filter) + ")");
        }
    }
    return "";
}

[[noreturn]] void throw_unreadable(const hid_t dataset, const std::string& reason,
                                   const std::string& name) {
    const std::string filter = missing_filter(dataset);
    if (filter.empty()) {
        throw Trouble(name, "cannot be read: " + reason + "; is the file complete and undamaged?");
    }
    throw Trouble(name, "cannot be read: the HDF5 library lacks the filter " + filter
                            + "; set HDF5_PLUGIN_PATH to the folder of its plugin");
}

// ---- Parts of an array

std::size_t count_of(const Slab& slab) {
    std::size_t count = 1;
    for (const Slab::Axis& axis : slab.axes) {
        count *= static_cast<std::size_t>(axis.extent);
    }
    return count;
}

} // namespace

Hdf5Array::Hdf5Array(std::shared_ptr<const Handle> file, std::string name,
                     const std::string& location)
    : file_(std::move(file)), name_(std::move(name)),
      dataset_(open_dataset(file_->id(), location, name_)),
      type_(hdf5::type_of(dataset_.id(), name_)), shape_(shape_of(dataset_.id(), name_)) {
    check_countable(shape_, std::max(type_.stored.size, type_.stored.type->size), name_);
    find_file();
    find_elements();
}

void Hdf5Array::find_file() {
    const LibraryUse use(name_);
    own_file_ =
        Handle(checked(::H5Iget_file_id(dataset_.id()), name_, "is in a file that cannot be used"));
    if (const auto descriptor = hdf5::descriptor_of(own_file_)) {
        descriptor_ = *descriptor;
        size_ = size_of_file(descriptor_, name_);
    }
}

void Hdf5Array::find_elements() {
    const LibraryUse use(name_);
    const Handle creation(
        checked(::H5Dget_create_plist(dataset_.id()), name_, "has an unreadable layout"));
    const std::uint64_t bytes = bytes_in_file(dataset_.id(), element_count(*this), name_);
    check_room(dataset_.id(), creation.id(), bytes, name_);
    hdf5::check_other_files(dataset_.id(), creation.id(), bytes, name_);
    const haddr_t offset = ::H5Dget_offset(dataset_.id());
    // Elements in files of their own have no offset in this one, nor have those that nobody wrote.
    is_contiguous_ = descriptor_ >= 0 && type_.as_in_file && is_contiguous(creation.id())
                     && offset != HADDR_UNDEF;
    if (is_contiguous_) {
        offset_ = offset;
        return;
    }
    find_blocks(creation.id());
}

// Without chunks all extents are one, of which any number can be read at once. No block is larger
// than the array.
void Hdf5Array::find_blocks(const hid_t creation) {
    block_.assign(shape_.size(), 1);
    if (::H5Pget_layout(creation) == H5D_CHUNKED) {
        block_ = chunk_of(creation, shape_, name_);
        if (type_.as_in_file) {
            chunks_ = hdf5::Chunks(dataset_.id(), shape_, block_, type_.stored.size, name_);
        }
    }
    for (std::size_t axis = 0; axis < shape_.size(); ++axis) {
        block_[axis] = std::min(block_[axis], std::max<std::uint64_t>(shape_[axis], 1));
    }
}

void Hdf5Array::read(const std::uint64_t first, const std::uint64_t count, void* const elements) {
    if (!is_contiguous_) {
        assert(shape_.empty());
        return read_slab({}, elements); // the only element
    }
    const StoredType& stored = type_.stored;
    // As many elements as memory holds.
    const auto in_memory = static_cast<std::size_t>(count);
    const std::size_t bytes = in_memory * stored.size;
    const std::size_t there = read_at(descriptor_, name_, offset_ + first * stored.size,
                                      room_for_stored(stored, elements, in_memory), bytes);
    if (there < bytes) {
        throw Trouble(name_, "ends after " + std::to_string(first + there / stored.size) + " of "
                                 + std::to_string(element_count(*this))
                                 + " elements; is the file complete?");
    }
    decode(stored, elements, in_memory);
}

void Hdf5Array::read_slab(const Slab& slab, void* const elements) {
    const std::size_t count = count_of(slab);
    void* const stored = room_for_stored(type_.stored, elements, count);
    if (!chunks_.read(slab, stored)) {
        read_by_library(slab, stored);
    }
    check_size();
    decode(type_.stored, elements, count);
}

void Hdf5Array::read_by_library(const Slab& slab, void* const stored) const {
    const LibraryUse use(name_, hdf5::time_to_read);
    if (const auto reason =
            hdf5::read_slab(dataset_.id(), type_.memory.id(), slab, stored, name_)) {
        throw_unreadable(dataset_.id(), *reason, name_);
    }
}

// The library takes what is missing at the end of a file for zeros.
void Hdf5Array::check_size() const {
    if (descriptor_ >= 0 && size_of_file(descriptor_, name_) < size_) {
        throw Trouble(name_, "is in a file that was cut short while it was read");
    }
}

} // namespace talcmp
