// SPDX-License-Identifier: Apache-2.0
#pragma once

/// Clears the upper halves of the vector registers. Fills of the toolkit can leave them in use, and
/// on many processors all arithmetic compiled for the plain instruction set then waits for them at
/// every step: measured up to thirty times slower, until this is called. It costs a few cycles.
/// To be called in the painting thread before numeric work, after the event loop has run within it,
/// and after fills.
inline void clearVectorState()
{
#if defined(__x86_64__) && defined(__GNUC__)
    // Without AVX there are no upper halves, nor the instruction.
    static const bool hasAvx = __builtin_cpu_supports("avx") != 0;
    if (hasAvx) {
        __asm__ volatile("vzeroupper");
    }
#endif
}
