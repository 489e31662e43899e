// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Put before a hot kernel, compiles it for several instruction sets; the program takes the best
/// one of the machine when it starts. The kernels don't contract products and sums, so all of them
/// give the same bits. Sanitizers need plain functions: their runtime isn't up when the choice is
/// made.
#if defined(__x86_64__) && defined(__linux__) && defined(__GNUC__) && !defined(__clang__) &&       \
    !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
#define CORVANE_VECTOR_CLONES __attribute__((target_clones("default", "avx2", "avx512f")))
#else
#define CORVANE_VECTOR_CLONES
#endif

/// For the bodies that such kernels share: they must become part of each clone.
#define CORVANE_INLINE [[gnu::always_inline]] inline
