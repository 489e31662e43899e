// SPDX-License-Identifier: Apache-2.0
#include "IqSource.h"

#include <algorithm>
#include <bit>
#include <cstring>

namespace simulator {
namespace {

constexpr std::size_t ValueSize = sizeof(float);

} // namespace

static_assert(sizeof(IqSample) == IqSource::SampleSize &&
                  std::endian::native == std::endian::little,
              "blocks are sent as they lie in memory");

IqSource::IqSource(const SyntheticSignal &signal, std::int64_t firstSample,
                   std::uint64_t sampleCount, IqFormat format)
    : m_signal(signal)
    , m_firstSample(firstSample)
    , m_sampleCount(sampleCount)
    , m_format(format)
{
}

// Returns the sample's place in the block.
std::size_t IqSource::loadBlockOf(std::uint64_t place)
{
    constexpr std::int64_t Size = SyntheticSignal::BlockSize;
    const std::int64_t number = m_firstSample + static_cast<std::int64_t>(place);
    const std::int64_t inBlock = (number % Size + Size) % Size;
    const std::int64_t block = (number - inBlock) / Size;
    if (block != m_blockNumber) {
        m_signal.makeBlock(block, m_block);
        m_blockNumber = block;
    }
    return static_cast<std::size_t>(inBlock);
}

const IqSample &IqSource::sample(std::uint64_t place)
{
    const std::size_t inBlock = loadBlockOf(place);
    return m_block[inBlock];
}

std::size_t IqSource::read(std::uint64_t offset, std::span<char> buffer)
{
    const std::uint64_t total = m_sampleCount * SampleSize;
    const std::uint64_t left = total - std::min(offset, total);
    const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(buffer.size(), left));
    std::size_t done = 0;
    while (done < wanted) {
        const std::uint64_t at = offset + done;
        std::size_t count = 0;
        if (m_format == IqFormat::Pairs) {
            const std::size_t begin = loadBlockOf(at / SampleSize) * SampleSize + at % SampleSize;
            count = std::min(wanted - done, sizeof(m_block) - begin);
            std::memcpy(buffer.data() + done,
                        reinterpret_cast<const char *>(m_block.data()) + begin, count);
        } else {
            const std::uint64_t number = at / ValueSize;
            const IqSample &pair = sample(number % m_sampleCount);
            const float value = number < m_sampleCount ? pair.i : pair.q;
            const auto skip = static_cast<std::size_t>(at % ValueSize);
            count = std::min(wanted - done, ValueSize - skip);
            std::memcpy(buffer.data() + done, reinterpret_cast<const char *>(&value) + skip, count);
        }
        done += count;
    }
    return wanted;
}

} // namespace simulator
