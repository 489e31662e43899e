// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "importdata.h"

#include <QByteArray>

#include <cstddef>
#include <span>
#include <string_view>

/// Reads one number of a text line and converts it. `column` counts from 1; parts are separated by
/// comma, colon, semicolon, tab and blank, and empty ones don't count. False with the reason logged
/// if there is no such part or it is no number; a hexadecimal number that is none is logged, and
/// gives the value of 0. `lineNumber` is that of the message.
[[nodiscard]] bool getValueFromLine(std::string_view line, int column, double *value,
                                    const ValueFormat &format, qint64 lineNumber);

/// Reads the first `values.size()` numbers of a line as getValueFromLine() does, in one go.
[[nodiscard]] bool getValuesFromLine(std::string_view line, std::span<double> values,
                                     const ValueFormat &format, qint64 lineNumber);

/// Bytes of a number in a binary file; 0 if this width isn't read from one.
[[nodiscard]] int binaryValueSize(DataPrecision precision);

/// Whether numbers of this kind are read from binary files.
[[nodiscard]] bool isBinaryFormatKnown(const ValueFormat &format);

/// Converts numbers of a binary file. `bytes` holds binaryValueSize() bytes for each value, and
/// changes to the byte order of the machine.
void convertBinary(std::span<std::byte> bytes, const ValueFormat &format, std::span<float> values);
