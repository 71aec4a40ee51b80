// Calls functions of code.cpp for rows of inputs, which `compiled.py` has in arrays.

#include <cstddef>
#include <cstdint>

namespace {

// `lasttol` and `factor` are remembered before each call, if `remember` is not null. `modes` is set
// in the control word for each call, unless it is null.
struct Rows {
    std::size_t count;
    void* function;
    void* remember;
    const void* lasttol;
    const void* factor;
    const std::uint32_t* modes;
    const void* bound;
    const void* x;
    const void* y;
    std::size_t x_bytes;
    std::size_t y_bytes;
};

template <typename T, typename Call>
void for_each_row(const Rows& rows, const Call& call) {
    for (std::size_t k = 0; k < rows.count; ++k) {
        if (rows.remember != nullptr) {
            reinterpret_cast<void (*)(T, T)>(rows.remember)(static_cast<const T*>(rows.lasttol)[k],
                                                            static_cast<const T*>(rows.factor)[k]);
        }
        const unsigned before = __builtin_ia32_stmxcsr();
        __builtin_ia32_ldmxcsr(before | (rows.modes == nullptr ? 0 : rows.modes[k]));
        call(k, static_cast<const char*>(rows.x) + k * rows.x_bytes,
             static_cast<const char*>(rows.y) + k * rows.y_bytes);
        __builtin_ia32_ldmxcsr(before);
    }
}

// `T` is the type of what is remembered.
template <typename T, typename Bound>
void call_tests(const Rows& rows, std::uint8_t* const results) {
    for_each_row<T>(rows, [&](const std::size_t k, const void* const x, const void* const y) {
        results[k] = reinterpret_cast<bool (*)(Bound, const void*, const void*)>(rows.function)(
            static_cast<const Bound*>(rows.bound)[k], x, y);
    });
}

template <typename T>
void call_comparisons(const Rows& rows, std::int32_t* const results) {
    for_each_row<T>(rows, [&](const std::size_t k, const void* const x, const void* const y) {
        results[k] = reinterpret_cast<int (*)(T, T, T)>(rows.function)(
            static_cast<const T*>(rows.bound)[k], *static_cast<const T*>(x),
            *static_cast<const T*>(y));
    });
}

template <typename T>
void call_reals(const Rows& rows, T* const results) {
    for_each_row<T>(rows, [&](const std::size_t k, const void* /*x*/, const void* /*y*/) {
        results[k] =
            reinterpret_cast<T (*)(T)>(rows.function)(static_cast<const T*>(rows.bound)[k]);
    });
}

} // namespace

extern "C" {

void tests(const Rows& rows, std::uint8_t* const results) {
    for_each_row<float>(rows, [&](const std::size_t k, const void* const x, const void* const y) {
        results[k] =
            reinterpret_cast<bool (*)(const void*, const void*)>(rows.function)(x, y) ? 1 : 0;
    });
}

void tests_float(const Rows& rows, std::uint8_t* const results) {
    call_tests<float, float>(rows, results);
}

void tests_double(const Rows& rows, std::uint8_t* const results) {
    call_tests<double, double>(rows, results);
}

void elements_float(const Rows& rows, std::uint8_t* const results) {
    call_tests<float, double>(rows, results);
}

void elements_double(const Rows& rows, std::uint8_t* const results) {
    call_tests<double, double>(rows, results);
}

void comparisons_float(const Rows& rows, std::int32_t* const results) {
    call_comparisons<float>(rows, results);
}

void comparisons_double(const Rows& rows, std::int32_t* const results) {
    call_comparisons<double>(rows, results);
}

void reals_float(const Rows& rows, float* const results) {
    call_reals<float>(rows, results);
}

void reals_double(const Rows& rows, double* const results) {
    call_reals<double>(rows, results);
}

// Integers in registers, widened with their signs.
void integers(const Rows& rows, std::int32_t* const results) {
    for_each_row<float>(rows, [&](const std::size_t k, const void* const x, const void* const y) {
        results[k] = reinterpret_cast<int (*)(std::int64_t, std::int64_t)>(rows.function)(
            *static_cast<const std::int64_t*>(x), *static_cast<const std::int64_t*>(y));
    });
}
}
