// SPDX-License-Identifier: Apache-2.0
#include "signalgenerators.h"

#include "base/simd.h"
#include "vectormath.h"

#include <cstddef>
#include <vector>

namespace {

using SignalConstants::Circle;

CORVANE_CLONES void periodAngles(int first, double samples, std::span<double> angles)
{
    const int count = static_cast<int>(angles.size());
    for (int i = 0; i < count; ++i) {
        angles[static_cast<std::size_t>(i)] = Circle * (first + i) / samples;
    }
}

double triangle(double value)
{
    for (int i = 0; i < 2; ++i) {
        if (value > 1) {
            value = 2 - value;
        }
        if (value < -1) {
            value = -2 - value;
        }
    }
    return value;
}

class FunctionGenerator final : public SignalGenerator
{
public:
    FunctionGenerator(const FunctionSettings &settings, const SignalFit &fit)
        : m_settings(settings)
        , m_samples(fit.samples)
        , m_phase(settings.phaseQ / 360.0 * Circle)
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        switch (m_settings.kind) {
        case FunctionKind::Sine:
        case FunctionKind::Square:
            fillSines(first, inPhase, quadrature);
            break;
        case FunctionKind::Triangular:
            fillTriangular(first, inPhase, quadrature);
            break;
        case FunctionKind::Sawtooth:
            fillSawtooth(first, inPhase, quadrature);
            break;
        }
    }

private:
    void fillSines(int first, std::span<double> inPhase, std::span<double> quadrature)
    {
        m_angles.resize(inPhase.size());
        periodAngles(first, m_samples, m_angles);
        sines(m_angles, inPhase);
        for (double &angle : m_angles) {
            angle += m_phase;
        }
        sines(m_angles, quadrature);
        if (m_settings.kind == FunctionKind::Square) {
            for (std::size_t i = 0; i < inPhase.size(); ++i) {
                inPhase[i] = inPhase[i] < 0 ? -1.0 : 1.0;
                quadrature[i] = quadrature[i] < 0 ? -1.0 : 1.0;
            }
        }
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            inPhase[i] = inPhase[i] * m_settings.amplitudeI + m_settings.offsetI;
            quadrature[i] = quadrature[i] * m_settings.amplitudeQ + m_settings.offsetQ;
        }
    }

    void fillTriangular(int first, std::span<double> inPhase, std::span<double> quadrature) const
    {
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            const double t = (first + static_cast<double>(i)) / m_samples;
            const double a = 4 * t - 1;
            const double b = triangle(4 * (t + m_phase / Circle) - 1);
            inPhase[i] = (a > 1 ? 2 - a : a) * m_settings.amplitudeI + m_settings.offsetI;
            quadrature[i] = b * m_settings.amplitudeQ + m_settings.offsetQ;
        }
    }

    void fillSawtooth(int first, std::span<double> inPhase, std::span<double> quadrature) const
    {
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            const double t = (first + static_cast<double>(i)) / m_samples;
            double u = 2 * (t + m_phase / Circle) - 1;
            if (u < -1) {
                u = u + 2;
            }
            inPhase[i] = (2 * t - 1) * m_settings.amplitudeI + m_settings.offsetI;
            quadrature[i] = (u > 1 ? u - 2 : u) * m_settings.amplitudeQ + m_settings.offsetQ;
        }
    }

    FunctionSettings m_settings;
    double m_samples;
    double m_phase; ///< of Q, radians
    std::vector<double> m_angles;
};

} // namespace

std::unique_ptr<SignalGenerator> makeFunction(const FunctionSettings &settings,
                                              const SignalFit &fit)
{
    switch (settings.kind) {
    case FunctionKind::Sine:
    case FunctionKind::Square:
    case FunctionKind::Triangular:
    case FunctionKind::Sawtooth:
        return std::make_unique<FunctionGenerator>(settings, fit);
    }
    return nullptr;
}
