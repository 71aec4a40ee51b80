// Chunks of HDF5 files: which are decompressed here, and which are left to the library.

#include "hdf5_chunks.h"

#include "support/hdf5_writer.h"
#include "support/random_slabs.h"
#include "support/temporary_folder.h"
#include "support/thrown_message.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <random>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <zlib.h>

namespace {

using namespace hdf5_test;
using talcmp::Shape;
using talcmp::Slab;
using talcmp::hdf5::Chunks;
using Bytes = std::vector<unsigned char>;

const Shape shape = {30, 20, 10};
const Shape chunk = {17, 11, 4}; // those at the end have elements beyond the shape
constexpr std::size_t count = 6000;
constexpr std::size_t count_of_chunk = 748;

const Slab whole = {{{0, 30, 1}, {0, 20, 1}, {0, 10, 1}}};
const Slab first_chunk = {{{0, 17, 1}, {0, 11, 1}, {0, 4, 1}}};

struct Pipeline {
    bool shuffle = false;
    bool deflate = false;
};

const Pipeline pipelines[] = {{false, false}, {false, true}, {true, false}, {true, true}};

Layout layout_of(const Pipeline& pipeline) {
    Layout layout = Layout::chunked({chunk.begin(), chunk.end()});
    if (pipeline.shuffle) {
        done(::H5Pset_shuffle(layout.id()));
    }
    if (pipeline.deflate) {
        done(::H5Pset_deflate(layout.id(), 6));
    }
    return layout;
}

// Few values, so that they can be compressed.
Bytes random_bytes(const std::size_t size, std::mt19937_64& random) {
    Bytes bytes(size);
    std::generate(bytes.begin(), bytes.end(),
                  [&random] { return static_cast<unsigned char>(random() % 5); });
    return bytes;
}

Bytes deflated(const Bytes& bytes) {
    uLongf size = ::compressBound(static_cast<uLong>(bytes.size()));
    Bytes result(size);
    ::compress(result.data(), &size, bytes.data(), static_cast<uLong>(bytes.size()));
    result.resize(size);
    return result;
}

Bytes shuffled(const Bytes& bytes, const std::size_t element_size) {
    Bytes result;
    for (std::size_t byte = 0; byte < element_size; ++byte) {
        for (std::size_t i = byte; i < bytes.size(); i += element_size) {
            result.push_back(bytes[i]);
        }
    }
    return result;
}

Bytes elements_at(const Slab& slab, const Bytes& all, const std::size_t size) {
    Bytes bytes;
    for (const std::size_t position : positions_of(slab, shape)) {
        bytes.insert(bytes.end(), &all[position * size], &all[position * size] + size);
    }
    return bytes;
}

std::size_t count_of(const Slab& slab) {
    return positions_of(slab, shape).size();
}

class Hdf5Chunks : public testing::Test {
  protected:
    // Makes the array; `elements` may be null.
    void write(const Layout& layout, const std::size_t size, const void* const elements) {
        const Handle type = made(::H5Tcreate(H5T_OPAQUE, size));
        size_ = size;
        name_ = "x" + std::to_string(++arrays_);
        dataset_ = file_.array(name_, type.id(), space_of({shape.begin(), shape.end()}), layout);
        if (elements != nullptr) {
            done(::H5Dwrite(dataset_.id(), type.id(), H5S_ALL, H5S_ALL, H5P_DEFAULT, elements));
        }
        reopen();
    }

    // Writes the first chunk as it is stored, without some of the filters.
    void store(const Bytes& stored, const std::uint32_t left_out = 0) {
        const Extents first = {0, 0, 0};
        done(::H5Dwrite_chunk(dataset_.id(), H5P_DEFAULT, left_out, first.data(), stored.size(),
                              stored.data()));
        reopen();
    }

    bool read(const Slab& slab, Bytes& elements) const {
        return chunks_.read(slab, elements.data());
    }

    bool is_left_to_library(const Slab& slab = whole) const {
        Bytes elements(count_of(slab) * 16);
        return !read(slab, elements);
    }

  private:
    // The library does not know which filters were left out by who wrote with the same handle.
    void reopen() {
        dataset_ = {};
        dataset_ = made(::H5Dopen2(file_.id(), name_.c_str(), H5P_DEFAULT));
        chunks_ = Chunks(dataset_.id(), shape, chunk, size_, "x");
    }

