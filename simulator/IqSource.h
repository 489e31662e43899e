// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputQueue.h"

#include <array>
#include <cstdint>

namespace simulator {

/// One complex sample in units of the reference level.
struct IqSample
{
    float i = 0;
    float q = 0;
};

/// The signal at the input of every simulated analyzer: a carrier of half the reference level at
/// 1/16 of the sample rate above the centre, a second one of 1/20 at 3/32 below it, and white
/// Gaussian noise of 1/1000 in each of I and Q.
///
/// Each sample depends on the seed and its number alone, so that any part of a record can be made
/// at any time and is always the same.
class SyntheticSignal
{
public:
    explicit SyntheticSignal(std::uint64_t seed);

    [[nodiscard]] IqSample sample(std::uint64_t index) const;

    static constexpr double CarrierAmplitude = 0.5;
    static constexpr double SpurAmplitude = 0.05;
    static constexpr double NoiseDeviation = 0.001;

private:
    static constexpr unsigned Period = 32; ///< samples after which both carriers repeat

    std::uint64_t m_seed;
    std::array<IqSample, Period> m_carriers{};
};

/// The order of the values in a record.
enum class IqFormat {
    Pairs,  ///< I and Q of each sample together
    Blocks, ///< all I, then all Q
};

/// A record of the synthetic signal as 32-bit floats, little-endian.
class IqSource final : public DataSource
{
public:
    IqSource(std::uint64_t seed, std::uint64_t firstSample, std::uint64_t sampleCount,
             IqFormat format);

    [[nodiscard]] std::size_t read(std::uint64_t offset, std::span<char> buffer) override;

private:
    [[nodiscard]] float value(std::uint64_t number) const;

    SyntheticSignal m_signal;
    std::uint64_t m_firstSample;
    std::uint64_t m_sampleCount;
    IqFormat m_format;
};

} // namespace simulator
