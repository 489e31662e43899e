// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <optional>

/// How a number is written with its unit: 1.5 kHz, 20 us, -3 dB.
struct NumberFormat
{
    QString unit;            ///< such as "Hz" or "s"; may be empty
    bool scaled = true;      ///< engineering prefixes are used at all
    bool lowerPrefix = true; ///< prefixes below 1 (m, u, n, p, f) are used too
    int precision = 6;       ///< digits behind the point before zeros go; 0 or less means 6
};

/// A formatted number together with the place of one digit in it.
struct FormattedNumber
{
    QString text;
    int stepPosition = -1; ///< index of the digit with the weight of the step, -1 if there is none
};

/// Writes a number with its prefix and unit; trailing zeros go. With a step above 0 the result also
/// tells which digit of the text stands for it.
[[nodiscard]] FormattedNumber formatNumber(double value, const NumberFormat &format, double step);

/// As above, the text alone.
[[nodiscard]] QString formatNumber(double value, const NumberFormat &format);

/// Shorthand for reports: all prefixes, six digits.
[[nodiscard]] QString engineeringText(double value, const QString &unit = {});

/// A number read from text.
struct ParsedNumber
{
    double value = 0;
    QString trailing; ///< what stood behind the prefix letter and is no unit; ignored by fields
};

/// Reads "1.5 k", "1,5M", "10us", "2 MHz". The unit may be there or not; a comma is a point. With
/// `lowerPrefix` the case of M and m decides between mega and milli, without it both are mega.
/// Nothing when the text holds no number.
[[nodiscard]] std::optional<ParsedNumber> parseNumber(const QString &text, const QString &unit,
                                                      bool lowerPrefix);
