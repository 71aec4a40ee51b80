// Which sanitizer's instrumentation the tests are compiled with.

#pragma once

#if defined(__SANITIZE_ADDRESS__)
inline constexpr bool address_sanitizer = true;
#else
inline constexpr bool address_sanitizer = false;
#endif

#if defined(__SANITIZE_THREAD__)
inline constexpr bool thread_sanitizer = true;
#else
inline constexpr bool thread_sanitizer = false;
#endif
