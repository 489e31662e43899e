// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"

/// Where a resampled waveform is to end up: one of the two decides, the other follows.
struct ResampleTarget
{
    static constexpr double MinClockHz = 1000;
    static constexpr double MaxClockHz = ::MaxClockHz;
    static constexpr qint64 MaxSamples = 268435456;

    bool clockDecides = true;
    double clockHz = 100e6;
    qint64 samples = 1;

    /// Fills the field that follows, for a source of this clock and length.
    void follow(double sourceClockHz, qint64 sourceSamples);

    /// Why a waveform can't be made so; empty if it can.
    [[nodiscard]] QString problem() const;
};

struct ResampleRequest
{
    QString inputFile;
    OutputOptions output;
    ResampleTarget target;
};

/// Converts a waveform to another clock or number of samples, at the same peak level. The waveform
/// counts as a loop, and its markers follow. Unknown tags don't come along.
class ResampleJob : public EditJob
{
    Q_OBJECT

public:
    explicit ResampleJob(ResampleRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;
    [[nodiscard]] bool convert();
    [[nodiscard]] bool rescale();
    [[nodiscard]] bool save();

    ResampleRequest m_request;
    TempStream m_data;
    TempStream m_markers;
    double m_runPeakOffset = 0; ///< dB, of the converted samples before they are rescaled
    double m_runRmsOffset = 0;  ///< dB
};
