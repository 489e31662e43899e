// SPDX-License-Identifier: Apache-2.0
#include "EngineeringNumber.h"

#include <QRegularExpression>

#include <cmath>

namespace {

struct Scale
{
    const char *prefix;
    double factor;
};

/// The prefix for a magnitude and the factor that brings the value to it.
Scale scaleOf(double magnitude, const NumberFormat &format)
{
    if (!format.scaled) {
        return {"", 1.0};
    }
    if (format.lowerPrefix) {
        if (magnitude < 1e-12) {
            // The factor is that of pico: established display of values below one pico-unit.
            return {"f", 1e12};
        }
        if (magnitude < 1e-9) {
            return {"p", 1e12};
        }
        if (magnitude < 1e-6) {
            return {"n", 1e9};
        }
        if (magnitude < 1e-3) {
            return {"u", 1e6};
        }
        if (magnitude < 1) {
            return {"m", 1e3};
        }
    }
    if (magnitude < 1e3) {
        return {"", 1.0};
    }
    if (magnitude < 1e6) {
        return {"k", 1e-3};
    }
    if (magnitude < 1e9) {
        return {"M", 1e-6};
    }
    return {"G", 1e-9};
}

/// Dividing by 1e3 and multiplying by 1e-3 round differently; the shown digits follow the division.
double scaledValue(double value, double factor)
{
    return factor < 1 ? value / std::round(1 / factor) : value * factor;
}

/// Index of the digit whose weight is 10^exponent in a plain decimal text, -1 if it isn't there.
int digitPosition(const QString &number, int exponent)
{
    const int point = static_cast<int>(number.indexOf('.'));
    const int unitsEnd = point < 0 ? static_cast<int>(number.size()) : point;
    const int position = exponent >= 0 ? unitsEnd - 1 - exponent : unitsEnd - exponent;
    if (position < 0 || position >= number.size() || !number.at(position).isDigit()) {
        return -1;
    }
    return position;
}

} // namespace

FormattedNumber formatNumber(double value, const NumberFormat &format, double step)
{
    const int digits = format.precision > 0 ? format.precision : 6;
    const double magnitude = std::fabs(value);
    FormattedNumber result;
    Scale scale{"", 1.0};
    QString number;
    if (format.scaled && format.lowerPrefix && magnitude < 1e-18) {
        number = "0";
    } else {
        scale = scaleOf(magnitude, format);
        number = QString("%1").arg(scaledValue(value, scale.factor), 0, 'f', digits);
        if (number.contains('.')) {
            while (number.size() > 1 && number.endsWith('0')) {
                number.chop(1);
            }
            if (number.endsWith('.')) {
                number.chop(1);
            }
        }
    }
    if (number == "-0") {
        number = "0";
    }
    if (step > 0) {
        const double shown = scaledValue(step, scale.factor);
        // The tiny amount keeps a step of exactly one decade from falling below it by rounding.
        result.stepPosition =
            digitPosition(number, static_cast<int>(std::floor(std::log10(shown) + 1e-9)));
    }
    result.text = QString(number + ' ' + scale.prefix + format.unit).simplified();
    return result;
}

QString formatNumber(double value, const NumberFormat &format)
{
    return formatNumber(value, format, 0).text;
}

QString engineeringText(double value, const QString &unit)
{
    return formatNumber(value, NumberFormat{.unit = unit});
}

std::optional<ParsedNumber> parseNumber(const QString &text, const QString &unit, bool lowerPrefix)
{
    QString rest = text.simplified();
    if (rest.isEmpty()) {
        return std::nullopt;
    }
    if (!unit.isEmpty() && rest.endsWith(unit, Qt::CaseInsensitive)) {
        rest.chop(unit.size());
    }
    static const QRegularExpression prefixLetters("[TGMKUNPF]",
                                                  QRegularExpression::CaseInsensitiveOption);
    const qsizetype split = rest.indexOf(prefixLetters);
    QString number = split < 0 ? rest : rest.left(split);
    number.remove(' ');
    number.replace(',', '.');
    if (number.isEmpty()) {
        return std::nullopt;
    }
    bool valid = false;
    ParsedNumber result;
    result.value = number.toDouble(&valid);
    if (!valid || !std::isfinite(result.value)) {
        return std::nullopt;
    }
    if (split < 0) {
        return result;
    }
    const QChar letter = lowerPrefix ? rest.at(split) : rest.at(split).toUpper();
    result.trailing = rest.mid(split + 1).simplified();
    switch (letter.toLatin1()) {
    case 'T':
    case 't':
        result.value *= 1e12;
        break;
    case 'G':
    case 'g':
        result.value *= 1e9;
        break;
    case 'M':
        result.value *= 1e6;
        break;
    case 'K':
    case 'k':
        result.value *= 1e3;
        break;
    case 'm':
        result.value *= 1e-3;
        break;
    case 'u':
        result.value *= 1e-6;
        break;
    case 'n':
        result.value *= 1e-9;
        break;
    case 'p':
        result.value *= 1e-12;
        break;
    case 'f':
        result.value *= 1e-15;
        break;
    default:
        // An upper-case U, N, P or F is no prefix of the field; the number stands as it is.
        break;
    }
    return result;
}
