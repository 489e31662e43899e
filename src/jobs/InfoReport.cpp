// SPDX-License-Identifier: Apache-2.0
#include "InfoReport.h"

#include "CheckJob.h"
#include "ReportText.h"

#include "base/EngineeringNumber.h"
#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"
#include "wvfile/foreignfile.h"

#include <QFile>
#include <QJsonArray>

#include <algorithm>

namespace {

QString yesNo(bool value)
{
    return value ? "Yes" : "No";
}

QString decibels(double value)
{
    // Adding nothing turns a negative zero into a plain one.
    return QString("%1 dB").arg(value + 0.0);
}

QString quoted(const QString &text)
{
    return '\'' + text + '\'';
}

/// Empty for what the file doesn't tell, which is shown as a negative number.
QString known(double value, const QString &unit = {})
{
    return value < 0 ? QString() : engineeringText(value, unit);
}

QJsonValue knownOrNull(double value)
{
    return value < 0 ? QJsonValue(QJsonValue::Null) : QJsonValue(value);
}

QString samplesText(const WvFileSummary &summary)
{
    QString count = known(static_cast<double>(summary.samples));
    if (!summary.isCutOff) {
        return count;
    }
    return QString("%1the file is cut off: %2 missing")
        .arg(count.isEmpty() ? count : count + ", ",
             summary.missingSamples > 0
                 ? engineeringText(static_cast<double>(summary.missingSamples)) + " are"
                 : QString("all are"));
}

InfoRow detail(const QString &label, const QString &value)
{
    return {label, value, InfoRow::Kind::Detail};
}

} // namespace

QList<InfoRow> fileRows(const WvFileSummary &summary)
{
    return {
        {"Type", summary.typeText},
        {"File Size", QString("%1 bytes").arg(summary.fileSize)},
        {"Created", summary.created},
        {"Comment", quoted(summary.comment)},
        {"Copyright", quoted(summary.copyright)},
        {"Date Info", quoted(summary.date)},
        {"Samples", samplesText(summary)},
        {"Clock", known(summary.clock, "Hz")},
        {"Play Time", known(summary.playTime, "s")},
        {"Peak Offset (Tag)", summary.levelsValid ? decibels(summary.peakOffset) : QString()},
        {"Peak / RMS (Tag)",
         summary.levelsValid ? decibels(summary.rmsOffset - summary.peakOffset) : QString()},
        {"Checksum", yesNo(summary.hasChecksum)},
        {"Markers", yesNo(summary.hasMarkers)},
    };
}

QList<InfoRow> segmentRows(const WvFileSummary &summary)
{
    if (summary.segmentCount <= 0) {
        return {};
    }
    QList<InfoRow> rows{
        {"Segments", QString::number(summary.segmentCount)},
        {"Settings File", summary.settingsFile},
        {"Level Mode", summary.levelMode},
        {"Clock Mode", summary.clockMode},
    };
    for (qsizetype i = 0; i < summary.segments.size(); ++i) {
        const WvSegment &segment = summary.segments.at(i);
        rows << InfoRow{QString("Segment %1").arg(i + 1), segment.fileName, InfoRow::Kind::Segment}
             << detail("Clock", engineeringText(segment.clock, "Hz"))
             << detail("Start Sample, Samples",
                       QString("%1, %2").arg(segment.start).arg(segment.length))
             << detail("Play Time", engineeringText(segment.duration, "s"))
             << detail("Peak Offset", decibels(segment.peakOffset))
             << detail("Peak/RMS", decibels(segment.rmsOffset - segment.peakOffset));
    }
    return rows;
}

QList<InfoRow> checkRows(const SampleCheck &check)
{
    QList<InfoRow> rows{{"Complete", yesNo(check.isComplete)}};
    if (check.samples > 0) {
        const auto measured = [](double value) {
            return QString::asprintf("%.2f dB", writtenDb(value));
        };
        rows << InfoRow{"Peak Offset (Measured)", measured(check.peakOffset)}
             << InfoRow{"Peak / RMS (Measured)", measured(check.rmsOffset - check.peakOffset)}
             << InfoRow{"Values At Full Scale", QString::number(check.clipped)}
             << InfoRow{"Loop Point", loopText(check.loop)};
    }
    return rows;
}