    TemporaryFolder folder_;
    Writer file_{folder_.path_of("a.h5")};
    int arrays_ = 0;
    std::string name_;
    std::size_t size_ = 0;
    Handle dataset_;
    Chunks chunks_;
};

TEST_F(Hdf5Chunks, AreReadInSlabs) {
    std::mt19937_64 random(drawn_seed());
    for (const std::size_t size : {1U, 2U, 4U, 8U, 16U}) {
        for (const Pipeline& pipeline : pipelines) {
            const Bytes all = random_bytes(count * size, random);
            write(layout_of(pipeline), size, all.data());
            const bool filtered = pipeline.shuffle || pipeline.deflate;
            int read_here = 0;
            for (int i = 0; i < 100; ++i) {
                const Slab slab = i == 0 ? whole : random_slab(shape, random);
                Bytes elements(count_of(slab) * size);
                const bool was_read = read(slab, elements);
                ASSERT_TRUE(was_read || (!filtered && i > 0));
                if (was_read) {
                    ASSERT_EQ(elements, elements_at(slab, all, size))
                        << "elements of " << size << " bytes";
                    ++read_here;
                }
            }
            EXPECT_GE(read_here, 3); // mostly some twenty, without filters
        }
    }
}

TEST_F(Hdf5Chunks, MayLackSomeOfTheFilters) {
    constexpr std::size_t size = 4;
    std::mt19937_64 random(drawn_seed());
    const Bytes plain = random_bytes(count_of_chunk * size, random);
    const Bytes stored[] = {deflated(shuffled(plain, size)), deflated(plain), shuffled(plain, size),
                            plain};
    for (std::uint32_t left_out = 0; left_out < 4; ++left_out) {
        write(layout_of({true, true}), size, nullptr);
        store(stored[left_out], left_out);
        Bytes elements(plain.size());
        EXPECT_TRUE(read(first_chunk, elements));
        EXPECT_EQ(elements, plain) << left_out;
    }
}

TEST_F(Hdf5Chunks, AreReadByThreads) {
    std::mt19937_64 random(drawn_seed());
    const Bytes all = random_bytes(count * 8, random);
    write(layout_of({true, true}), 8, all.data());
    std::atomic<int> right = 0;
    std::vector<std::thread> threads;
    threads.reserve(4);
    for (int i = 0; i < 4; ++i) {
        threads.emplace_back([&] {
            for (int j = 0; j < 50; ++j) {
                Bytes elements(all.size());
                right += read(whole, elements) && elements == all ? 1 : 0;
            }
        });
    }
    for (std::thread& thread : threads) {
        thread.join();
    }
    EXPECT_EQ(right, 200);
}

// ---- What the library has to read

TEST_F(Hdf5Chunks, OfOtherFiltersAreLeftToTheLibrary) {
    const Bytes all(count * 4, 1);
    const std::pair<const char*, std::function<void(hid_t)>> others[] = {
        {"sums", [](const hid_t layout) { done(::H5Pset_fletcher32(layout)); }},
        {"sums of what is deflated",
         [](const hid_t layout) {
             done(::H5Pset_deflate(layout, 1));
             done(::H5Pset_fletcher32(layout));
         }},
        {"shuffled after deflating",
         [](const hid_t layout) {
             done(::H5Pset_deflate(layout, 1));
             done(::H5Pset_shuffle(layout));
         }},
        {"deflated twice",
         [](const hid_t layout) {
             done(::H5Pset_deflate(layout, 1));
             done(::H5Pset_deflate(layout, 1));
         }},
        {"whole chunks alone",
         [](const hid_t layout) {
             done(::H5Pset_deflate(layout, 1));
             done(::H5Pset_chunk_opts(layout, H5D_CHUNK_DONT_FILTER_PARTIAL_CHUNKS));
         }},
    };
    for (const auto& [name, set_filters] : others) {
        const Layout layout = layout_of({});
        set_filters(layout.id());
        write(layout, 4, all.data());
        EXPECT_TRUE(is_left_to_library(first_chunk)) << name;
    }
}

TEST_F(Hdf5Chunks, AreLeftToTheLibraryIfOneWasNeverWritten) {
    write(layout_of({false, true}), 4, nullptr);
    EXPECT_TRUE(is_left_to_library(first_chunk));
    store(deflated(Bytes(count_of_chunk * 4)));
    EXPECT_FALSE(is_left_to_library(first_chunk));
    EXPECT_TRUE(is_left_to_library());
}

TEST_F(Hdf5Chunks, ThatAreDamagedAreLeftToTheLibrary) {
    constexpr std::size_t size = count_of_chunk * 4;
    const Bytes plain(size, 1);
    const auto is_left = [this](const Bytes& stored, const std::uint32_t left_out = 0) {
        write(layout_of({false, true}), 4, nullptr);
        store(stored, left_out);
        return is_left_to_library(first_chunk);
    };
    EXPECT_FALSE(is_left(plain, 1));
    EXPECT_TRUE(is_left(Bytes(size + 1), 1));
    EXPECT_TRUE(is_left(Bytes(size + 2000)));
    EXPECT_TRUE(is_left(deflated(Bytes(size + 1))));
    const Bytes good = deflated(plain);
    EXPECT_FALSE(is_left(good));
    for (std::size_t i = 0; i < 8 * good.size(); ++i) {
        Bytes flipped = good;
        flipped[i / 8] = static_cast<unsigned char>(flipped[i / 8] ^ (1U << i % 8));
        Bytes elements(size);
        // A few bits have no meaning.
        EXPECT_TRUE(is_left(flipped) || (read(first_chunk, elements) && elements == plain)) << i;
    }
}

TEST_F(Hdf5Chunks, ThatAreTooShortAreRefused) {
    constexpr std::size_t size = count_of_chunk * 4;
    const auto trouble = [this](const Bytes& stored, const std::uint32_t left_out) {
        write(layout_of({false, true}), 4, nullptr);
        store(stored, left_out);
        return thrown_message([&] { is_left_to_library(first_chunk); });
    };
    EXPECT_EQ(trouble(deflated(Bytes(size)), 0), "none");
    EXPECT_EQ(trouble(deflated(Bytes(size - 1)), 0),
              "x: has a chunk that is too short; is the file damaged?");
    EXPECT_EQ(trouble(Bytes(size), 1), "none");
    EXPECT_EQ(trouble(Bytes(size - 1), 1),
              "x: has a chunk that is too short; is the file damaged?");
}

class LargeHdf5Chunks : public testing::Test {
  protected:
    static constexpr std::size_t rows = 32;
    static constexpr std::size_t columns = 65536;

