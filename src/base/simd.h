// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Sanitizers need plain functions: their runtime isn't up when the program chooses.
#if defined(__x86_64__) && defined(__linux__) && defined(__GNUC__) && !defined(__clang__) &&       \
    !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
#define CORVANE_HAS_CLONES 1
#else
#define CORVANE_HAS_CLONES 0
#endif

/// Put before a hot loop that the compiler vectorises by itself, compiles it for several
/// instruction sets; the program takes the best one of the machine when it starts. Products and
/// sums aren't contracted, so all of them give the same bits.
#if CORVANE_HAS_CLONES
#define CORVANE_CLONES __attribute__((target_clones("default", "avx2", "arch=x86-64-v4")))
#else
#define CORVANE_CLONES
#endif

/// For the bodies that such functions share: they must become part of each clone.
#define CORVANE_INLINE [[gnu::always_inline]] inline
