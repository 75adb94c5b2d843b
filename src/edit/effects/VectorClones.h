#pragma once

/// Marks a function whose plain loops the compiler vectorises: with GCC on
/// x86-64 it is compiled three times, for AVX-512, AVX2 and the baseline, and
/// the processor's form is chosen when the program starts. Every form must
/// give the results of the baseline bit for bit. The wider instruction sets
/// bring fused multiply-add, and GCC would otherwise fuse a product and a sum
/// into one rounding there, so contraction is turned off for these functions;
/// then every form does the same IEEE operations in the same order and only
/// processes more lanes at once.
///
/// Not under ThreadSanitizer: the loader runs the clones' resolvers before
/// the sanitizer's runtime is up, and the program dies at start-up.
#if defined(__x86_64__) && defined(__GNUC__) && !defined(__clang__) && !defined(__SANITIZE_THREAD__)
#define GLIMMET_EFFECT_CLONES \
    __attribute__((target_clones("avx512f", "avx2", "default"), optimize("fp-contract=off")))
#else
#define GLIMMET_EFFECT_CLONES
#endif
