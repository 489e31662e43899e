// SPDX-License-Identifier: Apache-2.0
#include "SyntheticSignal.h"

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

namespace simulator {
namespace {

// SplitMix64 (Steele, Lea, Flood 2014) as a hash of a counter.
std::uint64_t mix(std::uint64_t value)
{
    value += 0x9E3779B97F4A7C15U;
    value = (value ^ (value >> 30U)) * 0xBF58476D1CE4E5B9U;
    value = (value ^ (value >> 27U)) * 0x94D049BB133111EBU;
    return value ^ (value >> 31U);
}

constexpr std::size_t NoiseTableSize = 65'536;

// Gaussian numbers with the deviation 1, from which the noise is drawn: logarithm and sine for each
// sample would make it ten times slower. Box and Muller: two uniform numbers, the first of them
// never 0, give two Gaussian ones.
std::vector<float> makeNoiseTable()
{
    std::vector<float> table(NoiseTableSize);
    constexpr double Scale = 1.0 / 4294967296.0;
    for (std::size_t k = 0; k < NoiseTableSize; k += 2) {
        const std::uint64_t random = mix(k);
        const double u = (static_cast<double>(random >> 32U) + 1.0) * Scale;
        const double angle =
            static_cast<double>(random & 0xFFFFFFFFU) * (Scale * 2.0 * std::numbers::pi);
        const double radius = std::sqrt(-2.0 * std::log(u));
        table[k] = static_cast<float>(radius * std::cos(angle));
        table[k + 1] = static_cast<float>(radius * std::sin(angle));
    }
    return table;
}

} // namespace

SyntheticSignal::SyntheticSignal(const Settings &settings)
    : m_settings(settings)
    , m_carrier(turnOf(settings.carrier))
    , m_spur(turnOf(settings.spur))
{
}

SyntheticSignal::Turn SyntheticSignal::turnOf(const Tone &tone) const
{
    Turn turn;
    const double step = 2.0 * std::numbers::pi * tone.frequencyHz / m_settings.sampleRateHz;
    for (std::size_t k = 0; k < turn.cosine.size(); ++k) {
        turn.cosine[k] = static_cast<float>(std::cos(step * static_cast<double>(k)));
        turn.sine[k] = static_cast<float>(std::sin(step * static_cast<double>(k)));
    }
    return turn;
}

void SyntheticSignal::makeBlock(std::int64_t block, std::span<IqSample, BlockSize> samples) const
{
    std::fill(samples.begin(), samples.end(), IqSample());
    const bool isBefore = block < 0; // sample 0 begins a block
    if (isBefore ? !m_settings.isSilentBefore : !m_settings.isSilentAfter) {
        addTone(m_settings.carrier, m_carrier, block * BlockSize, samples);
        addTone(m_settings.spur, m_spur, block * BlockSize, samples);
    }
    if (m_settings.noiseDeviation != 0) {
        addNoise(block, samples);
    }
    for (IqSample &sample : samples) {
        sample.i = std::clamp(sample.i, -1.0F, 1.0F);
        sample.q = std::clamp(sample.q, -1.0F, 1.0F);
    }
}

void SyntheticSignal::addTone(const Tone &tone, const Turn &turn, std::int64_t first,
                              std::span<IqSample, BlockSize> samples) const
{
    if (tone.amplitude == 0) {
        return;
    }
    // The phase is taken anew for each block, so rounding cannot pile up.
    const double cycles = static_cast<double>(first) * (tone.frequencyHz / m_settings.sampleRateHz);
    const double phase = 2.0 * std::numbers::pi * std::remainder(cycles, 1.0);
    const auto cosine = static_cast<float>(tone.amplitude * std::cos(phase));
    const auto sine = static_cast<float>(tone.amplitude * std::sin(phase));
    for (std::size_t k = 0; k < samples.size(); ++k) {
        samples[k].i += cosine * turn.cosine[k] - sine * turn.sine[k];
        samples[k].q += cosine * turn.sine[k] + sine * turn.cosine[k];
    }
}

void SyntheticSignal::addNoise(std::int64_t block, std::span<IqSample, BlockSize> samples) const
{
    static const std::vector<float> table = makeNoiseTable();
    const auto deviation = static_cast<float>(m_settings.noiseDeviation);
    const std::uint64_t seed = mix(m_settings.seed);
    std::uint64_t number = static_cast<std::uint64_t>(block) * BlockSize;
    const auto draw = [&](std::uint64_t random, unsigned place) {
        return deviation * table[(random >> (16 * place)) % NoiseTableSize];
    };
    // One random number serves two samples.
    for (std::size_t k = 0; k < samples.size(); k += 2) {
        const std::uint64_t random = mix(seed ^ number++);
        samples[k].i += draw(random, 0);
        samples[k].q += draw(random, 1);
        samples[k + 1].i += draw(random, 2);
        samples[k + 1].q += draw(random, 3);
    }
}

} // namespace simulator
