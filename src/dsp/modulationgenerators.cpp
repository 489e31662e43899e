// SPDX-License-Identifier: Apache-2.0
#include "signalgenerators.h"

#include "base/simd.h"
#include "vectormath.h"

#include <cmath>
#include <cstddef>
#include <vector>

namespace {

using SignalConstants::Circle;
using SignalConstants::Level;
using SignalConstants::QuarterCircle;

/// angles[i] = turn (first + i) / divisor.
CORVANE_CLONES void linearAngles(double turn, int first, double divisor, std::span<double> angles)
{
    const int count = static_cast<int>(angles.size());
    for (int i = 0; i < count; ++i) {
        angles[static_cast<std::size_t>(i)] = turn * (first + i) / divisor;
    }
}

CORVANE_CLONES void addToAll(std::span<double> angles, double addend)
{
    for (double &angle : angles) {
        angle += addend;
    }
}

/// Writes level exp(j angle).
void fillVectors(std::span<const double> angles, double level, std::span<double> inPhase,
                 std::span<double> quadrature)
{
    sinCos(angles, quadrature, inPhase);
    if (level != 1.0) {
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            inPhase[i] = level * inPhase[i];
            quadrature[i] = level * quadrature[i];
        }
    }
}

/// One modulating tone: the integral of its frequency deviation.
struct FmTone
{
    double turn;      ///< radians over the whole signal
    double deviation; ///< Hz
    double cycles = 0;
};

class FmGenerator final : public SignalGenerator
{
public:
    FmGenerator(const FmSettings &settings, const SignalFit &fit)
        : m_fit(fit)
        , m_isTwoTone(settings.kind == FmKind::TwoTone)
        , m_tone1{Circle * (settings.frequency1 / fit.base), settings.deviation1}
        , m_tone2{Circle * (settings.frequency2 / fit.base), settings.deviation2}
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        m_angles.resize(inPhase.size());
        m_cycles1.resize(inPhase.size());
        integrate(m_tone1, first, m_cycles1);
        if (m_isTwoTone) {
            m_cycles2.resize(inPhase.size());
            integrate(m_tone2, first, m_cycles2);
            for (std::size_t i = 0; i < m_cycles1.size(); ++i) {
                m_cycles1[i] += m_cycles2[i];
            }
        }
        for (std::size_t i = 0; i < m_angles.size(); ++i) {
            m_angles[i] = Circle * m_cycles1[i];
        }
        fillVectors(m_angles, m_isTwoTone ? 0.5 : 1.0, inPhase, quadrature);
    }

private:
    void integrate(FmTone &tone, int first, std::vector<double> &cycles)
    {
        if (first == 0) {
            tone.cycles = 0;
        }
        linearAngles(tone.turn, first, m_fit.samples, m_angles);
        sines(m_angles, cycles);
        for (double &value : cycles) {
            tone.cycles += value * tone.deviation / m_fit.clock;
            value = tone.cycles;
        }
    }

    SignalFit m_fit;
    bool m_isTwoTone;
    FmTone m_tone1;
    FmTone m_tone2;
    std::vector<double> m_angles;
    std::vector<double> m_cycles1;
    std::vector<double> m_cycles2;
};

double triangleOf(double angle)
{
    const double t = std::fmod(std::abs(angle), Circle) / Circle;
    const double value = t < 0.25 ? 4 * t : t < 0.75 ? 1 - 4 * (t - 0.25) : 4 * (t - 0.75) - 1;
    return angle < 0 ? -value : value;
}

class SweepGenerator final : public SignalGenerator
{
public:
    SweepGenerator(const SweepSettings &settings, const SignalFit &fit)
        : m_settings(settings)
        , m_fit(fit)
        , m_startPhase(settings.startPhase / 360.0 * Circle)
        , m_stopPhase(settings.stopPhase / 360.0 * Circle)
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        if (first == 0) {
            m_cycles = 0;
        }
        m_angles.resize(inPhase.size());
        m_frequencies.resize(inPhase.size());
        fillFrequencies(first);
        for (std::size_t i = 0; i < m_angles.size(); ++i) {
            m_cycles += m_frequencies[i] / m_fit.clock;
            m_angles[i] = Circle * m_cycles;
        }
        fillVectors(m_angles, Level, inPhase, quadrature);
    }

private:
    void fillFrequencies(int first)
    {
        const double deviation = m_settings.deviation;
        if (m_settings.kind == SweepKind::Linear) {
            linearAngles(deviation, first, m_fit.samples, m_frequencies);
            addToAll(m_frequencies, -(deviation * 0.5));
            return;
        }
        linearAngles(m_stopPhase - m_startPhase, first, m_fit.samples, m_angles);
        addToAll(m_angles, m_startPhase);
        if (m_settings.kind == SweepKind::Sine) {
            sines(m_angles, m_frequencies);
        } else {
            for (std::size_t i = 0; i < m_angles.size(); ++i) {
                m_frequencies[i] = triangleOf(m_angles[i]);
            }
        }
        for (double &value : m_frequencies) {
            value = deviation * 0.5 * value;
        }
    }

    SweepSettings m_settings;
    SignalFit m_fit;
    double m_startPhase; ///< radians
    double m_stopPhase;  ///< radians
    double m_cycles = 0;
    std::vector<double> m_angles;
    std::vector<double> m_frequencies;
};

