// SPDX-License-Identifier: Apache-2.0
#include "FilterPreview.h"

#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "streams/samplestream.h"
#include "view/iqlevels.h"

#include <algorithm>
#include <cmath>

namespace {

std::optional<IqList> readList(BufferedIO &stream, int samples)
{
    std::vector<float> values(floatsOf(samples));
    if (readSamples(stream, values) != samples) {
        Tracer::Trace(Tracer::Error, "Insufficient data.");
        return std::nullopt;
    }
    return iqList(values);
}

} // namespace

FilterPreview::FilterPreview(QObject *parent)
    : QObject(parent)
{
}

void FilterPreview::cancel()
{
    m_cancelled = true;
    m_filter.cancel();
}

std::optional<FilterPreview::Result> FilterPreview::run(BufferedIO &source, qint64 samples,
                                                        const FilterSettings &settings)
{
    m_cancelled = false;
    Tracer::Trace(Tracer::Information, "Creating preview of filtered data...");
    const auto fail = [](const char *reason) {
        Tracer::Trace(Tracer::Error, QLatin1String(reason));
        return std::nullopt;
    };
    const auto count = static_cast<int>(std::min<qint64>(samples, MaxSamples));
    if (count < 1) {
        return fail("No input data.");
    }
    if (!source.checkHeader(BufferedIO::DataHeader)) {
        return fail("Error in temporary input data.");
    }
    std::optional<IqList> before = readList(source, count);
    if (!before) {
        return std::nullopt;
    }
    TempStream output;
    if (!output.open()) {
        return fail("Cannot create temporary data buffer for filtered data.");
    }
    m_filter.setInput(&source, count);
    m_filter.setOutput(output.stream(), count);
    if (!m_filter.configure(settings) || !m_filter.run()) {
        return m_cancelled ? std::nullopt : fail("Filtering of the waveform failed.");
    }
    // Brought to the level of what is shown beside it, or the two would not compare.
    const double factor =
        levelsOf(*before).peakLevel() * std::pow(10.0, m_filter.peakOffset() / 20);
    // Silence has no level to be brought to.
    if (std::isfinite(factor) && !m_filter.rescale(count, factor, output.stream())) {
        return m_cancelled ? std::nullopt : fail("Rescaling of the waveform failed.");
    }
    Tracer::Trace(Tracer::Information, "Creating FFT traces...");
    if (!output->checkHeader(BufferedIO::DataHeader)) {
        return fail("Error in temporary output data.");
    }
    std::optional<IqList> after = readList(*output.stream(), count);
    if (!after) {
        return std::nullopt;
    }
    return Result{std::move(*before), std::move(*after)};
}

IqList FilterPreview::spectrumInput(const IqList &samples)
{
    constexpr double FullScale = 32767.0;
    constexpr double ShortPi = 3.1415;
    IqList weighted;
    weighted.reserve(samples.size());
    const auto coded = [FullScale](double value, double weight) {
        const double word = std::clamp(std::trunc(value * FullScale), -32768.0, FullScale);
        return word * weight / FullScale;
    };
    const auto count = static_cast<double>(samples.size());
    for (qsizetype i = 0; i < samples.size(); ++i) {
        const double weight = 0.5 * (1 - std::cos(2 * ShortPi * static_cast<double>(i) / count));
        weighted.append({coded(samples[i].i, weight), coded(samples[i].q, weight)});
    }
    return weighted;
}