    // Of bytes, in one chunk.
    Chunks write(const Layout& layout) {
        dataset_ = file_.array("x" + std::to_string(++arrays_), H5T_STD_U8LE,
                               space_of({rows, columns}), layout);
        const Bytes elements(rows * columns, 1);
        done(::H5Dwrite(dataset_.id(), H5T_NATIVE_UCHAR, H5S_ALL, H5S_ALL, H5P_DEFAULT,
                        elements.data()));
        done(::H5Dflush(dataset_.id()));
        return with_chunk({rows, columns}, 1);
    }

    Chunks with_chunk(const Shape& extents, const std::size_t element_size) const {
        return {dataset_.id(), {rows, columns}, extents, element_size, "x"};
    }

    static Layout in_one_chunk() { return Layout::chunked({rows, columns}); }

    static Layout deflated() {
        Layout layout = in_one_chunk();
        done(::H5Pset_deflate(layout.id(), 1));
        return layout;
    }

    // Elements of the first columns, or of each `step`-th one.
    static bool reads(const Chunks& chunks, const std::uint64_t of_rows,
                      const std::uint64_t of_columns, const std::uint64_t step = 1) {
        Bytes room(rows * columns);
        return chunks.read({{{0, of_rows, 1}, {0, of_columns, step}}}, room.data());
    }

    Handle dataset_;

  private:
    TemporaryFolder folder_;
    Writer file_{folder_.path_of("a.h5")};
    int arrays_ = 0;
};

TEST_F(LargeHdf5Chunks, AreLeftToTheLibraryIfFewElementsAreWanted) {
    const Chunks plain = write(in_one_chunk());
    EXPECT_TRUE(reads(plain, rows, columns / 64));
    EXPECT_FALSE(reads(plain, rows, columns / 64 - 1));
    EXPECT_TRUE(reads(write(deflated()), 1, 1));
}

TEST_F(LargeHdf5Chunks, AreLeftToTheLibraryIfFewPartsAreWanted) {
    const Chunks plain = write(in_one_chunk());
    EXPECT_TRUE(reads(plain, 16, columns / 2));
    EXPECT_FALSE(reads(plain, 15, columns / 2));
    EXPECT_TRUE(reads(plain, 1, columns / 2, 2));
}

TEST_F(LargeHdf5Chunks, AreLeftToTheLibraryIfLongPartsAreWanted) {
    const Chunks plain = write(in_one_chunk());
    EXPECT_TRUE(reads(plain, rows, columns - 1));
    EXPECT_FALSE(reads(plain, rows, columns));
    const Layout layout = in_one_chunk();
    done(::H5Pset_shuffle(layout.id()));
    EXPECT_TRUE(reads(write(layout), rows, columns));
}

TEST_F(LargeHdf5Chunks, AreNotInflatedFromTooFewBytes) {
    const Chunks chunks = write(deflated());
    const Extents begin = {0, 0};
    const Bytes stored(5);
    done(::H5Dwrite_chunk(dataset_.id(), H5P_DEFAULT, 0, begin.data(), stored.size(),
                          stored.data()));
    EXPECT_EQ(thrown_message([&] { reads(chunks, 1, 1); }),
              "x: has a chunk that is too short; is the file damaged?");
}

TEST_F(LargeHdf5Chunks, AreLeftToTheLibraryIfTheyAreHuge) {
    write(deflated());
    const std::uint64_t gibibyte = std::uint64_t{1} << 30U;
    EXPECT_FALSE(reads(with_chunk({1, gibibyte + 1}, 1), 1, 1));
    EXPECT_FALSE(reads(with_chunk({gibibyte, 1}, 2), 1, 1));
    EXPECT_FALSE(reads(with_chunk({1, 0}, 1), 1, 1));
}

} // namespace
