// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>

#include <functional>

class SigmfMarks;
class SourceWaveform;

/// What the data file beside the metadata is.
struct SigmfData
{
    QByteArray datatype; ///< as the standard names it
    QByteArray sha512;   ///< of all its bytes, in hexadecimal digits
};

/// Writes the metadata of a SigMF recording by `write`, whose false ends the work. Clock, comment
/// and date of the source come into the fields of the standard, a stretch of a marker becomes an
/// annotation; what the standard has no field for comes into those of the namespace "corvane". The
/// level tags apply to the whole of the source alone.
[[nodiscard]] bool writeSigmfMeta(SourceWaveform &source, const SigmfData &data, bool isWhole,
                                  const SigmfMarks &marks,
                                  const std::function<bool(const QByteArray &)> &write);
