// SPDX-License-Identifier: Apache-2.0
#include "datavalues.h"

#include "log/Tracer.h"

#include <QtEndian>

#include <charconv>
#include <cmath>
#include <cstring>

namespace {

constexpr double Full8 = 127;
constexpr double Full14 = 8191;
constexpr double Full16 = 32767;
constexpr double Full32 = 2147483647;

bool isSeparator(char c)
{
    return c == ',' || c == ' ' || c == '\t' || c == ';' || c == ':';
}

/// The next part of a line, which is cut off it; empty if there is none.
std::string_view nextPart(std::string_view &line)
{
    size_t begin = 0;
    while (begin < line.size() && isSeparator(line[begin])) {
        ++begin;
    }
    size_t end = begin;
    while (end < line.size() && !isSeparator(line[end])) {
        ++end;
    }
    const std::string_view part = line.substr(begin, end - begin);
    line.remove_prefix(end);
    return part;
}

QString textOf(std::string_view text)
{
    return QString::fromLatin1(text.data(), static_cast<qsizetype>(text.size()));
}

/// A finite number that takes the whole text.
bool readReal(std::string_view text, double &value)
{
    if (text.size() > 1 && text[0] == '+' && text[1] != '-') {
        text.remove_prefix(1);
    }
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error == std::errc::result_out_of_range) {
        // Too small is 0 as in any other reader; too large is no number to go on with.
        long double wide = 0;
        const auto result = std::from_chars(text.data(), text.data() + text.size(), wide);
        value = static_cast<double>(wide);
        return result.ec == std::errc() && result.ptr == text.data() + text.size() &&
               std::isfinite(value);
    }
    return error == std::errc() && end == text.data() + text.size() && std::isfinite(value);
}

/// A hexadecimal number of `Word`; 0, logged, if the text is none.
template <typename Word>
Word readHex(std::string_view text)
{
    std::string_view digits = text;
    if (digits.size() > 1 && digits[0] == '0' && (digits[1] == 'x' || digits[1] == 'X')) {
        digits.remove_prefix(2);
    }
    Word word = 0;
    const auto [end, error] =
        std::from_chars(digits.data(), digits.data() + digits.size(), word, 16);
    if (error != std::errc() || end != digits.data() + digits.size()) {
        Tracer::Trace(Tracer::Error, QString("Invalid HEX data '%1'.").arg(textOf(text)));
        return 0;
    }
    return word;
}

bool unsupported(const QString &what)
{
    return Tracer::fail("Unsupported file format: " + what);
}

bool convertHex(std::string_view text, double &value, const ValueFormat &format)
{
    constexpr double Half = 0.5;
    if (format.precision == DataPrecision::Bits16) {
        const auto word = readHex<quint16>(text);
        value = format.isSigned ? (static_cast<qint16>(word) - Half) / Full16
                                : (word - Half) / Full16 - 1;
        return true;
    }
    if (format.precision == DataPrecision::Bits32) {
        const auto word = readHex<quint32>(text);
        value = format.isSigned ? (static_cast<qint32>(word) - Half) / Full32
                                : (word - Half) / Full32 - 1;
        return true;
    }
    return unsupported("hexadecimal text is read with 16 or 32 bits only.");
}

/// Full scale of an integer in a text; 0 if this width isn't read.
double integerFullScale(const ValueFormat &format)
{
    switch (format.precision) {
    case DataPrecision::Bits8:
        return Full8;
    case DataPrecision::Bits14:
        return format.isSigned ? 0 : Full14;
    case DataPrecision::Bits16:
        return Full16;
    case DataPrecision::Bits32:
        return Full32;
    default:
        return 0;
    }
}

