// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputOptions.h"
#include "ToolJob.h"
#include "WaveformOutput.h"

class TempStream;

/// What happens to the level of imported samples.
enum class ImportScaling {
    None = 0, ///< stays; samples beyond full scale are clipped
    Down = 1, ///< scaled to full scale if the peak lies beyond it
    Auto = 2, ///< scaled to full scale
};

/// What becomes of imported samples.
struct ImportTarget
{
    static constexpr double MinClockHz = 1000;
    static constexpr double MaxClockHz = 600e6;

    OutputOptions output;
    double clockHz = 100e6;
    ImportScaling scaling = ImportScaling::Down;
};

/// The road that the imports share once their samples are in a stream: measure, scale, save.
class ImportJob : public ToolJob
{
    Q_OBJECT

public:
    explicit ImportJob(ImportTarget target, QObject *parent = nullptr);

protected:
    [[nodiscard]] const ImportTarget &target() const { return m_target; }

    /// Scales `samples` samples of the stream and writes the waveform with this clock, with the
    /// report lines.
    [[nodiscard]] bool scaleAndSave(TempStream &data, qint64 samples, double clockHz);

private:
    [[nodiscard]] bool scale(TempStream &data, int samples, double &peak, double &rms);

    ImportTarget m_target;
    WaveformOutput m_output;
};
