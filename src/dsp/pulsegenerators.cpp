// SPDX-License-Identifier: Apache-2.0
#include "signalgenerators.h"

#include "vectormath.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <vector>

namespace {

using SignalConstants::Circle;
using SignalConstants::HalfCircle;
using SignalConstants::QuarterCircle;

/// Times in samples.
struct PulseShape
{
    int rise = 0;
    int on = 0;
    int fall = 0;
    RampKind ramp = RampKind::Linear;

    [[nodiscard]] int width() const { return rise + on + fall; }

    /// The weight of a ramp at index `i` of `count`; unknown ramps have none.
    [[nodiscard]] double rampWeight(int i, int count) const
    {
        switch (ramp) {
        case RampKind::Linear:
            return static_cast<double>(i) / count;
        case RampKind::RaisedCosine:
            return 0.5 + 0.5 * std::sin(HalfCircle * i / count - QuarterCircle);
        }
        return 0.0;
    }

    [[nodiscard]] double fallWeight(int i) const
    {
        const bool known = ramp == RampKind::Linear || ramp == RampKind::RaisedCosine;
        return known ? 1 - rampWeight(i, fall) : 0.0;
    }

    /// The envelope, 0 outside.
    [[nodiscard]] double weight(int i) const
    {
        if (i < 0 || i >= width()) {
            return 0.0;
        }
        if (i < rise) {
            return rampWeight(i, rise);
        }
        return i < rise + on ? 1.0 : fallWeight(i - rise - on);
    }
};

/// Settings whose fit succeeded give counts far inside the range.
int samplesOf(double seconds, double clock)
{
    return static_cast<int>(std::clamp(seconds * clock + 0.5, 0.0, 1e9));
}

PulseShape shapeOf(const PulseSettings &settings, double clock)
{
    return {samplesOf(settings.riseTime, clock), samplesOf(settings.onTime, clock),
            samplesOf(settings.fallTime, clock), settings.ramp};
}

class SinglePulse final : public SignalGenerator
{
public:
    SinglePulse(const PulseRecord &record, const SignalFit &fit)
        : m_shape(shapeOf(record.pulse, fit.clock))
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            inPhase[i] = m_shape.weight(first + static_cast<int>(i));
            quadrature[i] = 0.0;
        }
    }

private:
    PulseShape m_shape;
};

class ChirpPulse final : public SignalGenerator
{
public:
    ChirpPulse(const PulseRecord &record, const SignalFit &fit)
        : m_shape(shapeOf(record.pulse, fit.clock))
        , m_range(record.chirpRange)
        , m_clock(fit.clock)
    {
        if (m_shape.ramp != RampKind::RaisedCosine) {
            m_shape.ramp = RampKind::Linear;
        }
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        if (first == 0) {
            m_cycles = 0;
        }
        std::fill(inPhase.begin(), inPhase.end(), 0.0);
        std::fill(quadrature.begin(), quadrature.end(), 0.0);
        const int inPulse =
            std::clamp(m_shape.width() - first, 0, static_cast<int>(inPhase.size()));
        const auto count = static_cast<std::size_t>(inPulse);
        m_angles.resize(count);
        for (std::size_t i = 0; i < count; ++i) {
            const double index = first + static_cast<double>(i);
            m_cycles += (index / m_shape.width() - 0.5) * m_range / m_clock;
            m_angles[i] = Circle * m_cycles;
        }
        sinCos(m_angles, quadrature.first(count), inPhase.first(count));
        for (std::size_t i = 0; i < count; ++i) {
            const double weight = m_shape.weight(first + static_cast<int>(i));
            inPhase[i] = weight * inPhase[i];
            quadrature[i] = weight * quadrature[i];
        }
    }

private:
    PulseShape m_shape;
    double m_range; ///< Hz
    double m_clock; ///< Hz
    double m_cycles = 0;
    std::vector<double> m_angles;
};

