// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWaveform.h"
#include "ToolJob.h"

/// Reads a waveform for a tool that then works on its streams for longer, such as the viewer.
class LoadJob : public ToolJob
{
    Q_OBJECT

public:
    /// `target` outlives the job.
    LoadJob(QString fileName, SourceWaveform &target, QObject *parent = nullptr);

private:
    [[nodiscard]] bool work() override;

    QString m_fileName;
    SourceWaveform &m_target;
};
