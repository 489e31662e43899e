// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ToolJob.h"

#include "streams/looppoint.h"

/// What the samples of a waveform file say, beside its tags.
struct SampleCheck
{
    bool isComplete = false; ///< as many samples as the tags say
    qint64 samples = 0;      ///< those that are there; without any there are no figures
    double peakOffset = 0;   ///< measured, dB below full scale
    double rmsOffset = 0;    ///< likewise
    qint64 clipped = 0;      ///< values, I and Q each, at full scale
    LoopPoint loop;
};

/// Reads the samples of a file, which may be cut off, and measures them.
class CheckJob : public ToolJob
{
    Q_OBJECT

public:
    explicit CheckJob(const QString &fileName, QObject *parent = nullptr);

    /// Valid after the job has finished.
    [[nodiscard]] const SampleCheck &result() const { return m_result; }

private:
    [[nodiscard]] bool work() override;

    QString m_fileName;
    SampleCheck m_result;
};
