// SPDX-License-Identifier: Apache-2.0
#include "ReportText.h"

#include "base/EngineeringNumber.h"

#include <QRegularExpression>

#include <cmath>

namespace {

/// Two decimals; an offset that rounds to zero is shown without a sign.
QString decibelText(double value)
{
    const QString text = QString::asprintf("%4.2f", value);
    return (text == "-0.00" ? QString("0.00") : text) + " dB";
}

} // namespace

QString stepLine(const QString &text)
{
    return "\n<b>" + text + "</b>";
}

QString successLine(const QString &text)
{
    return "\n<font color=\"#00C000\"><b>" + text + "</b></font>";
}

QString failureLine(const QString &text)
{
    return "\n<font color=\"#C00000\"><b>" + text + "</b></font>";
}

QString fileLine(const QString &fileName)
{
    return " File:       \t" + fileName.toHtmlEscaped();
}

QStringList levelLines(const LevelReport &levels)
{
    return {
        QString(" Samples:    \t%1").arg(levels.samples, 0, 'f', 0),
        " Peak Offset:\t" + decibelText(levels.peakOffset),
        " Peak/RMS:   \t" + decibelText(levels.rmsOffset - levels.peakOffset),
    };
}

QStringList sourceLines(const QString &fileName, double clockHz, const LevelReport &levels)
{
    return QStringList{fileLine(fileName), " Clock Rate: \t" + engineeringText(clockHz, "Hz")} +
           levelLines(levels);
}

QString plainLine(const QString &html)
{
    static const QRegularExpression markup("<[^>]*>");
    QString text = html;
    text.remove(markup);
    text.replace("&lt;", "<").replace("&gt;", ">").replace("&quot;", "\"").replace("&nbsp;", " ");
    text.replace("&amp;", "&");
    return text.replace('\t', ' ').remove('\n').trimmed();
}

QString stripBraces(const QString &text)
{
    static const QRegularExpression braces("[\\{\\}].");
    return QString(text).remove(braces);
}

double offsetDb(double level)
{
    return 20 * std::log10(1 / (level + 1e-12));
}
