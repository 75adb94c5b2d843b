#pragma once

/// Marks a function whose plain loops the compiler vectorises: with GCC on
/// x86-64 it is compiled three times, for AVX-512, AVX2 and the baseline, and
/// the processor's form is chosen when the program starts. Both forms do the same
/// IEEE operations in the same order (fused multiply-add is not enabled, and
/// ISO C++ mode forbids contracting a product and a sum anyway), so they give
/// the same results; the wider forms only process more lanes at once.
#if defined(__x86_64__) && defined(__GNUC__) && !defined(__clang__)
#define GLIMMET_VECTOR_CLONES __attribute__((target_clones("avx512f", "avx2", "default")))
#else
#define GLIMMET_VECTOR_CLONES
#endif
