// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dsp/signalfit.h"

#include <cmath>
#include <complex>
#include <cstdlib>
#include <vector>

// The signals written sample by sample in double precision with the C library's functions, as the
// judges of the quick forms.

namespace Literal {

using Vectors = std::vector<std::complex<double>>;

inline constexpr double T = 6.2831853;
inline constexpr double P = 3.14159265;
inline constexpr double H = 1.570796325;

/// At the angle x, which is the part t of a turn, shifted by ph.
inline double shape(FunctionKind kind, double x, double t, double ph)
{
    double value = 0;
    switch (kind) {
    case FunctionKind::Sine:
        return std::sin(x + ph);
    case FunctionKind::Square:
        return std::sin(x + ph) < 0 ? -1 : 1;
    case FunctionKind::Triangular:
        value = 4 * (t + ph / T) - 1;
        for (int fold = 0; fold < 2; ++fold) {
            value = value > 1 ? 2 - value : value;
            value = value < -1 ? -2 - value : value;
        }
        return value;
    case FunctionKind::Sawtooth:
        value = 2 * (t + ph / T) - 1;
        value = value < -1 ? value + 2 : value;
        return value > 1 ? value - 2 : value;
    }
    return value;
}

inline Vectors function(const FunctionSettings &s, const SignalFit &fit)
{
    Vectors out;
    for (int i = 0; i < fit.samples; ++i) {
        const double x = T * i / fit.samples;
        const double t = static_cast<double>(i) / fit.samples;
        out.emplace_back(shape(s.kind, x, t, 0) * s.amplitudeI + s.offsetI,
                         shape(s.kind, x, t, s.phaseQ / 360.0 * T) * s.amplitudeQ + s.offsetQ);
    }
    return out;
}

/// Draws its phases with rand().
inline Vectors multiCarrier(const MultiCarrierSettings &s, const SignalFit &fit)
{
    const int n = s.carriers / 2;
    double phase[64] = {};
    for (int k = 1; k <= n; ++k) {
        phase[k % 64] = s.randomPhase ? ((std::rand() % 365) / 365.0) * T : 0.0;
    }
    Vectors out;
    for (int i = 0; i < fit.samples; ++i) {
        const double x = s.spacing * T * i / fit.clock;
        double sum = 0;
        for (int k = 1; k <= n; ++k) {
            sum += std::sin(k * x + phase[k % 64]) + s.offsetI;
        }
        out.emplace_back(sum / n, 0.0);
    }
    return out;
}

inline double envelope(const PulseSettings &s, double clock, int i)
{
    const int ri = static_cast<int>(s.riseTime * clock + 0.5);
    const int on = static_cast<int>(s.onTime * clock + 0.5);
    const int fa = static_cast<int>(s.fallTime * clock + 0.5);
    const bool cosine = s.ramp == RampKind::RaisedCosine;
    if (i < ri) {
        return cosine ? 0.5 + 0.5 * std::sin(P * i / ri - H) : static_cast<double>(i) / ri;
    }
    if (i < ri + on) {
        return 1.0;
    }
    const int j = i - ri - on;
    if (j < fa) {
        return cosine ? 1 - (0.5 + 0.5 * std::sin(P * j / fa - H))
                      : 1 - static_cast<double>(j) / fa;
    }
    return 0.0;
}

inline Vectors pulse(const PulseSettings &s, const SignalFit &fit)
{
    Vectors out;
    for (int i = 0; i < fit.samples; ++i) {
        out.emplace_back(envelope(s, fit.clock, i), 0.0);
    }
    return out;
}

inline Vectors chirp(const ChirpSettings &s, const SignalFit &fit)
{
    const double clock = fit.clock;
    const int w = static_cast<int>(s.pulse.riseTime * clock + 0.5) +
                  static_cast<int>(s.pulse.onTime * clock + 0.5) +
                  static_cast<int>(s.pulse.fallTime * clock + 0.5);
    Vectors out;
    double acc = 0;
    for (int i = 0; i < fit.samples; ++i) {
        acc += (static_cast<double>(i) / w - 0.5) * s.range / clock;
        const double phi = T * acc;
        const double weight = envelope(s.pulse, clock, i);
        out.emplace_back(i < w ? weight * std::cos(phi) : 0.0,
                         i < w ? weight * std::sin(phi) : 0.0);
    }
    return out;
}

inline Vectors fm(const FmSettings &s, const SignalFit &fit)
{
    Vectors out;
    double acc1 = 0;
    double acc2 = 0;
    for (int i = 0; i < fit.samples; ++i) {
        acc1 +=
            std::sin(T * (s.frequency1 / fit.base) * i / fit.samples) * s.deviation1 / fit.clock;
        if (s.kind == FmKind::SingleTone) {
            const double phi = T * acc1;
            out.emplace_back(std::cos(phi), std::sin(phi));
        } else {
            acc2 += std::sin(T * (s.frequency2 / fit.base) * i / fit.samples) * s.deviation2 /
                    fit.clock;
            const double phi = T * (acc1 + acc2);
            out.emplace_back(0.5 * std::cos(phi), 0.5 * std::sin(phi));
        }
    }
    return out;
}

inline double triangle(double e)
{
    const double t = std::fmod(std::fabs(e), T) / T;
    double value = 4 * (t - 0.75) - 1;
    if (t < 0.25) {
        value = 4 * t;
    } else if (t < 0.75) {
        value = 1 - 4 * (t - 0.25);
    }
    return e < 0 ? -value : value;
}

inline Vectors sweep(const SweepSettings &s, const SignalFit &fit)
{
    const double ph1 = s.startPhase / 360.0 * T;
    const double ph2 = s.stopPhase / 360.0 * T;
    Vectors out;
    double acc = 0;
    for (int i = 0; i < fit.samples; ++i) {
        const double e = (ph2 - ph1) * i / fit.samples + ph1;
        double frequency = s.deviation * i / fit.samples - s.deviation * 0.5;
        if (s.kind == SweepKind::Sine) {
            frequency = s.deviation * 0.5 * std::sin(e);
        } else if (s.kind == SweepKind::Triangular) {
            frequency = s.deviation * 0.5 * triangle(e);
        }
        acc += frequency / fit.clock;
        const double phi = T * acc;
        out.emplace_back(0.707 * std::cos(phi), 0.707 * std::sin(phi));
    }
    return out;
}

inline Vectors pm(const PmSettings &s, const SignalFit &fit)
{
    Vectors out;
    for (int i = 0; i < fit.samples; ++i) {
        const double x = T * i / fit.samples;
        const double phi = (s.deviation / 360.0) * std::sin(x) * T;
        out.emplace_back(0.707 * std::cos(phi), 0.707 * std::sin(phi));
    }
    return out;
}

inline Vectors am(const AmSettings &s, const SignalFit &fit)
{
    Vectors out;
    for (int i = 0; i < fit.samples; ++i) {
        const double x = T * i / fit.samples;
        const double m1 = s.depth1;
        const double full = m1 * 0.707 / 100;
        const double half = m1 * 0.5 / 100;
        const double x1 = T * i / fit.period1;
        const double x2 = T * i / fit.period2;
        switch (s.kind) {
        case AmKind::Regular:
            out.emplace_back((0.5 + half * std::sin(x)) * 0.707, 0.0);
            break;
        case AmKind::Lsb:
            out.emplace_back(full * std::sin(x), full * std::sin(x + H));
            break;
        case AmKind::Usb:
            out.emplace_back(full * std::sin(x), full * std::sin(x - H));
            break;
        case AmKind::LsbCarrier:
            out.emplace_back((half * std::sin(x) + 0.5) * 0.707,
                             (half * std::sin(x + H) + 0.5) * 0.707);
            break;
        case AmKind::UsbCarrier:
            out.emplace_back((half * std::sin(x) + 0.5) * 0.707,
                             (half * std::sin(x - H) + 0.5) * 0.707);
            break;
        case AmKind::LsbUsb:
            out.emplace_back(half * std::sin(x), 0.0);
            break;
        case AmKind::TwoTone: {
            const double a = m1 / 3 / 100;
            const double b = s.depth2 / 3 / 100;
            out.emplace_back((a * std::sin(x1) + b * std::sin(x2) + 0.3333333333333333) / 3.0,
                             (a * std::sin(x1 - H) + b * std::sin(x2 + H) + 0.3333333333333333) /
                                 3.0);
            break;
        }
        case AmKind::TwoToneNoCarrier: {
            const double b = s.depth2 * 0.707 / 100;
            out.emplace_back((full * std::sin(x1) + b * std::sin(x2)) * 0.5,
                             (full * std::sin(x1 - H) + b * std::sin(x2 + H)) * 0.5);
            break;
        }
        }
    }
    return out;
}

/// Before the band limit; draws with rand().
inline Vectors noise(const NoiseSettings &s, const SignalFit &fit)
{
    const auto gauss = [] {
        const double u1 = (std::rand() % 1000 + 1) / 1001.0;
        const double u2 = (std::rand() % 1000 + 1) / 1001.0;
        return std::sqrt(-2 * std::log(1 - u1)) * std::cos(T * u2);
    };
    double state[2][7] = {};
    const auto pink = [](double(&b)[7], double w) {
        b[0] = 0.99886 * b[0] + 0.0555179 * w;
        b[1] = 0.99332 * b[1] + 0.0750759 * w;
        b[2] = 0.969 * b[2] + 0.153852 * w;
        b[3] = 0.8665 * b[3] + 0.3104856 * w;
        b[4] = 0.55 * b[4] + 0.5329522 * w;
        b[5] = -0.7616 * b[5] - 0.016898 * w;
        const double y = b[0] + b[1] + b[2] + b[3] + b[4] + b[5] + b[6] + 0.5362 * w;
        b[6] = 0.115926 * w;
        return y;
    };
    Vectors out;
    std::complex<double> sum = 0;
    for (int i = 0; i < fit.samples; ++i) {
        const double g1 = gauss();
        const double g2 = gauss();
        sum += std::complex<double>(0.02 * g1, 0.02 * g2);
        switch (s.kind) {
        case NoiseKind::White:
            out.emplace_back(0.1 * g1, 0.1 * g2);
            break;
        case NoiseKind::Pink: {
            const double re = pink(state[0], 0.02 * g1);
            out.emplace_back(re, pink(state[1], 0.02 * g2));
            break;
        }
        case NoiseKind::Brown:
            out.push_back(sum);
            break;
        }
    }
    return out;
}

} // namespace Literal
