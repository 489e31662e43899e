// SPDX-License-Identifier: Apache-2.0
#include "Analyzer.h"

#include <algorithm>
#include <cmath>

namespace simulator {
namespace {

// The signal at the RF input: two tones beside the centre frequency, whatever that is.
constexpr double CarrierHz = 62.5e3;
constexpr double CarrierDbm = -16;
constexpr double SpurHz = -93.75e3;
constexpr double SpurDbm = -36;

// The same at the I/Q inputs, which know no reference level.
constexpr double IqCarrier = 0.5;
constexpr double IqSpur = 0.05;

constexpr double NoiseDeviation = 0.001;

// A record shows this share of its sample rate, its filter takes the rest away.
constexpr double UsableShare = 0.8;

} // namespace

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

void Analyzer::start(TimePoint now, const Sweep &sweep)
{
    abort(now);
    m_hasRecord = true;
    m_sweepDelay = sweep.delay;
    m_signal = signalAt(sweep.referenceDbm);
    const bool reachesTrigger = m_signal.carrier.amplitude != 0 && CarrierDbm >= sweep.triggerDbm;
    const bool fires = m_settings.trigger == IqSettings::Trigger::Immediate ||
                       (m_settings.trigger == IqSettings::Trigger::IfPower && reachesTrigger);
    if (fires) {
        begin(now);
    } else {
        m_waiting = true;
    }
}

// What lies at the input that is chosen, as the record's rate and the reference level let it in.
SyntheticSignal::Settings Analyzer::signalAt(double referenceDbm) const
{
    const auto tone = [&](double frequencyHz, double amplitude) {
        const bool isInside = std::abs(frequencyHz) <= UsableShare / 2 * m_settings.sampleRateHz;
        return SyntheticSignal::Tone{frequencyHz, isInside ? amplitude : 0};
    };
    const auto amplitude = [&](double dbm) { return std::pow(10, (dbm - referenceDbm) / 20); };
    SyntheticSignal::Settings signal;
    signal.seed = m_seed;
    signal.sampleRateHz = m_settings.sampleRateHz;
    switch (input) {
    case AnalyzerInput::Rf:
        signal.carrier = tone(CarrierHz, amplitude(CarrierDbm));
        signal.spur = tone(SpurHz, amplitude(SpurDbm));
        signal.noiseDeviation = NoiseDeviation;
        break;
    case AnalyzerInput::AnalogIq:
        signal.carrier = tone(-CarrierHz, IqCarrier);
        signal.spur = tone(-SpurHz, IqSpur);
        signal.noiseDeviation = NoiseDeviation;
        break;
    case AnalyzerInput::DigitalIq:
        signal.carrier = tone(CarrierHz, IqCarrier);
        break;
    }
    if (m_settings.trigger == IqSettings::Trigger::IfPower) {
        signal.isSilentBefore = m_settings.positiveSlope;
        signal.isSilentAfter = !m_settings.positiveSlope;
    }
    return signal;
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

std::unique_ptr<IqSource> Analyzer::record(std::uint64_t firstSample,
                                           std::uint64_t sampleCount) const
{
    const std::int64_t first =
        static_cast<std::int64_t>(firstSample) - m_settings.pretriggerSamples;
    return std::make_unique<IqSource>(SyntheticSignal(m_signal), first, sampleCount, format);
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
        now + std::chrono::milliseconds(20) + m_sweepDelay +
        std::chrono::duration_cast<Clock::duration>(std::chrono::duration<double>(seconds));
}

} // namespace simulator