bool convertText(std::string_view text, double &value, const ValueFormat &format, qint64 lineNumber)
{
    if (format.dataFormat == DataFormat::Hexadecimal) {
        return convertHex(text, value, format);
    }
    if (!readReal(text, value)) {
        return Tracer::fail(QString("Conversion error in line %1: '%2' is not a number.")
                                .arg(lineNumber)
                                .arg(textOf(text)));
    }
    if (format.dataFormat == DataFormat::Rational) {
        return true;
    }
    const double fullScale = integerFullScale(format);
    if (fullScale == 0) {
        return unsupported(format.precision == DataPrecision::Bits14
                               ? "integers of 14 bits are read unsigned from text only."
                               : "integers are read with 8, 14, 16 or 32 bits.");
    }
    constexpr double Half = 0.5;
    value = (value - Half) / fullScale - (format.isSigned ? 0 : 1);
    return true;
}

template <typename T, typename Convert>
void convertAll(std::span<std::byte> bytes, bool bigEndian, std::span<float> values,
                const Convert &convert)
{
    auto *words = reinterpret_cast<T *>(bytes.data());
    const auto count = static_cast<qsizetype>(values.size());
    if (bigEndian) {
        qFromBigEndian<T>(words, count, words);
    } else {
        qFromLittleEndian<T>(words, count, words);
    }
    for (size_t i = 0; i < values.size(); ++i) {
        values[i] = static_cast<float>(convert(words[i]));
    }
}

} // namespace

bool getValueFromLine(std::string_view line, int column, double *value, const ValueFormat &format,
                      qint64 lineNumber)
{
    if (line.empty() || column < 1 || !value) {
        return Tracer::fail("getValueFromLine() : Invalid input argument.");
    }
    std::string_view part;
    for (; column > 0; --column) {
        part = nextPart(line);
    }
    if (part.empty()) {
        return Tracer::fail("Column cannot be found in file.");
    }
    return convertText(part, *value, format, lineNumber);
}

bool getValuesFromLine(std::string_view line, std::span<double> values, const ValueFormat &format,
                       qint64 lineNumber)
{
    for (double &value : values) {
        const std::string_view part = nextPart(line);
        if (part.empty()) {
            return Tracer::fail("Column cannot be found in file.");
        }
        if (!convertText(part, value, format, lineNumber)) {
            return false;
        }
    }
    return true;
}

int binaryValueSize(DataPrecision precision)
{
    switch (precision) {
    case DataPrecision::Bits8:
        return 1;
    case DataPrecision::Bits14:
    case DataPrecision::Bits16:
        return 2;
    case DataPrecision::Bits32:
        return 4;
    default:
        return 0;
    }
}

bool isBinaryFormatKnown(const ValueFormat &format)
{
    if (format.dataFormat == DataFormat::Rational) {
        return format.precision == DataPrecision::Bits32;
    }
    return format.dataFormat == DataFormat::Integer && binaryValueSize(format.precision) > 0 &&
           !(format.precision == DataPrecision::Bits14 && format.isSigned);
}

void convertBinary(std::span<std::byte> bytes, const ValueFormat &format, std::span<float> values)
{
    const bool big = format.bigEndian;
    if (format.dataFormat == DataFormat::Rational) {
        return convertAll<float>(bytes, big, values, [](float x) { return x; });
    }
    switch (format.precision) {
    case DataPrecision::Bits8:
        if (format.isSigned) {
            // The divisor of 16 bits holds such samples near -1; files were made for that.
            return convertAll<qint8>(bytes, big, values, [](int x) { return x / 32768.5 - 1; });
        }
        return convertAll<quint8>(bytes, big, values, [](int x) { return x / 127.5 - 1; });
    case DataPrecision::Bits14:
        return convertAll<quint16>(bytes, big, values,
                                   [](int x) { return (x & 0x3FFF) / 8191.5 - 1; });
    case DataPrecision::Bits16:
        if (format.isSigned) {
            return convertAll<qint16>(bytes, big, values,
                                      [](int x) { return (x + 0.5) / 32767.5; });
        }
        return convertAll<quint16>(bytes, big, values, [](int x) { return x / 32768.5 - 1; });
    default:
        break;
    }
    if (format.isSigned) {
        return convertAll<qint32>(bytes, big, values,
                                  [](qint32 x) { return (x + 0.5) / 2147483647.5; });
    }
    return convertAll<quint32>(bytes, big, values, [](quint32 x) { return x / 2147483648.5 - 1; });
}
