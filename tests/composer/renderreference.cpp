// SPDX-License-Identifier: Apache-2.0
#include "renderreference.h"

#include <algorithm>
#include <cmath>

namespace {

struct Playing
{
    int segment = -1;
    qint64 first = -1;
    qint64 last = -1;
    qint64 source = 0;
};

double factorOf(const ComposerSegment &segment, const Playing &playing, double clock, qint64 n)
{
    const double pi = 3.1415926535;
    const auto inLength = static_cast<qint32>(clock * segment.dFadeIn + 0.5);
    const auto outLength = static_cast<qint32>(clock * segment.dFadeOut + 0.5);
    const qint64 outStart = playing.last - outLength + 1;
    double g = 1;
    if (playing.first <= n && n < playing.first + inLength) {
        const double x = double(n - playing.first) / inLength;
        const double shapes[] = {x, 1 - (std::cos(pi * x) + 1) * 0.5, std::sqrt(x), 0};
        g = shapes[segment.iFadeIn];
    }
    if (outStart <= n && n < outStart + outLength) {
        const double x = double(n - outStart) / outLength;
        const double shapes[] = {1 - x, (std::cos(pi * x) + 1) * 0.5, 1 - std::sqrt(x), 0};
        g *= shapes[segment.iFadeOut];
    }
    return g * std::pow(10.0, segment.dLOfs / -20);
}

Playing search(const Composition &document, const ComposerTrack &track, qint64 n)
{
    const qint64 N = document.target.lSamples;
    const double clock = document.target.dUsrClk;
    for (std::size_t i = 0; i < track.segments.size(); ++i) {
        const ComposerSegment &segment = track.segments[i];
        const qint64 first = segment.lTarget;
        const qint64 last =
            first + qint64(clock / segment.dSrcClk * double(segment.lUsed) + 0.5) - 1;
        if (first <= n && n <= last) {
            return {int(i), first, last, segment.lStart};
        }
        if (segment.bWrap && first - N <= n && n <= last - N) {
            const qint64 d = N - first;
            const qint64 played = d > 0 ? qint64(double(d) * (segment.dSrcClk / clock)) : 0;
            return {int(i), std::max<qint64>(first - N, 0), last - N, segment.lStart + played};
        }
    }
    return {};
}

} // namespace

Rendered renderLiterally(const Composition &document,
                         const std::vector<std::vector<ReferenceSource>> &sources)
{
    const auto count = static_cast<std::size_t>(document.target.lSamples);
    std::vector<Playing> state(document.tracks().size());
    Rendered result;
    double peak = 0;
    double power = 0;
    for (std::size_t n = 0; n < count; ++n) {
        const auto at = static_cast<qint64>(n);
        float re = 0;
        float im = 0;
        quint8 marker = 0;
        for (std::size_t t = 0; t < state.size(); ++t) {
            const ComposerTrack &track = document.tracks()[t];
            if (!track.bEnable) {
                continue;
            }
            Playing &playing = state[t];
            if (at > playing.last) {
                playing = search(document, track, at);
            }
            if (playing.segment < 0) {
                continue;
            }
            const auto index = static_cast<std::size_t>(playing.segment);
            const ComposerSegment &segment = track.segments[index];
            const ReferenceSource &source = sources[t][index];
            const auto k = static_cast<std::size_t>(playing.source++);
            const double v = factorOf(segment, playing, document.target.dUsrClk, at);
            if (k < source.samples.size()) {
                re = static_cast<float>(double(re) + double(source.samples[k].real()) * v);
                im = static_cast<float>(double(im) + double(source.samples[k].imag()) * v);
                marker |= segment.bMkr ? source.markers[k] : quint8{0};
            }
        }
        const double p = double(re) * double(re) + double(im) * double(im);
        peak = std::max(peak, p);
        power += p;
        result.samples.emplace_back(re, im);
        result.markers.push_back(marker);
    }
    const auto scale = static_cast<float>(1 / std::sqrt(peak));
    for (std::complex<float> &sample : result.samples) {
        sample *= scale;
    }
    result.rms = std::sqrt(power / double(count)) / std::sqrt(peak);
    return result;
}
