// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputQueue.h"
#include "SyntheticSignal.h"

#include <array>
#include <cstdint>
#include <limits>

namespace simulator {

/// The order of the values in a record.
enum class IqFormat {
    Pairs,  ///< I and Q of each sample together
    Blocks, ///< all I, then all Q
};

/// A record of the synthetic signal as 32-bit floats, little-endian.
class IqSource final : public DataSource
{
public:
    static constexpr std::uint64_t SampleSize = 8; ///< bytes

    /// `firstSample` counts from the trigger on.
    IqSource(const SyntheticSignal &signal, std::int64_t firstSample, std::uint64_t sampleCount,
             IqFormat format);

    [[nodiscard]] std::size_t read(std::uint64_t offset, std::span<char> buffer) override;

    /// One sample of the record, by its place there.
    [[nodiscard]] const IqSample &sample(std::uint64_t place);

private:
    [[nodiscard]] std::size_t loadBlockOf(std::uint64_t place);

    SyntheticSignal m_signal;
    std::int64_t m_firstSample;
    std::uint64_t m_sampleCount;
    IqFormat m_format;
    std::array<IqSample, SyntheticSignal::BlockSize> m_block{};
    std::int64_t m_blockNumber = std::numeric_limits<std::int64_t>::min();
};

} // namespace simulator
