// SPDX-License-Identifier: Apache-2.0
#include "IqSource.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstring>
#include <numbers>

namespace simulator {
namespace {

constexpr std::size_t ValueSize = sizeof(float);

// SplitMix64 (Steele, Lea, Flood 2014) as a hash of a counter.
std::uint64_t mix(std::uint64_t value)
{
    value += 0x9E3779B97F4A7C15U;
    value = (value ^ (value >> 30U)) * 0xBF58476D1CE4E5B9U;
    value = (value ^ (value >> 27U)) * 0x94D049BB133111EBU;
    return value ^ (value >> 31U);
}

std::uint32_t littleEndian(float value)
{
    const auto bits = std::bit_cast<std::uint32_t>(value);
    if constexpr (std::endian::native == std::endian::little) {
        return bits;
    }
    return __builtin_bswap32(bits);
}

} // namespace

SyntheticSignal::SyntheticSignal(std::uint64_t seed)
    : m_seed(mix(seed))
{
    constexpr double CarrierPhaseStep = 2.0 * std::numbers::pi / 16.0;
    constexpr double SpurPhaseStep = -2.0 * std::numbers::pi * 3.0 / 32.0;
    for (unsigned i = 0; i < Period; ++i) {
        const double carrier = CarrierPhaseStep * i;
        const double spur = SpurPhaseStep * i;
        m_carriers[i] = {static_cast<float>(CarrierAmplitude * std::cos(carrier) +
                                            SpurAmplitude * std::cos(spur)),
                         static_cast<float>(CarrierAmplitude * std::sin(carrier) +
                                            SpurAmplitude * std::sin(spur))};
    }
}

IqSample SyntheticSignal::sample(std::uint64_t index) const
{
    // Box and Muller: two uniform numbers, the first of them never 0, give two Gaussian ones.
    constexpr double Scale = 1.0 / 4294967296.0;
    const std::uint64_t random = mix(m_seed ^ index);
    const double u = (static_cast<double>(random >> 32U) + 1.0) * Scale;
    const double angle =
        static_cast<double>(random & 0xFFFFFFFFU) * (Scale * 2.0 * std::numbers::pi);
    const double radius = NoiseDeviation * std::sqrt(-2.0 * std::log(u));
    const IqSample &carriers = m_carriers[index % Period];
    return {carriers.i + static_cast<float>(radius * std::cos(angle)),
            carriers.q + static_cast<float>(radius * std::sin(angle))};
}

IqSource::IqSource(std::uint64_t seed, std::uint64_t firstSample, std::uint64_t sampleCount,
                   IqFormat format)
    : m_signal(seed)
    , m_firstSample(firstSample)
    , m_sampleCount(sampleCount)
    , m_format(format)
{
}

float IqSource::value(std::uint64_t number) const
{
    const bool pairs = m_format == IqFormat::Pairs;
    const std::uint64_t index = pairs ? number / 2 : number % m_sampleCount;
    const bool isQ = pairs ? number % 2 == 1 : number >= m_sampleCount;
    const IqSample sample = m_signal.sample(m_firstSample + index);
    return isQ ? sample.q : sample.i;
}

std::size_t IqSource::read(std::uint64_t offset, std::span<char> buffer)
{
    const std::uint64_t total = m_sampleCount * 2 * ValueSize;
    const std::uint64_t left = total - std::min(offset, total);
    const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(buffer.size(), left));
    std::size_t done = 0;
    while (done < wanted) {
        const std::uint64_t at = offset + done;
        const std::uint64_t number = at / ValueSize;
        const auto skip = static_cast<std::size_t>(at % ValueSize);
        if (m_format == IqFormat::Pairs && number % 2 == 0 && skip == 0 &&
            wanted - done >= 2 * ValueSize) {
            const IqSample sample = m_signal.sample(m_firstSample + number / 2);
            const std::array<std::uint32_t, 2> bits{littleEndian(sample.i), littleEndian(sample.q)};
            std::memcpy(buffer.data() + done, bits.data(), sizeof(bits));
            done += sizeof(bits);
            continue;
        }
        const std::uint32_t bits = littleEndian(value(number));
        const std::size_t count = std::min(ValueSize - skip, wanted - done);
        std::memcpy(buffer.data() + done, reinterpret_cast<const char *>(&bits) + skip, count);
        done += count;
    }
    return wanted;
}

} // namespace simulator
