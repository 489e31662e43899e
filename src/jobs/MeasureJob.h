// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SampleReadJob.h"

/// Levels of a range of samples.
struct LevelMeasurement
{
    qint64 samples = 0;
    double peakOffset = 0; ///< dB below full scale
    double rmsOffset = 0;  ///< dB below full scale

    [[nodiscard]] double crest() const { return rmsOffset - peakOffset; }
};

/// Measures peak and RMS of a range of samples.
class MeasureJob : public SampleReadJob
{
    Q_OBJECT

public:
    using SampleReadJob::SampleReadJob;

    /// Valid after the job has finished.
    [[nodiscard]] const LevelMeasurement &result() const { return m_result; }

protected:
    [[nodiscard]] bool process(SourceWaveform &source, qint64 begin, qint64 count) override;

private:
    LevelMeasurement m_result;
};
