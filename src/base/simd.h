// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Compiles a hot kernel for several instruction sets; the processor's best is taken at load time.
/// Left out where the loader's choice comes too early for the sanitizers, and with clang.
#if defined(__GNUC__) && !defined(__clang__) && defined(__x86_64__) &&                             \
    !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
#define CORVANE_CLONES __attribute__((target_clones("default", "avx2", "arch=x86-64-v4")))
#else
#define CORVANE_CLONES
#endif
