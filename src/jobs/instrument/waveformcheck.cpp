// SPDX-License-Identifier: Apache-2.0
#include "waveformcheck.h"

#include "base/EngineeringNumber.h"
#include "instrument/instrumentmodels.h"
#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"

#include <QFile>
#include <QRegularExpression>

#include <algorithm>

namespace {

/// More than any memory takes, and exact in any number.
constexpr double LargestCount = 1e15;

QStringList problemsOn(const WaveformNeeds &needs, const BasebandLimits &limits,
                       const QString &owner, Doubts doubts)
{
    QStringList problems;
    if (limits.size > 0 && needs.samples > limits.size) {
        problems.append(QString("The waveform has %1 samples; the memory of %2 takes %3.")
                            .arg(needs.samples)
                            .arg(owner)
                            .arg(limits.size));
    }
    if (needs.clockHz > limits.clock) {
        problems.append(QString("The clock of the waveform is %1; %2 plays at most %3.")
                            .arg(engineeringText(needs.clockHz, "Hz"), owner,
                                 engineeringText(limits.clock, "Hz")));
    }
    if (doubts == Doubts::Told && needs.clockHz > limits.bandwidth) {
        problems.append(QString("At its clock of %1 the waveform may reach beyond the bandwidth of "
                                "%2, which is %3.")
                            .arg(engineeringText(needs.clockHz, "Hz"), owner,
                                 engineeringText(limits.bandwidth, "Hz")));
    }
    return problems;
}

} // namespace

bool isWaveformHead(const QByteArray &head)
{
    return head.trimmed().toUpper().startsWith("{TYPE");
}

bool isWaveformFile(const QString &fileName)
{
    constexpr qint64 HeadBytes = 64;
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) && isWaveformHead(file.read(HeadBytes));
}

std::optional<WaveformNeeds> needsOf(const QString &fileName)
{
    if (!isWaveformFile(fileName)) {
        Tracer::Trace(Tracer::Error, QString("The file '%1' is no waveform.").arg(fileName));
        return std::nullopt;
    }
    WvFileSummary summary;
    if (!HvFileIO().readWaveformInfo(fileName, &summary)) {
        return std::nullopt;
    }
    return WaveformNeeds{.samples = std::max<qint64>(summary.samples, 0),
                         .clockHz = std::max(summary.clock, 0.0)};
}

WaveformNeeds needsOfHead(const QByteArray &head)
{
    // No text of a tag holds braces, so that what looks like the begin of a tag is one.
    const QString whole = QString::fromLatin1(head);
    static const QRegularExpression block(R"(\{\s*WAVEFORM[^{}]*#)",
                                          QRegularExpression::CaseInsensitiveOption);
    const QString text = whole.left(block.match(whole).capturedStart());
    const auto number = [&text](const char *tag) {
        const QRegularExpression form(QString(R"(\{\s*%1\s*:\s*([^}\s]+)\s*\})").arg(tag),
                                      QRegularExpression::CaseInsensitiveOption);
        return form.match(text).captured(1).toDouble();
    };
    return {.samples = static_cast<qint64>(std::clamp(number("SAMPLES"), 0.0, LargestCount)),
            .clockHz = std::max(number("CLOCK"), 0.0)};
}

QStringList waveformProblems(const WaveformNeeds &needs, const InstrumentSummary &instrument,
                             Doubts doubts)
{
    if (instrument.analyzer) {
        return {QString("The %1 is an analyzer, which plays no waveforms.").arg(instrument.model)};
    }
    if (needs.samples <= 0) {
        return {"The waveform has no samples."};
    }
    std::optional<QStringList> fewest;
    for (size_t i = 0; i < instrument.baseband.size(); ++i) {
        if (const auto &limits = instrument.baseband[i]) {
            const QString owner = QString("baseband %1 of the %2").arg(i + 1).arg(instrument.model);
            const QStringList problems = problemsOn(needs, *limits, owner, doubts);
            if (!fewest || problems.size() < fewest->size()) {
                fewest = problems;
            }
        }
    }
    return fewest.value_or(QStringList());
}

QStringList problemsOfFile(const QString &fileName, const InstrumentSummary &instrument,
                           bool isOneOfMany, Doubts doubts)
{
    const std::optional<WaveformNeeds> needs =
        isWaveformFile(fileName) ? needsOf(fileName) : std::nullopt;
    if (!needs) {
        return {};
    }
    QStringList problems = waveformProblems(*needs, instrument, doubts);
    if (isOneOfMany) {
        for (QString &problem : problems) {
            problem.prepend(fileName + ": ");
        }
    }
    return problems;
}

std::optional<InstrumentSummary> summaryOfModel(const QString &model)
{
    const int index = findModel(model.toUpper());
    if (index == NoModel) {
        return std::nullopt;
    }
    InstrumentSummary summary;
    summary.model = modelRow(index)->name;
    summary.analyzer = modelRow(index)->analyzer;
    summary.baseband[0] = largestBasebandOf(index);
    return summary;
}
