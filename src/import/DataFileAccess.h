// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ReadControl.h"
#include "importdata.h"

#include "streams/levels.h"
#include "wvfile/SampleCoding.h"
#include "wvfile/WvTypes.h"

#include <functional>
#include <optional>
#include <span>
#include <string_view>

class BufferedIO;
class QIODevice;

/// Reads samples that stand as text or as raw numbers in one or two files, into a sample stream.
class DataFileAccess : public ReadControl
{
    Q_OBJECT

public:
    explicit DataFileAccess(QObject *parent = nullptr);

    /// Reads the samples, at most `limit` of them if that is above 0, scales or clips them as the
    /// job asks, and fills samples, levels, comment and copyright of the result. The stream stands
    /// at its start then. On failure the stream is to be thrown away.
    [[nodiscard]] bool importData(const WvImportJob &job, WvWriteJob *result, BufferedIO *data,
                                  qint64 limit);

    /// As above, for files that are open already; `second` may be null.
    [[nodiscard]] bool importDevices(const WvImportJob &job, QIODevice &first, QIODevice *second,
                                     WvWriteJob *result, BufferedIO *data, qint64 limit);

    /// Clock that the text names, in Hz.
    [[nodiscard]] std::optional<double> clockHz() const { return m_clockHz; }

    /// Values that were clipped.
    [[nodiscard]] const ClipCount &clipped() const { return m_clipped; }

private:
    [[nodiscard]] bool readText(const WvImportJob &job, QIODevice &first, QIODevice *second,
                                BufferedIO &data, qint64 limit);
    [[nodiscard]] bool addSecondText(const ValueFormat &format, QIODevice &second, BufferedIO &data,
                                     qint64 limit);
    [[nodiscard]] bool readLines(const ValueFormat &format, QIODevice &device, size_t columns,
                                 qint64 limit, qint64 &count,
                                 const std::function<bool(std::span<float>)> &take);
    [[nodiscard]] bool takeTagLine(std::string_view line, qint64 lineNumber);
    [[nodiscard]] bool readBinary(const WvImportJob &job, QIODevice &first, QIODevice *second,
                                  BufferedIO &data, qint64 limit);
    [[nodiscard]] bool finish(const WvImportJob &job, WvWriteJob &result, BufferedIO &data);
    [[nodiscard]] bool scale(ImportScaling scaling, double peak, BufferedIO &data);

    qint64 m_samples = 0;
    QString m_comment;
    QString m_copyright;
    std::optional<double> m_clockHz;
    ClipCount m_clipped;
    LevelSums m_sums; ///< of what was written
};
