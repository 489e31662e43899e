// SPDX-License-Identifier: Apache-2.0
#include "Analyzer.h"

#include <algorithm>
#include <cmath>

namespace simulator {

Analyzer::Analyzer(bool steppedSampleRate, std::uint64_t seed)
    : m_steppedSampleRate(steppedSampleRate)
    , m_seed(seed)
{
}

void Analyzer::configure(IqSettings settings, TimePoint now)
{
    constexpr double FullRateHz = 32e6;
    constexpr double MaxStep = 11; // 15.625 kHz
    if (m_steppedSampleRate) {
        const double step = std::round(std::log2(FullRateHz / settings.sampleRateHz));
        settings.sampleRateHz = FullRateHz / std::exp2(std::clamp(step, 0.0, MaxStep));
    }
    abort(now);
    m_settings = settings;
    m_hasRecord = false;
}

void Analyzer::setIqMode(bool on, TimePoint now)
{
    abort(now);
    m_hasRecord = false;
    m_iqMode = on;
}

void Analyzer::start(TimePoint now, bool ifPowerFires)
{
    abort(now);
    m_hasRecord = true;
    const bool fires = m_settings.trigger == IqSettings::Trigger::Immediate ||
                       (m_settings.trigger == IqSettings::Trigger::IfPower && ifPowerFires);
    if (fires) {
        begin(now);
    } else {
        m_waiting = true;
    }
}

void Analyzer::abort(TimePoint now)
{
    if (isPending(now)) {
        m_hasRecord = false;
    }
    m_waiting = false;
    m_sweepEnd = {};
}

void Analyzer::trigger(TimePoint now)
{
    if (m_waiting && m_settings.trigger == IqSettings::Trigger::External) {
        begin(now);
    }
}

bool Analyzer::isSweeping(TimePoint now) const
{
    return !m_waiting && now < m_sweepEnd;
}

TimePoint Analyzer::sweepEnd() const
{
    return m_waiting ? TimePoint::max() : m_sweepEnd;
}

std::unique_ptr<DataSource> Analyzer::record(std::uint64_t firstSample,
                                             std::uint64_t sampleCount) const
{
    return std::make_unique<IqSource>(m_seed, firstSample, sampleCount, format);
}

void Analyzer::reset()
{
    *this = Analyzer(m_steppedSampleRate, m_seed);
}

// A sweep takes as long as its samples last, and some time to set the receiver up.
void Analyzer::begin(TimePoint now)
{
    m_waiting = false;
    const double seconds = static_cast<double>(m_settings.sampleCount) / m_settings.sampleRateHz;
    m_sweepEnd =
        now + std::chrono::milliseconds(20) +
        std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(seconds));
}

} // namespace simulator
