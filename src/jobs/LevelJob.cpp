// SPDX-License-Identifier: Apache-2.0
#include "LevelJob.h"

#include "ReportText.h"

#include "log/Tracer.h"

#include <cmath>
#include <utility>

QString crestProblem(double wantedDb, double measuredDb)
{
    constexpr double ToleranceDb = 0.1;
    if (wantedDb < 0) {
        return QString::asprintf("A crest factor of %.2f dB is below 0 dB, which no signal has.",
                                 wantedDb);
    }
    if (std::fabs(wantedDb - measuredDb) > ToleranceDb) {
        return QString::asprintf("The crest factor to be written, %.2f dB, isn't that of the "
                                 "samples, %.2f dB.",
                                 wantedDb, measuredDb);
    }
    return {};
}

LevelJob::LevelJob(LevelRequest request, QObject *parent)
    : EditJob(request.inputFile, request.output, Reading::Quiet, parent)
    , m_request(std::move(request))
{
}

bool LevelJob::edit()
{
    const std::optional<double> clock = clockOr(m_request.clockHz);
    if (!clock) {
        return false;
    }
    output().setLength(*clock, source().info().samples);
    const WvFileInfo &info = source().info();
    const double crest = info.rmsOffset - info.peakOffset;
    const double peakDb = m_request.peakDb.value_or(-info.peakOffset);
    const double peakToRmsDb = m_request.peakToRmsDb.value_or(crest);
    if (const QString problem = crestProblem(peakToRmsDb, crest); !problem.isEmpty()) {
        Tracer::Trace(Tracer::Warning, problem);
    }
    Tracer::Trace(Tracer::Information, "Creating rescaled waveform...");
    WvWriteJob &record = output().record();
    record.peakOffset = writtenDb(-peakDb);
    record.rmsOffset = writtenDb(peakToRmsDb - peakDb);
    output().keepLevelsAsStated();
    const WvStreams streams{source().data(), source().markers(), source().tags()};
    if (!output().save(streams, "Saving waveform...")) {
        return false;
    }
    output().reportFile();
    output().reportLevels();
    return true;
}
