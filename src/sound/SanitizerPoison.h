#pragma once

#include <cstddef>

#if defined(__SANITIZE_ADDRESS__)
#define GLIMMET_ASAN 1
#elif defined(__has_feature)
#if __has_feature(address_sanitizer)
#define GLIMMET_ASAN 1
#endif
#endif

#ifdef GLIMMET_ASAN
#include <sanitizer/asan_interface.h>
#endif

namespace glimmet::sanitizer {

/// AddressSanitizer does not watch memory we map ourselves: memory that is
/// free, or beyond the array handed out, is poisoned so that a use after
/// free or an overrun is still caught. Nothing in other builds.
inline void Poison(void* start, size_t bytes)
{
#ifdef GLIMMET_ASAN
    ASAN_POISON_MEMORY_REGION(start, bytes);
#else
    (void)start;
    (void)bytes;
#endif
}

inline void Unpoison(void* start, size_t bytes)
{
#ifdef GLIMMET_ASAN
    ASAN_UNPOISON_MEMORY_REGION(start, bytes);
#else
    (void)start;
    (void)bytes;
#endif
}

}  // namespace glimmet::sanitizer
