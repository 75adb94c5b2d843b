#pragma once

// GLIMMET_VECTOR_CLONES gives a hot per-sample loop a second, AVX2 build that
// is picked at load time on processors that have it. Plain SSE2 and AVX2
// give identical results: there is no contraction into fused multiply-adds
// in standard C++ mode (and the AVX2 clone does not enable FMA), and every
// operation is exactly rounded either way.
//
// Not under ThreadSanitizer: the loader runs the clones' resolvers before
// the sanitizer's runtime is up, and the program dies at start-up. Not with
// Clang, whose target_clones support differs.
#if defined(__GNUC__) && !defined(__clang__) && defined(__x86_64__) && !defined(__SANITIZE_THREAD__)
#define GLIMMET_VECTOR_CLONES __attribute__((target_clones("avx2", "default")))
#else
#define GLIMMET_VECTOR_CLONES
#endif
