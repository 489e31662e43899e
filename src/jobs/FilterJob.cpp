// SPDX-License-Identifier: Apache-2.0
#include "FilterJob.h"

#include "base/EngineeringNumber.h"
#include "dsp/Resample.h"
#include "dsp/windows.h"
#include "log/Tracer.h"

#include <algorithm>
#include <utility>

std::optional<ParameterRange> parameterRange(FilterKind kind)
{
    switch (kind) {
    case FilterKind::RootCosine:
    case FilterKind::Cosine:
        return ParameterRange{0.05, 0.99};
    case FilterKind::Gauss:
        return ParameterRange{0.001, 2.5};
    case FilterKind::Rectangular:
    case FilterKind::Custom:
        break;
    }
    return std::nullopt;
}

FilterSettings FilterRequest::settings(double sourceClockHz) const
{
    return {.window = window,
            .filter = kind,
            .length = length,
            .rate = sourceClockHz,
            .cutoff = bandwidthHz.value_or(0.4 * sourceClockHz),
            .parameter = parameter};
}

QString FilterRequest::problem(double sourceClockHz) const
{
    const FilterSettings filter = settings(sourceClockHz);
    const double most = 0.5 * sourceClockHz;
    const double least = std::min(MinBandwidthHz, most);
    if (!(filter.cutoff >= least && filter.cutoff <= most)) {
        return QString("The filter bandwidth of %1 is out of range; permitted: %2 to %3.")
            .arg(engineeringText(filter.cutoff, "Hz"), engineeringText(least, "Hz"),
                 engineeringText(most, "Hz"));
    }
    if (length < MinLength || length > MaxLength) {
        return QString("The filter length of %1 is out of range; permitted: %2 to %3.")
            .arg(length)
            .arg(MinLength)
            .arg(MaxLength);
    }
    const auto range = parameterRange(kind);
    if (range && !(parameter >= range->min && parameter <= range->max)) {
        return QString("The filter parameter %1 is out of range; permitted: %2 to %3.")
            .arg(parameter)
            .arg(range->min)
            .arg(range->max);
    }
    return {};
}

FilterJob::FilterJob(FilterRequest request, QObject *parent)
    : EditJob(request.inputFile, request.output, Reading::Reported, parent)
    , m_request(std::move(request))
{
    setEnding({"Filtering completed", "Filtering failed"});
}

bool FilterJob::edit()
{
    const WvFileInfo &info = source().info();
    const std::optional<double> clock = clockOr(m_request.clockHz);
    if (!clock) {
        return false;
    }
    const double sourceClock = info.clock > 0 ? info.clock : *clock;
    if (const QString problem = m_request.problem(sourceClock); !problem.isEmpty()) {
        return Tracer::fail(problem);
    }
    Tracer::Trace(Tracer::Information, "Creating filtered waveform...");
    reportSource();
    if (!m_data.openFor(source().info().samples)) {
        return Tracer::fail("Cannot create temporary data buffer for filtered data.");
    }
    emit report(ReportLine::heading("Filtering"));
    Resample filter;
    if (!filter.configure(m_request.settings(sourceClock))) {
        return Tracer::fail("Filtering of the waveform failed.");
    }
    filter.setInput(source().data(), info.samples);
    filter.setOutput(m_data.stream(), info.samples);
    {
        const JobStep step(*this, "Filtering Waveform...", filter);
        if (!filter.run() || isCancelled()) {
            return Tracer::fail("Filtering of the waveform failed.");
        }
    }
    if (!rescaleToSourcePeak(*m_data.stream(), static_cast<int>(info.samples), filter.peakOffset(),
                             filter.rmsOffset())) {
        return false;
    }
    output().setLength(*clock, info.samples);
    output().reportWaveform();
    emit report(ReportLine::heading("Saving"));
    const WvStreams streams{m_data.stream(), source().markers(), source().tags()};
    return output().save(streams, "Saving...");
}
