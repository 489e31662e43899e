// SPDX-License-Identifier: Apache-2.0
#include "MeasureJob.h"

#include "JobSource.h"
#include "ReportText.h"

#include "base/EngineeringNumber.h"
#include "streams/levels.h"

#include <QJsonArray>

#include <cmath>
#include <limits>
#include <utility>

MeasureJob::MeasureJob(SampleRange range, std::optional<FrequencyBand> band, QObject *parent)
    : SampleReadJob(std::move(range), parent)
    , m_band(band)
{
}

bool MeasureJob::process(SourceWaveform &source, qint64 begin, qint64 count)
{
    emit stepStarted("Calculating...");
    JobSource samples(*this, source, begin, count, 2);
    const std::optional<SignalFigures> figures =
        measureFigures(samples, source.info().clock, m_band);
    if (figures) {
        m_result = *figures;
    }
    return figures.has_value();
}

std::vector<NamedFigure> namedFigures(const SignalFigures &figures)
{
    constexpr double None = std::numeric_limits<double>::quiet_NaN();
    const double peakOffset = measuredOffset(figures.peak);
    const double rmsOffset = measuredOffset(figures.rms);
    return {{"samples", "Samples", "", static_cast<double>(figures.samples)},
            {"peakOffset", "Peak Offset", "dB", peakOffset},
            {"rmsOffset", "RMS Offset", "dB", rmsOffset},
            {"crest", "Peak / RMS", "dB", rmsOffset - peakOffset},
            {"dcI", "DC Offset I", "", figures.dcI},
            {"dcQ", "DC Offset Q", "", figures.dcQ},
            {"obw99", "OBW (99 %)", "Hz", figures.occupiedHz.value_or(None)},
            {"obwCentre", "OBW Centre", "Hz", figures.occupiedCentreHz.value_or(None)},
            {"bandPower", "Band Power", "dB", figures.bandDb.value_or(None)}};
}

QJsonObject figuresJson(const SignalFigures &figures)
{
    QJsonObject object;
    for (const NamedFigure &figure : namedFigures(figures)) {
        const QString name = figure.name;
        if (name == "samples") {
            object[name] = figures.samples;
        } else if (name != "bandPower" || figures.bandDb) {
            object[name] = figure.value;
        }
    }
    QJsonArray points;
    for (const CcdfPoint &point : figures.ccdf) {
        points.append(QJsonArray{point.overMeanDb, point.probability});
    }
    object["ccdf"] = points;
    return object;
}

QString figureText(const NamedFigure &figure)
{
    const QString unit = figure.unit;
    if (!std::isfinite(figure.value)) {
        return {};
    }
    if (unit == "Hz") {
        return engineeringText(figure.value, unit);
    }
    if (unit == "dB") {
        return QString::asprintf("%.6f dB", writtenDb(figure.value));
    }
    return QLatin1String(figure.name) == QLatin1String("samples")
               ? QString::number(figure.value, 'f', 0)
               : QString::number(figure.value, 'f', 6);
}

QString FigureLimit::text() const
{
    return QString("%1%2%3").arg(name, isUpper ? "<" : ">").arg(bound, 0, 'g', 10);
}

QString limitProblem(const FigureLimit &limit, const SignalFigures &figures)
{
    for (const NamedFigure &figure : namedFigures(figures)) {
        if (limit.name != QLatin1String(figure.name)) {
            continue;
        }
        if (!std::isfinite(figure.value)) {
            return QString("Limit %1 is not met: %2 doesn't apply to this signal.")
                .arg(limit.text(), limit.name);
        }
        const bool kept = limit.isUpper ? figure.value < limit.bound : figure.value > limit.bound;
        return kept ? QString()
                    : QString("Limit %1 is not met: %2 is %3.")
                          .arg(limit.text(), limit.name)
                          .arg(figure.value, 0, 'g', 8);
    }
    return QString("Limit %1: there is no figure %2.").arg(limit.text(), limit.name);
}
