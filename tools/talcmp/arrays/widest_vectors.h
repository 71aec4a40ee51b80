// Loops in the widest vectors that the processor has, which may be wider than those of every
// processor of its kind.

#pragma once

#include <utility>

namespace talcmp {

#if defined(__x86_64__)

template <typename Loop, typename... Arguments>
[[gnu::target("avx2")]] decltype(auto) loop_for_avx2(const Loop& loop, Arguments&&... arguments) {
    return loop(std::forward<Arguments>(arguments)...);
}

template <typename Loop, typename... Arguments>
[[gnu::target("avx512f,avx512bw,avx512dq,avx512vl")]] decltype(auto)
loop_for_avx512(const Loop& loop, Arguments&&... arguments) {
    return loop(std::forward<Arguments>(arguments)...);
}

inline bool has_avx512() {
    return static_cast<bool>(__builtin_cpu_supports("avx512f"))
           && static_cast<bool>(__builtin_cpu_supports("avx512bw"))
           && static_cast<bool>(__builtin_cpu_supports("avx512dq"))
           && static_cast<bool>(__builtin_cpu_supports("avx512vl"));
}

// Calls `loop`, which has to be always inlined, so that it is compiled once for each width.
template <typename Loop, typename... Arguments>
decltype(auto) in_widest_vectors(const Loop& loop, Arguments&&... arguments) {
    if (has_avx512()) {
        return loop_for_avx512(loop, std::forward<Arguments>(arguments)...);
    }
    if (static_cast<bool>(__builtin_cpu_supports("avx2"))) {
        return loop_for_avx2(loop, std::forward<Arguments>(arguments)...);
    }
    return loop(std::forward<Arguments>(arguments)...);
}

#else

template <typename Loop, typename... Arguments>
decltype(auto) in_widest_vectors(const Loop& loop, Arguments&&... arguments) {
    return loop(std::forward<Arguments>(arguments)...);
}

#endif

} // namespace talcmp
