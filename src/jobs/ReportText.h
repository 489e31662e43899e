// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ReportLine.h"

#include <QString>

struct WvWriteJob;

/// The lines that the tools' reports share, and the arithmetic behind them.

/// The name of a file as a row.
[[nodiscard]] ReportLine fileRow(const QString &fileName);

/// Rows on samples, peak offset and peak/RMS of a waveform.
[[nodiscard]] ReportLines levelRows(const WvWriteJob &waveform);

/// File, clock, and the rows of levelRows: what a tool says of a file that it reads or writes.
[[nodiscard]] ReportLines waveformRows(const QString &fileName, const WvWriteJob &waveform);

/// That so many of `values` values were clipped; `largest` is their largest magnitude, of full
/// scale 1.
[[nodiscard]] QString clippingText(qint64 clipped, qint64 values, double largest);

/// A report line for a terminal.
[[nodiscard]] QString plainLine(const ReportLine &line);

/// Removes each brace with the character after it, so that a text can't break a file's tags.
[[nodiscard]] QString stripBraces(const QString &text);

/// Characters of a tag; what is longer the reader refuses, and the whole file with it.
inline constexpr qsizetype MaxTagText = 1024;

/// The text for a comment or copyright tag, without braces. Warns, naming the tag, of characters
/// that the file can't give back: tags are read as ASCII from the blank to the closing brace.
[[nodiscard]] QString tagText(const QString &tag, const QString &text);

/// The offset in dB below full scale of a linear level; silence gives 240 dB.
[[nodiscard]] double offsetDb(double level);

/// An offset in dB as a tag shows it: what would come out as -0.000000 is 0.
[[nodiscard]] double writtenDb(double offset);
