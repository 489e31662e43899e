// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ImportJob.h"

struct Capture;

/// Writes what an analyzer has recorded to a waveform file.
class CaptureSaveJob final : public ToolJob
{
    Q_OBJECT

public:
    /// The capture isn't owned; with ImportScaling::Auto its samples are scaled in place, so that
    /// their peak is 1, and back again for another run. ImportScaling::Down writes them as they
    /// are, like ImportScaling::None. The clock is that of the waveform, Hz.
    CaptureSaveJob(Capture &capture, OutputOptions output, double clockHz, ImportScaling scaling,
                   QObject *parent = nullptr);

protected:
    [[nodiscard]] bool work() override;

private:
    [[nodiscard]] bool scale();

    Capture &m_capture;
    double m_clockHz;
    ImportScaling m_scaling;
    WaveformOutput m_output;
};
