// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>
#include <QStringList>

/// The lines that the tools' reports share, and the arithmetic behind them.

/// Level facts of one file, as a report shows them.
struct LevelReport
{
    double samples = 0;
    double peakOffset = 0; ///< dB
    double rmsOffset = 0;  ///< dB
};

/// A headline of a step, such as "\n<b>Saving</b>".
[[nodiscard]] QString stepLine(const QString &text);

/// The green line of a tool that has done its work.
[[nodiscard]] QString successLine(const QString &text);

/// The red line of a tool that has stopped.
[[nodiscard]] QString failureLine(const QString &text);

/// " File:       \t" and the name, escaped.
[[nodiscard]] QString fileLine(const QString &fileName);

/// Samples, peak offset and peak/RMS, a line each.
[[nodiscard]] QStringList levelLines(const LevelReport &levels);

/// File, clock, and the lines of levelLines: what a tool says of the file that it has read.
[[nodiscard]] QStringList sourceLines(const QString &fileName, double clockHz,
                                      const LevelReport &levels);

/// A report line without its markup, for a terminal.
[[nodiscard]] QString plainLine(const QString &html);

/// Removes each brace with the character behind it, so that a text can't break a file's tags.
[[nodiscard]] QString stripBraces(const QString &text);

/// The text for a comment or copyright tag, without braces. Warns, naming the tag, of characters
/// that the file can't give back: tags are read as ASCII from the blank to the closing brace.
[[nodiscard]] QString tagText(const QString &tag, const QString &text);

/// The offset in dB below full scale of a linear level; silence gives 240 dB.
[[nodiscard]] double offsetDb(double level);

/// An offset in dB as a tag shows it: what would come out as -0.000000 is 0.
[[nodiscard]] double writtenDb(double offset);
