// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "InstrumentJob.h"

/// Selects a waveform file of a generator, waits until it is loaded, and switches the ARB on.
class StartJob final : public InstrumentJob
{
    Q_OBJECT

public:
    static constexpr int DefaultSeconds = 100;

    /// `path` with "/" or as the instrument writes it; `seconds` is the longest wait.
    StartJob(InstrumentRef instrument, QString path, int seconds = DefaultSeconds,
             QObject *parent = nullptr);

protected:
    [[nodiscard]] bool talk(VisaDevice &device) override;

private:
    QString m_path;
    int m_seconds;
};
