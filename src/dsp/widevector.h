// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "base/simd.h"

#include <cstddef>
#include <cstring>

/// Bytes of the vectors that the kernels compute in.
inline constexpr std::size_t KernelVectorBytes = 64;

/// One kernel vector as so many registers of `Bytes` as it takes. The lanes and the order of all
/// sums are the same for every register size, and so are the bits of the results.
template <typename Real, std::size_t Bytes>
struct WideVector
{
    static constexpr int Lanes = static_cast<int>(KernelVectorBytes / sizeof(Real));
    static constexpr std::size_t PartLanes = Bytes / sizeof(Real);
    static constexpr std::size_t Parts = KernelVectorBytes / Bytes;
    typedef Real Part __attribute__((vector_size(Bytes)));
    typedef float SamplePart __attribute__((vector_size(PartLanes * sizeof(float))));

    Part parts[Parts];
};

// The functions take vectors by reference: by value, the way would depend on the instruction set.
// Registers are copied one by one: copied as a whole, vectors would go through memory.

template <typename Real, std::size_t Bytes>
CORVANE_INLINE void load(WideVector<Real, Bytes> &vector, const Real *from)
{
    using Wide = WideVector<Real, Bytes>;
    for (std::size_t part = 0; part < Wide::Parts; ++part) {
        std::memcpy(&vector.parts[part], from + part * Wide::PartLanes, Bytes);
    }
}

template <typename Real, std::size_t Bytes>
CORVANE_INLINE void store(const WideVector<Real, Bytes> &vector, Real *to)
{
    using Wide = WideVector<Real, Bytes>;
    for (std::size_t part = 0; part < Wide::Parts; ++part) {
        std::memcpy(to + part * Wide::PartLanes, &vector.parts[part], Bytes);
    }
}

/// Reads samples, which are floats, into lanes of either type.
template <typename Real, std::size_t Bytes>
CORVANE_INLINE void loadPart(typename WideVector<Real, Bytes>::Part &part, const float *from)
{
    typename WideVector<Real, Bytes>::SamplePart samples;
    std::memcpy(&samples, from, sizeof(samples));
    part = __builtin_convertvector(samples, typename WideVector<Real, Bytes>::Part);
}

/// The lanes of a quarter of the vector: the sums of the lanes that lie a quarter apart, halves
/// first.
template <typename Real, std::size_t Bytes>
struct QuarterSum
{
    typedef Real Vector __attribute__((vector_size(KernelVectorBytes / 4)));

    CORVANE_INLINE static void of(const WideVector<Real, Bytes> &wide, Vector &sum)
    {
        Vector quarters[4];
        std::memcpy(quarters, &wide, sizeof(quarters));
        sum = (quarters[0] + quarters[2]) + (quarters[1] + quarters[3]);
    }
};

/// Instruction sets that the wide kernels are compiled for.
enum class InstructionSet { Baseline, Avx2, Avx512 };

/// The best one of this machine.
[[nodiscard]] inline InstructionSet instructionSet()
{
#if CORVANE_HAS_CLONES
    static const InstructionSet best = __builtin_cpu_supports("avx512f") ? InstructionSet::Avx512
                                       : __builtin_cpu_supports("avx2")  ? InstructionSet::Avx2
                                                                         : InstructionSet::Baseline;
    return best;
#else
    return InstructionSet::Baseline;
#endif
}

/// Defines `function(argument)` as the call of `body<bytes>(argument)`, compiled once for each
/// instruction set with its register size. The body must be CORVANE_INLINE.
// NOLINTBEGIN(bugprone-macro-parentheses): the names of templates and types take none.
#if CORVANE_HAS_CLONES
#define CORVANE_WIDE_KERNEL(function, Argument, body)                                              \
    namespace {                                                                                    \
    [[gnu::target("avx512f")]] void function##Avx512(Argument argument)                            \
    {                                                                                              \
        body<64>(argument);                                                                        \
    }                                                                                              \
    [[gnu::target("avx2")]] void function##Avx2(Argument argument)                                 \
    {                                                                                              \
        body<32>(argument);                                                                        \
    }                                                                                              \
    }                                                                                              \
    void function(Argument argument)                                                               \
    {                                                                                              \
        switch (instructionSet()) {                                                                \
        case InstructionSet::Avx512:                                                               \
            return function##Avx512(argument);                                                     \
        case InstructionSet::Avx2:                                                                 \
            return function##Avx2(argument);                                                       \
        case InstructionSet::Baseline:                                                             \
            return body<16>(argument);                                                             \
        }                                                                                          \
    }
#else
#define CORVANE_WIDE_KERNEL(function, Argument, body)                                              \
    void function(Argument argument)                                                               \
    {                                                                                              \
        body<16>(argument);                                                                        \
    }
#endif
// NOLINTEND(bugprone-macro-parentheses)
