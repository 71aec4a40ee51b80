// An input is a chunk of an HDF5 array as it is stored, or what it is stored from, and which
// elements are read: where talcmp decompresses it without the library, the library finds the same
// elements.

#include "requirements.h"

#include "hdf5_chunks.h"
#include "input_draws.h"
#include "support/hdf5_writer.h"

#include <algorithm>
#include <array>
#include <csignal>
#include <cstdint>
#include <vector>

#include <zlib.h>

namespace {

using fuzz::InputDraws;
using fuzz::require;
using hdf5_test::done;
using hdf5_test::Extents;
using hdf5_test::Layout;
using hdf5_test::made;
using hdf5_test::space_of;
using talcmp::Shape;
using talcmp::Slab;
using talcmp::hdf5::Chunks;
using talcmp::hdf5::Handle;
using Bytes = std::vector<unsigned char>;

// In memory alone.
Handle new_file() {
    constexpr std::size_t growth = std::size_t{64} * 1024;
    const Handle access = made(::H5Pcreate(H5P_FILE_ACCESS));
    done(::H5Pset_fapl_core(access.id(), growth, false));
    return made(::H5Fcreate("input", H5F_ACC_TRUNC, H5P_DEFAULT, access.id()));
}

struct Array {
    Shape shape;
    Shape chunk;
    std::size_t element_size = 1;
    bool shuffle = false;
    bool deflate = false;
};

Array draw_array(InputDraws& draws) {
    constexpr std::array<std::size_t, 5> sizes = {1, 2, 4, 8, 16};
    Array array;
    array.element_size = sizes.at(draws.index(sizes.size()));
    array.shuffle = draws.rarely(2);
    array.deflate = draws.rarely(2);
    for (std::size_t axes = 1 + draws.index(3); axes > 0; --axes) {
        array.chunk.push_back(1 + draws.below(8));
        array.shape.push_back(array.chunk.back() + draws.below(12)); // none is larger
    }
    return array;
}

Slab draw_slab(InputDraws& draws, const Shape& shape) {
    Slab slab;
    for (const std::uint64_t extent : shape) {
        const std::uint64_t begin = draws.index(extent);
        const std::uint64_t step = 1 + draws.below(4);
        slab.axes.push_back({begin, 1 + draws.index((extent - begin - 1) / step + 1), step});
    }
    return slab;
}

Bytes deflated(const Bytes& bytes) {
    uLongf size = ::compressBound(bytes.size());
    Bytes result(size);
    ::compress(result.data(), &size, bytes.data(), bytes.size());
    result.resize(size);
    return result;
}

// Mostly what can be inflated, as a sum over it would hardly be found by chance.
Bytes draw_stored(InputDraws& draws, const Array& array) {
    std::size_t size = array.element_size;
    for (const std::uint64_t extent : array.chunk) {
        size *= extent;
    }
    const bool as_it_is = draws.rarely(4);
    const bool any_size = (array.shuffle || array.deflate) && draws.rarely(8);
    const std::size_t drawn = any_size ? draws.index(2 * size) + 1 : size;
    Bytes bytes(drawn);
    std::generate(bytes.begin(), bytes.end(),
                  [&draws] { return static_cast<unsigned char>(draws.below(256)); });
    Bytes stored = array.deflate && !as_it_is ? deflated(bytes) : bytes;
    if (draws.rarely(8)) {
        stored[draws.index(stored.size())] ^= static_cast<unsigned char>(1 + draws.below(255));
    }
    return stored;
}

Layout layout_of(const Array& array) {
    Layout layout = Layout::chunked({array.chunk.begin(), array.chunk.end()});
    if (array.shuffle) {
        done(::H5Pset_shuffle(layout.id()));
    }
    if (array.deflate) {
        done(::H5Pset_deflate(layout.id(), 6));
    }
    return layout;
}

// Stores the same bytes as each of the first chunks along the last axis.
void store(const Handle& dataset, const Array& array, InputDraws& draws) {
    const Bytes stored = draw_stored(draws, array);
    const std::uint32_t left_out = draws.rarely(4) ? draws.below(4) : 0;
    Extents begin(array.shape.size());
    for (std::size_t chunks = draws.index(4); chunks > 0; --chunks) {
        done(::H5Dwrite_chunk(dataset.id(), H5P_DEFAULT, left_out, begin.data(), stored.size(),
                              stored.data()));
        begin.back() += array.chunk.back();
        if (begin.back() >= array.shape.back()) {
            return;
        }
    }
}

// What the library reads; nothing if it cannot.
Bytes by_library(const Handle& dataset, const Handle& type, const Slab& slab, Bytes elements) {
    Extents begin;
    Extents step;
    Extents extent;
    for (const Slab::Axis& axis : slab.axes) {
        begin.push_back(axis.begin);
        step.push_back(axis.step);
        extent.push_back(axis.extent);
    }
    const Handle in_file = made(::H5Dget_space(dataset.id()));
    done(::H5Sselect_hyperslab(in_file.id(), H5S_SELECT_SET, begin.data(), step.data(),
                               extent.data(), nullptr));
    const bool was_read = ::H5Dread(dataset.id(), type.id(), space_of(extent).id(), in_file.id(),
                                    H5P_DEFAULT, elements.data())
                          >= 0;
    return was_read ? elements : Bytes();
}

// The first use of the library sets up the guard against its crashes, which libFuzzer should see.
bool leave_crashes_to_libfuzzer() {
    constexpr std::array<int, 5> crashes = {SIGSEGV, SIGBUS, SIGFPE, SIGILL, SIGABRT};
    std::array<struct sigaction, crashes.size()> actions = {};
    for (std::size_t i = 0; i < crashes.size(); ++i) {
        ::sigaction(crashes[i], nullptr, &actions[i]);
    }
    const talcmp::hdf5::LibraryUse use("input");
    for (std::size_t i = 0; i < crashes.size(); ++i) {
        ::sigaction(crashes[i], &actions[i], nullptr);
    }
    return true;
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* const bytes, const std::size_t size) {
    static const bool prepared = leave_crashes_to_libfuzzer();
    static_cast<void>(prepared);
    InputDraws draws(bytes, size);
    const Array array = draw_array(draws);
    const Handle file = new_file();
    const Handle type = made(::H5Tcreate(H5T_OPAQUE, array.element_size));
    {
        const Handle dataset = made(::H5Dcreate2(
            file.id(), "x", type.id(), space_of({array.shape.begin(), array.shape.end()}).id(),
            H5P_DEFAULT, layout_of(array).id(), H5P_DEFAULT));
        store(dataset, array, draws);
    }
    const Handle dataset = made(::H5Dopen2(file.id(), "x", H5P_DEFAULT));
    const Chunks chunks(dataset.id(), array.shape, array.chunk, array.element_size, "input");
    for (int i = 0; i < 4; ++i) {
        const Slab slab = draw_slab(draws, array.shape);
        std::size_t room = array.element_size;
        for (const Slab::Axis& axis : slab.axes) {
            room *= axis.extent;
        }
        Bytes elements(room);
        try {
            if (chunks.read(slab, elements.data())) {
                require(elements == by_library(dataset, type, slab, elements),
                        "the library finds the elements that were decompressed without it");
            }
        } catch (const talcmp::Trouble& refusal) {
            fuzz::require_line(refusal.what());
        }
    }
    return 0;
}