QString infoText(const WvFileSummary &summary, const SampleCheck *check)
{
    QList<InfoRow> rows{{"File", summary.fileName}};
    rows += fileRows(summary);
    if (check != nullptr) {
        rows += checkRows(*check);
    }
    rows += segmentRows(summary);
    qsizetype width = 0;
    for (InfoRow &row : rows) {
        if (row.kind == InfoRow::Kind::Detail) {
            row.label.prepend("   ");
        }
        width = std::max(width, row.label.size());
    }
    QString text;
    for (const InfoRow &row : rows) {
        text += (row.label + ':').leftJustified(width + 2) + row.value + '\n';
    }
    return text;
}

QJsonObject infoJson(const WvFileSummary &summary)
{
    QJsonArray segments;
    for (const WvSegment &segment : summary.segments) {
        segments.append(QJsonObject{
            {"fileName", segment.fileName},
            {"clock", segment.clock},
            {"start", segment.start},
            {"length", segment.length},
            {"duration", segment.duration},
            {"peakOffset", segment.peakOffset},
            {"rmsOffset", segment.rmsOffset},
        });
    }
    return {
        {"fileName", summary.fileName},
        {"fileSize", summary.fileSize},
        {"created", summary.created},
        {"type", summary.typeText},
        {"comment", summary.comment},
        {"copyright", summary.copyright},
        {"date", summary.date},
        {"samples", knownOrNull(static_cast<double>(summary.samples))},
        {"clock", knownOrNull(summary.clock)},
        {"playTime", knownOrNull(summary.playTime)},
        {"levelsValid", summary.levelsValid},
        {"peakOffset",
         summary.levelsValid ? QJsonValue(summary.peakOffset) : QJsonValue(QJsonValue::Null)},
        {"rmsOffset",
         summary.levelsValid ? QJsonValue(summary.rmsOffset) : QJsonValue(QJsonValue::Null)},
        {"hasChecksum", summary.hasChecksum},
        {"hasMarkers", summary.hasMarkers},
        {"missingSamples", summary.missingSamples},
        {"segmentCount", summary.segmentCount},
        {"segments", segments},
    };
}

QJsonObject checkJson(const SampleCheck &check)
{
    const auto figure = [&check](const QJsonValue &value) {
        return check.samples > 0 ? value : QJsonValue(QJsonValue::Null);
    };
    return {
        {"complete", check.isComplete},
        {"peakOffset", figure(check.peakOffset)},
        {"rmsOffset", figure(check.rmsOffset)},
        {"crest", figure(check.rmsOffset - check.peakOffset)},
        {"clipped", figure(check.clipped)},
        {"loopMagnitudeStep", figure(check.loop.magnitudeStepDb)},
        {"loopPhaseStep", figure(check.loop.phaseStepDegrees)},
        {"loopContinuous", figure(check.loop.isContinuous)},
    };
}

bool scanWaveform(const QString &fileName, WvFileSummary &summary)
{
    const bool scanned = HvFileIO().readWaveformInfo(fileName, &summary);
    if (scanned && !summary.typeText.isEmpty()) {
        return true;
    }
    if (const QString kind = foreignKind(fileName); !kind.isEmpty()) {
        return Tracer::fail(QString("This is no waveform file: it is %1.").arg(kind));
    }
    if (scanned) {
        return Tracer::fail("This is no waveform file: it has no TYPE tag.");
    }
    // A whole one ends with the brace of a tag.
    QFile file(fileName);
    if (file.open(QIODevice::ReadOnly) && file.seek(file.size() - 1) && file.read(1) != "}") {
        return Tracer::fail("The file is cut off within its tags.");
    }
    return false;
}
