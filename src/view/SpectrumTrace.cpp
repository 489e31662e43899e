// SPDX-License-Identifier: Apache-2.0
#include "SpectrumTrace.h"

#include "AveragedSpectrum.h"
#include "SpectrumLines.h"
#include "dsp/windows.h"
#include "plotscale.h"

#include <algorithm>
#include <cmath>

namespace {

std::vector<double> levelsOfPowers(std::vector<double> powers)
{
    for (double &value : powers) {
        value = magnitudeToDb(std::sqrt(value));
    }
    return powers;
}

} // namespace

double SpectrumTrace::resolution() const
{
    return level.empty() ? 0 : noiseBandwidth / static_cast<double>(level.size());
}

std::size_t SpectrumTrace::pointAt(double share) const
{
    const auto points = static_cast<double>(level.size());
    const double point = std::floor((share + 0.5) * points + 0.5);
    return static_cast<std::size_t>(std::clamp(point, 0.0, std::max(points - 1, 0.0)));
}

double SpectrumTrace::shareOf(std::size_t point) const
{
    return static_cast<double>(point) / static_cast<double>(level.size()) - 0.5;
}

std::optional<std::size_t> SpectrumTrace::peakBelow(double limit) const
{
    std::optional<std::size_t> best;
    for (std::size_t k = 0; k < level.size(); ++k) {
        const bool rises = k == 0 || level[k] > level[k - 1];
        const bool falls = k + 1 == level.size() || level[k] >= level[k + 1];
        if (rises && falls && level[k] < limit && (!best || level[k] > level[*best])) {
            best = k;
        }
    }
    return best;
}

SpectrumTrace makeTrace(const SpectrumSettings &settings, const SpectrumLines &lines,
                        std::span<const IqSample> samples)
{
    SpectrumTrace trace;
    if (settings.average == SpectrumAverage::MeanDb) {
        trace.level = lines.mean();
        trace.frames = std::ssize(lines.lines());
        if (settings.showMaximum) {
            trace.maximum = lines.maximum();
        }
        return trace;
    }
    const auto count = static_cast<qint64>(samples.size());
    AveragedSpectrum spectrum(count, settings.length, settings.window);
    spectrum.append(samples);
    const bool isMaximum = settings.average == SpectrumAverage::Maximum;
    trace.level = levelsOfPowers(isMaximum ? spectrum.maximum() : spectrum.mean());
    if (settings.showMaximum && !isMaximum) {
        trace.maximum = levelsOfPowers(spectrum.maximum());
    }
    trace.frames = spectrum.frames();
    trace.noiseBandwidth = spectrum.noiseBandwidth();
    trace.window = windowName(settings.window);
    return trace;
}
