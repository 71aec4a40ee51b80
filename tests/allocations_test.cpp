// A comparison allocates and frees nothing, the first one of a thread included, in a program and in
// a shared object that was loaded while the program ran.
//
// The C library's functions are replaced by ones that count. The loader calls them too when it
// makes room for thread-local variables.

#include "support/prepared_calls.h"
#include "support/sanitizers.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstddef>
#include <cstdlib>
#include <future>
#include <thread>

#ifdef SMALL_RUNTIME
#    include "small_runtime.h"
#    include <dlfcn.h>
#endif

namespace {

// Calls by this thread of allocating functions and of free. Volatile, as Clang assumes that new
// leaves it alone.
thread_local volatile int allocator_calls = 0;

} // namespace

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)

// From the sanitizers' header, which Debian has with Clang alone.
extern "C" int __sanitizer_install_malloc_and_free_hooks(
    void (*allocated)(const volatile void* block, std::size_t size),
    void (*freed)(const volatile void* block));

namespace {

// The sanitizers have replaced the functions already, and report each call.
const int hooks_installed = __sanitizer_install_malloc_and_free_hooks(
    [](const volatile void* /*block*/, std::size_t /*size*/) {
        allocator_calls = allocator_calls + 1;
    },
    [](const volatile void* /*block*/) { allocator_calls = allocator_calls + 1; });

} // namespace

#else

// The C library's own names for the functions that are replaced.
// NOLINTBEGIN(clang-diagnostic-reserved-identifier,readability-inconsistent-declaration-parameter-name)
extern "C" void* __libc_malloc(std::size_t size);
extern "C" void* __libc_calloc(std::size_t count, std::size_t size);
extern "C" void* __libc_realloc(void* block, std::size_t size);
extern "C" void* __libc_memalign(std::size_t alignment, std::size_t size);
extern "C" void __libc_free(void* block);

extern "C" void* malloc(const std::size_t size) {
    allocator_calls = allocator_calls + 1;
    return __libc_malloc(size);
}

extern "C" void* calloc(const std::size_t count, const std::size_t size) {
    allocator_calls = allocator_calls + 1;
    return __libc_calloc(count, size);
}

extern "C" void* realloc(void* block, const std::size_t size) {
    allocator_calls = allocator_calls + 1;
    return __libc_realloc(block, size);
}

extern "C" void* memalign(const std::size_t alignment, const std::size_t size) {
    allocator_calls = allocator_calls + 1;
    return __libc_memalign(alignment, size);
}

extern "C" void* aligned_alloc(const std::size_t alignment, const std::size_t size) {
    allocator_calls = allocator_calls + 1;
    return __libc_memalign(alignment, size);
}

extern "C" int posix_memalign(void** block, const std::size_t alignment, const std::size_t size) {
    allocator_calls = allocator_calls + 1;
    *block = __libc_memalign(alignment, size);
    return *block == nullptr ? ENOMEM : 0;
}

extern "C" void free(void* block) {
    allocator_calls = allocator_calls + 1;
    __libc_free(block);
}
// NOLINTEND(clang-diagnostic-reserved-identifier,readability-inconsistent-declaration-parameter-name)

#endif

namespace {

template <typename Body>
int allocator_calls_of(const Body& body) {
    const int before = allocator_calls;
    body();
    return allocator_calls - before;
}

// Keeps allocations whose result is not used from being optimised away.
void* volatile kept = nullptr;

// NOLINTBEGIN(cppcoreguidelines-no-malloc,cppcoreguidelines-owning-memory)
TEST(Allocations, AreCounted) {
    const auto keep = [](void* block) { kept = block; };
    EXPECT_EQ(allocator_calls_of([&] { keep(std::malloc(8)); }), 1);
    EXPECT_EQ(allocator_calls_of([] { std::free(kept); }), 1);
    EXPECT_EQ(allocator_calls_of([&] { keep(std::calloc(8, 8)); }), 1);
    EXPECT_GE(allocator_calls_of([&] { keep(std::realloc(kept, 4096)); }), 1);
    std::free(kept);
    EXPECT_EQ(allocator_calls_of([&] { keep(new int); }), 1);
    EXPECT_EQ(allocator_calls_of([] { delete static_cast<int*>(kept); }), 1);
}

TEST(Allocations, ThatAreAlignedAreCounted) {
    if (thread_sanitizer) {
        GTEST_SKIP() << "NOT TESTED: ThreadSanitizer does not report them";
    }
    EXPECT_EQ(allocator_calls_of([] { kept = std::aligned_alloc(64, 64); }), 1);
    std::free(kept);
    void* block = nullptr;
    EXPECT_EQ(allocator_calls_of([&] { EXPECT_EQ(::posix_memalign(&block, 64, 64), 0); }), 1);
    std::free(block);
}
// NOLINTEND(cppcoreguidelines-no-malloc,cppcoreguidelines-owning-memory)

TEST(Allocations, AreMadeByNoComparison) {
    const PreparedCalls prepared;
    int wrong = 0;
    EXPECT_EQ(allocator_calls_of([&] { wrong = prepared.wrong_answers(); }), 0);
    EXPECT_EQ(wrong, 0);
}

TEST(Allocations, AreMadeByNoFirstComparisonOfAThread) {
    const PreparedCalls prepared;
    in_new_thread([&prepared] {
        int wrong = 0;
        EXPECT_EQ(allocator_calls_of([&] { wrong = prepared.wrong_answers(); }), 0);
        EXPECT_EQ(wrong, 0);
    });
}

#ifdef SMALL_RUNTIME

using BytesToStore = decltype(&small_runtime_bytes_to_store);

BytesToStore load_runtime() {
    void* const runtime = ::dlopen(SMALL_RUNTIME, RTLD_NOW | RTLD_LOCAL);
    return runtime == nullptr
               ? nullptr
               : reinterpret_cast<BytesToStore>(::dlsym(runtime, "small_runtime_bytes_to_store"));
}

// Compares two near numbers, so that a factor is remembered.
void expect_no_allocation(const BytesToStore bytes_to_store) {
    const Array<double> one{1};
    const Array<double> near{1 + 0x1p-44};
    std::size_t bytes = 1;
    EXPECT_EQ(allocator_calls_of([&] { bytes = bytes_to_store(10, one.handle(), near.handle()); }),
              0);
    EXPECT_EQ(bytes, 0U);
}

// In a thread that is older than the loaded shared object, and in a newer one.
TEST(Allocations, AreMadeByNoFirstComparisonInALoadedSharedObject) {
    std::promise<BytesToStore> loaded;
    std::thread earlier([&loaded] {
        const BytesToStore bytes_to_store = loaded.get_future().get();
        ASSERT_NE(bytes_to_store, nullptr);
        expect_no_allocation(bytes_to_store);
    });
    const BytesToStore bytes_to_store = load_runtime();
    loaded.set_value(bytes_to_store);
    earlier.join();
    ASSERT_NE(bytes_to_store, nullptr);
    in_new_thread([bytes_to_store] { expect_no_allocation(bytes_to_store); });
}

#else

TEST(Allocations, AreMadeByNoFirstComparisonInALoadedSharedObject) {
    GTEST_SKIP() << "NOT TESTED: built without the examples, among which the shared object is";
}

#endif

} // namespace
