// The factor of the last tolerance that a thread compared under.
//
// All elements of two arrays are compared under one tolerance, so remembering one factor keeps pow
// and ldexp out of the element loops. Each thread has a cache for each real type; nothing is shared
// and nothing is locked.
//
// A signal handler that compares may run between any two instructions of a comparison in its own
// thread, and may never return to it. Even so, a tolerance is never paired with the factor of
// another one:
//
// - The cache has four slots. One word, `state`, which is read and written in one piece, says which
//   slot is in use and whether it is being written. It also counts the writes, so it differs after
//   every one of them.
// - A reader reads `state` before and after the slot. It uses what it has read only if both are the
//   same and no write was under way.
// - A writer that finds a write under way either runs in a handler that interrupted that write, or
//   follows a write that a handler left for good. It uses the next slot, as the interrupted write
//   may go on.
// - A write that goes on after another one interrupted it finds `state` changed and leaves it: the
//   handler's factor stays in use. If it was interrupted after that check, it puts its own slot in
//   use, which no other write has touched.
//
// Four handlers would have to interrupt each other within the few instructions of a write before
// one of them came to a slot that is still being written. Volatile keeps the order of the accesses,
// which is all that one thread needs.

#ifndef NESK_FACTOR_CACHE_H
#define NESK_FACTOR_CACHE_H

#include "strict_floating_point.h"

#include <limits>

#pragma GCC visibility push(hidden)
NESK_STRICT_SINGLES_BEGIN

namespace nesk {

// A tolerance and its factor 2^(lasttol - bits).
template <typename T>
struct remembered_factor {
    T lasttol;
    T tolfactor;
};

// In `state`, bit 0 is set while a factor is being written, the next two bits are the number of the
// slot, and the rest counts the writes.
template <typename T>
struct factor_cache {
    static constexpr unsigned being_written = 1;
    static constexpr unsigned next_slot = 2;
    static constexpr unsigned slots = 4;
    static constexpr unsigned next_count = 8;

    static constexpr unsigned slot(const unsigned state) noexcept {
        return state / next_slot % slots;
    }

    volatile unsigned state = 0;
    // The first entry is true (2^0 is 1), but is never used: tolerances of `bits` or more need no
    // factor.
    struct {
        volatile T lasttol, tolfactor;
    } factors[slots] = {{std::numeric_limits<T>::digits, 1}, {}, {}, {}};
};

template <typename T>
inline factor_cache<T>& factor_cache_of_thread() noexcept {
    // Initial-exec: in a shared object the general model would allocate on a thread's first use.
    [[gnu::tls_model("initial-exec")]] static thread_local factor_cache<T> cache;
    return cache;
}

// Returns whether the thread remembers the factor of `tol`; only then is `factor` that factor.
template <typename T>
inline bool recall_factor(const T tol, T& factor) noexcept {
    const factor_cache<T>& cache = factor_cache_of_thread<T>();
    const unsigned state = cache.state;
    const auto& kept = cache.factors[cache.slot(state)];
    const T lasttol = kept.lasttol;
    factor = kept.tolfactor;
    // Never equal to `cache.state` if a write was under way.
    const unsigned unchanged = state & ~cache.being_written;
    return tol == lasttol && cache.state == unchanged;
}

template <typename T>
inline void remember_factor(const remembered_factor<T> remembered) noexcept {
    using cache_t = factor_cache<T>;
    cache_t& cache = factor_cache_of_thread<T>();
    const unsigned before = cache.state;
    const unsigned interrupted = before & cache_t::being_written;
    const unsigned slot = (cache_t::slot(before) + interrupted) % cache_t::slots;
    const unsigned count = before / cache_t::next_count + 1;
    const unsigned state =
        count * cache_t::next_count + slot * cache_t::next_slot + cache_t::being_written;
    cache.state = state;
    cache.factors[slot].lasttol = remembered.lasttol;
    cache.factors[slot].tolfactor = remembered.tolfactor;
    if (cache.state == state) {
        cache.state = state & ~cache_t::being_written;
    }
}

} // namespace nesk

NESK_STRICT_SINGLES_END
#pragma GCC visibility pop

#endif
