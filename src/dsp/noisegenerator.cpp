// SPDX-License-Identifier: Apache-2.0
#include "signalgenerators.h"

#include <array>
#include <cmath>
#include <cstddef>
#include <cstdlib>

namespace {

using SignalConstants::Circle;

/// Gaussian values by the Box-Muller transform. The draws have 1000 values, so that its two factors
/// can be looked up.
class GaussianSource
{
public:
    GaussianSource()
    {
        for (std::size_t i = 0; i < Draws; ++i) {
            const double u = static_cast<double>(i + 1) / 1001.0;
            m_radii[i] = std::sqrt(-2 * std::log(1 - u));
            m_cosines[i] = std::cos(Circle * u);
        }
    }

    [[nodiscard]] double draw() const
    {
        const double radius = m_radii[next()];
        return radius * m_cosines[next()];
    }

private:
    static constexpr std::size_t Draws = 1000;

    static std::size_t next()
    {
        return static_cast<std::size_t>(std::rand()) % Draws; // NOLINT(*-msc50-cpp)
    }

    std::array<double, Draws> m_radii;
    std::array<double, Draws> m_cosines;
};

/// Paul Kellet's refined filter: white noise in, 1/f noise out, within 0.05 dB above 1/5000 of the
/// sample rate.
class PinkFilter
{
public:
    [[nodiscard]] double filter(double white)
    {
        m_b0 = 0.99886 * m_b0 + 0.0555179 * white;
        m_b1 = 0.99332 * m_b1 + 0.0750759 * white;
        m_b2 = 0.969 * m_b2 + 0.153852 * white;
        m_b3 = 0.8665 * m_b3 + 0.3104856 * white;
        m_b4 = 0.55 * m_b4 + 0.5329522 * white;
        m_b5 = -0.7616 * m_b5 - 0.016898 * white;
        const double pink = m_b0 + m_b1 + m_b2 + m_b3 + m_b4 + m_b5 + m_b6 + 0.5362 * white;
        m_b6 = 0.115926 * white;
        return pink;
    }

private:
    double m_b0 = 0;
    double m_b1 = 0;
    double m_b2 = 0;
    double m_b3 = 0;
    double m_b4 = 0;
    double m_b5 = 0;
    double m_b6 = 0;
};

class NoiseGenerator final : public SignalGenerator
{
public:
    explicit NoiseGenerator(NoiseKind kind)
        : m_kind(kind)
    {
    }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        if (first == 0) {
            m_pinkI = {};
            m_pinkQ = {};
            m_sumI = 0;
            m_sumQ = 0;
        }
        for (std::size_t i = 0; i < inPhase.size(); ++i) {
            const double drawnI = m_source.draw();
            const double drawnQ = m_source.draw();
            switch (m_kind) {
            case NoiseKind::White:
                inPhase[i] = 0.1 * drawnI;
                quadrature[i] = 0.1 * drawnQ;
                break;
            case NoiseKind::Pink:
                inPhase[i] = m_pinkI.filter(0.02 * drawnI);
                quadrature[i] = m_pinkQ.filter(0.02 * drawnQ);
                break;
            case NoiseKind::Brown:
                m_sumI += 0.02 * drawnI;
                m_sumQ += 0.02 * drawnQ;
                inPhase[i] = m_sumI;
                quadrature[i] = m_sumQ;
                break;
            }
        }
    }

private:
    NoiseKind m_kind;
    GaussianSource m_source;
    PinkFilter m_pinkI;
    PinkFilter m_pinkQ;
    double m_sumI = 0;
    double m_sumQ = 0;
};

} // namespace

std::unique_ptr<SignalGenerator> makeNoise(const NoiseSettings &settings)
{
    switch (settings.kind) {
    case NoiseKind::White:
    case NoiseKind::Pink:
    case NoiseKind::Brown:
        return std::make_unique<NoiseGenerator>(settings.kind);
    }
    return nullptr;
}
