// SPDX-License-Identifier: Apache-2.0
#include "ReportText.h"

#include "base/EngineeringNumber.h"
#include "log/Tracer.h"
#include "wvfile/WvTypes.h"

#include <QRegularExpression>

#include <algorithm>
#include <cmath>

namespace {

/// Two decimals; an offset that rounds to zero is shown without a sign.
QString decibelText(double value)
{
    const QString text = QString::asprintf("%4.2f", value);
    return (text == "-0.00" ? QString("0.00") : text) + " dB";
}

} // namespace

ReportLine fileRow(const QString &fileName)
{
    return ReportLine::row("File", fileName);
}

ReportLines levelRows(const WvWriteJob &waveform)
{
    return {
        ReportLine::row("Samples", QString::number(waveform.samples)),
        ReportLine::row("Peak Offset", decibelText(waveform.peakOffset)),
        ReportLine::row("Peak/RMS", decibelText(waveform.rmsOffset - waveform.peakOffset)),
    };
}

ReportLines waveformRows(const QString &fileName, const WvWriteJob &waveform)
{
    return ReportLines{fileRow(fileName),
                       ReportLine::row("Clock Rate", engineeringText(waveform.clock, "Hz"))} +
           levelRows(waveform);
}

QString clippingText(qint64 clipped, qint64 values, double largest)
{
    return QString("%1 of %2 values clipped, largest %3 dB above full scale. "
                   "Lower the level to keep the signal undistorted.")
        .arg(clipped)
        .arg(values)
        .arg(20 * std::log10(std::max(largest, 1.0)), 0, 'f', 2);
}

QString plainLine(const ReportLine &line)
{
    QString text = line.kind == ReportLine::Kind::Row ? line.text + ' ' + line.value : line.text;
    return text.replace('\t', ' ').remove('\n').trimmed();
}

QString stripBraces(const QString &text)
{
    // The character after it may be the line break of a text of several lines.
    static const QRegularExpression braces("[\\{\\}].",
                                           QRegularExpression::DotMatchesEverythingOption);
    return QString(text).remove(braces);
}

QString tagText(const QString &tag, const QString &text)
{
    QString kept = stripBraces(text);
    if (kept.size() < text.size()) {
        Tracer::Trace(Tracer::Warning,
                      QString("The %1 loses %2 characters: a brace can't stand in a tag and goes "
                              "with the character behind it.")
                          .arg(tag)
                          .arg(text.size() - kept.size()));
    }
    if (kept.size() > MaxTagText) {
        Tracer::Trace(Tracer::Warning,
                      QString("The %1 has %2 characters; the file takes the first %3.")
                          .arg(tag)
                          .arg(kept.size())
                          .arg(MaxTagText));
        kept.truncate(MaxTagText);
    }
    const auto canStand = [](QChar character) {
        return character >= QChar(' ') && character < QChar('}');
    };
    const auto *const problem = std::find_if_not(kept.cbegin(), kept.cend(), canStand);
    if (problem != kept.cend()) {
        Tracer::Trace(Tracer::Warning,
                      QString("The %1 will not read back as it was given: its character %2 "
                              "(U+%3) is none that the tags of a waveform file can hold.")
                          .arg(tag)
                          .arg(problem - kept.cbegin() + 1)
                          .arg(QString::number(problem->unicode(), 16).toUpper(), 4, '0'));
    }
    return kept;
}

double offsetDb(double level)
{
    return writtenDb(20 * std::log10(1 / (level + 1e-12)));
}

double writtenDb(double offset)
{
    constexpr double HalfDigit = 5e-7;
    return std::fabs(offset) < HalfDigit ? 0.0 : offset;
}
