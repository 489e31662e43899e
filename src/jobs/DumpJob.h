// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SampleReadJob.h"

#include <functional>
#include <span>

enum class DumpFormat {
    Csv,  ///< header line, then sample number, I, Q and marker byte in a line each
    Cf32, ///< interleaved 32-bit floats, little-endian
    Ci16, ///< interleaved 16-bit integers as the writer codes them, little-endian
};

/// The first line of the CSV form.
inline constexpr char CsvHeading[] = "sample,i,q,markers\n";

/// Samples in one of the forms; `begin` is the number of the first one.
[[nodiscard]] QByteArray encodeSamples(DumpFormat format, qint64 begin,
                                       std::span<const float> values,
                                       std::span<const char> markers);

/// Writes out a range of samples.
class DumpJob : public SampleReadJob
{
    Q_OBJECT

public:
    /// Takes each block of the output; false ends the job, with the reason logged by the taker.
    using Sink = std::function<bool(const QByteArray &)>;

    DumpJob(SampleRange range, DumpFormat format, Sink sink, QObject *parent = nullptr);

    /// What puts the dump in its place once all samples have gone to the sink, and the work was not
    /// cancelled; false, with the reason logged, fails the job.
    void setFinish(std::function<bool()> finish) { m_finish = std::move(finish); }

protected:
    [[nodiscard]] bool process(SourceWaveform &source, qint64 begin, qint64 count) override;

private:
    DumpFormat m_format;
    Sink m_sink;
    std::function<bool()> m_finish;
};