class PmGenerator final : public SignalGenerator
{
public:
    PmGenerator(const PmSettings &settings, const SignalFit &fit)
        : m_turns(settings.deviation / 360.0)
        , m_samples(fit.samples)
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        m_angles.resize(inPhase.size());
        linearAngles(Circle, first, m_samples, m_angles);
        sines(m_angles, inPhase);
        for (std::size_t i = 0; i < m_angles.size(); ++i) {
            m_angles[i] = m_turns * inPhase[i] * Circle;
        }
        fillVectors(m_angles, Level, inPhase, quadrature);
    }

private:
    double m_turns; ///< of the deviation
    double m_samples;
    std::vector<double> m_angles;
};

class AmGenerator final : public SignalGenerator
{
public:
    AmGenerator(const AmSettings &settings, const SignalFit &fit)
        : m_settings(settings)
        , m_fit(fit)
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        m_angles.resize(inPhase.size());
        if (m_settings.kind == AmKind::TwoTone || m_settings.kind == AmKind::TwoToneNoCarrier) {
            fillTwoTone(first, inPhase, quadrature);
            return;
        }
        linearAngles(Circle, first, m_fit.samples, m_angles);
        sines(m_angles, inPhase);
        if (m_settings.kind == AmKind::Regular || m_settings.kind == AmKind::LsbUsb) {
            std::fill(quadrature.begin(), quadrature.end(), 0.0);
        } else {
            const bool lower =
                m_settings.kind == AmKind::Lsb || m_settings.kind == AmKind::LsbCarrier;
            addToAll(m_angles, lower ? QuarterCircle : -QuarterCircle);
            sines(m_angles, quadrature);
        }
        scaleTone(inPhase, quadrature);
    }

private:
    void scaleTone(std::span<double> inPhase, std::span<double> quadrature) const
    {
        const double half = m_settings.depth1 * 0.5 / 100;
        const double full = m_settings.depth1 * Level / 100;
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            switch (m_settings.kind) {
            case AmKind::Regular:
                inPhase[i] = (0.5 + half * inPhase[i]) * Level;
                break;
            case AmKind::Lsb:
            case AmKind::Usb:
                inPhase[i] = full * inPhase[i];
                quadrature[i] = full * quadrature[i];
                break;
            case AmKind::LsbCarrier:
            case AmKind::UsbCarrier:
                inPhase[i] = (half * inPhase[i] + 0.5) * Level;
                quadrature[i] = (half * quadrature[i] + 0.5) * Level;
                break;
            default:
                inPhase[i] = half * inPhase[i];
                break;
            }
        }
    }

    /// The sines of one tone, a quarter circle behind for tone 1 and ahead for tone 2 in Q.
    void fillTone(int first, double period, double quarter, std::span<double> inPhase,
                  std::span<double> quadrature)
    {
        linearAngles(Circle, first, period, m_angles);
        sines(m_angles, inPhase);
        addToAll(m_angles, quarter);
        sines(m_angles, quadrature);
    }

    void fillTwoTone(int first, std::span<double> inPhase, std::span<double> quadrature)
    {
        m_tone2I.resize(inPhase.size());
        m_tone2Q.resize(inPhase.size());
        fillTone(first, m_fit.period1, -QuarterCircle, inPhase, quadrature);
        fillTone(first, m_fit.period2, QuarterCircle, m_tone2I, m_tone2Q);
        const bool carrier = m_settings.kind == AmKind::TwoTone;
        const double a = carrier ? m_settings.depth1 / 3 / 100 : m_settings.depth1 * Level / 100;
        const double b = carrier ? m_settings.depth2 / 3 / 100 : m_settings.depth2 * Level / 100;
        const auto combine = [&](double tone1, double tone2) {
            const double sum = a * tone1 + b * tone2;
            return carrier ? (sum + 0.3333333333333333) / 3.0 : sum * 0.5;
        };
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            inPhase[i] = combine(inPhase[i], m_tone2I[i]);
            quadrature[i] = combine(quadrature[i], m_tone2Q[i]);
        }
    }

    AmSettings m_settings;
    SignalFit m_fit;
    std::vector<double> m_angles;
    std::vector<double> m_tone2I;
    std::vector<double> m_tone2Q;
};

} // namespace

std::unique_ptr<SignalGenerator> makeFm(const FmSettings &settings, const SignalFit &fit)
{
    if (settings.kind != FmKind::SingleTone && settings.kind != FmKind::TwoTone) {
        return nullptr;
    }
    return std::make_unique<FmGenerator>(settings, fit);
}

std::unique_ptr<SignalGenerator> makeSweep(const SweepSettings &settings, const SignalFit &fit)
{
    switch (settings.kind) {
    case SweepKind::Linear:
    case SweepKind::Sine:
    case SweepKind::Triangular:
        return std::make_unique<SweepGenerator>(settings, fit);
    }
    return nullptr;
}

std::unique_ptr<SignalGenerator> makePm(const PmSettings &settings, const SignalFit &fit)
{
    return std::make_unique<PmGenerator>(settings, fit);
}

std::unique_ptr<SignalGenerator> makeAm(const AmSettings &settings, const SignalFit &fit)
{
    switch (settings.kind) {
    case AmKind::Regular:
    case AmKind::Lsb:
    case AmKind::Usb:
    case AmKind::LsbCarrier:
    case AmKind::UsbCarrier:
    case AmKind::LsbUsb:
    case AmKind::TwoTone:
    case AmKind::TwoToneNoCarrier:
        return std::make_unique<AmGenerator>(settings, fit);
    }
    return nullptr;
}