/// Two pulses of the same shape; the second one has a level and a phase of its own.
class DoublePulse final : public SignalGenerator
{
public:
    DoublePulse(const PulseRecord &record, const SignalFit &fit)
        : m_shape(shapeOf(record.pulse, fit.clock))
        , m_record(record)
        , m_secondStart(m_shape.width() + samplesOf(record.pause, fit.clock))
        , m_end(m_secondStart + m_shape.width())
        , m_holdEnd(m_end - m_shape.fall + samplesOf(record.pulse.blankTime, fit.clock))
        , m_phase(record.phase2 / 360.0 * Circle)
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            const int index = first + static_cast<int>(i);
            // Behind the second pulse its last value stays for the blank time less the fall.
            const int source = index >= m_end && index < m_holdEnd ? m_end - 1 : index;
            const double level2 = m_record.level2 * m_shape.weight(source - m_secondStart);
            inPhase[i] = level2 * std::cos(m_phase);
            quadrature[i] = level2 * std::sin(m_phase);
            if (source < m_secondStart) {
                inPhase[i] = 0.0;
                quadrature[i] = m_record.level1 * m_shape.weight(source);
            }
        }
    }

private:
    PulseShape m_shape;
    PulseRecord m_record;
    int m_secondStart;
    int m_end; ///< of the second pulse
    int m_holdEnd;
    double m_phase; ///< radians
};

/// A pulse whose level follows a pattern of symbols.
class CodedPulse final : public SignalGenerator
{
public:
    CodedPulse(const PulseRecord &record, const SignalFit &fit)
        : m_shape(shapeOf(record.pulse, fit.clock))
        , m_pattern(record.pattern)
        , m_transition(samplesOf(record.transitionTime, fit.clock))
        , m_symbol(static_cast<double>(m_shape.on + m_transition) /
                   static_cast<double>(std::max<qsizetype>(m_pattern.size(), 1)))
    {
    }

    [[nodiscard]] bool isValid() const { return !m_pattern.isEmpty() && m_symbol > 0; }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        if (first == 0) {
            m_last = 0.0;
        }
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            const int index = first + static_cast<int>(i);
            if (index < m_shape.width()) {
                m_last = valueAt(index);
            }
            inPhase[i] = 0.0;
            quadrature[i] = m_last;
        }
    }

private:
    [[nodiscard]] double levelOf(int symbol) const
    {
        return m_pattern.at(symbol) == '1' ? 1.0 : -1.0;
    }

    [[nodiscard]] double valueAt(int index) const
    {
        const int lastSymbol = static_cast<int>(m_pattern.size()) - 1;
        const int place = index - m_shape.rise;
        const int symbol = std::clamp(static_cast<int>(place / m_symbol), 0, lastSymbol);
        const double level = levelOf(symbol);
        if (index < m_shape.rise || index >= m_shape.rise + m_shape.on) {
            return level * m_shape.weight(index);
        }
        const double next = symbol < lastSymbol ? levelOf(symbol + 1) : level;
        const double start = std::trunc(m_symbol * symbol);
        const double moved = place - start - (m_symbol - m_transition);
        if (next == level || moved < 0) {
            return level;
        }
        const double value =
            m_shape.ramp == RampKind::RaisedCosine
                ? (next - level) / 2 * std::sin(HalfCircle * moved / m_transition - QuarterCircle)
                : (next - level) * (moved / m_transition - 0.5);
        return std::clamp(value, -1.0, 1.0);
    }

    PulseShape m_shape;
    QByteArray m_pattern;
    int m_transition; ///< samples
    double m_symbol;  ///< samples
    double m_last = 0.0;
};

} // namespace

std::unique_ptr<SignalGenerator> makePulse(const PulseRecord &record, const SignalFit &fit)
{
    switch (record.kind) {
    case PulseKind::Single:
        return std::make_unique<SinglePulse>(record, fit);
    case PulseKind::Double:
        return std::make_unique<DoublePulse>(record, fit);
    case PulseKind::Chirp:
        return std::make_unique<ChirpPulse>(record, fit);
    case PulseKind::Coded: {
        auto pulse = std::make_unique<CodedPulse>(record, fit);
        if (pulse->isValid()) {
            return pulse;
        }
        return nullptr;
    }
    }
    return nullptr;
}
