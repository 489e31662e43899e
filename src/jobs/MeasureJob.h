// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SampleReadJob.h"

#include "view/SignalFigures.h"

#include <QJsonObject>

#include <span>

/// Measures levels, bandwidth and power distribution of a range of samples.
class MeasureJob : public SampleReadJob
{
    Q_OBJECT

public:
    explicit MeasureJob(SampleRange range, std::optional<FrequencyBand> band = std::nullopt,
                        QObject *parent = nullptr);

    /// Valid after the job has finished.
    [[nodiscard]] const SignalFigures &result() const { return m_result; }

protected:
    [[nodiscard]] bool process(SourceWaveform &source, qint64 begin, qint64 count) override;

private:
    std::optional<FrequencyBand> m_band;
    SignalFigures m_result;
};

/// One figure as users name it.
struct NamedFigure
{
    const char *name;  ///< in JSON and in limits
    const char *label; ///< in lists
    const char *unit;
    double value; ///< no number where it doesn't apply
};

/// The figures in the order of reports; that of the band comes last.
[[nodiscard]] std::vector<NamedFigure> namedFigures(const SignalFigures &figures);

/// The figures by their names and the distribution as "ccdf". That of a band is there only if one
/// was measured.
[[nodiscard]] QJsonObject figuresJson(const SignalFigures &figures);

/// A figure with the digits that it deserves.
[[nodiscard]] QString figureText(const NamedFigure &figure);

/// A bound that a figure has to keep.
struct FigureLimit
{
    QString name;
    bool isUpper = true;
    double bound = 0;

    /// "crest<12"
    [[nodiscard]] QString text() const;
};

/// Why the figures don't keep the limit, naming both; empty if they do. A figure that doesn't apply
/// keeps none.
[[nodiscard]] QString limitProblem(const FigureLimit &limit, const SignalFigures &figures);
