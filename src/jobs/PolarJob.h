// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"

#include "dsp/Resample.h"

struct PolarRequest
{
    QString inputFile;
    OutputOptions phase;     ///< the file of unit vectors
    OutputOptions amplitude; ///< the file of magnitudes; its own name, the same texts as usual
    double offset = 0;       ///< of the amplitude, -1 to 1
    double gain = 1;         ///< of the amplitude, -1 to 1
    std::optional<double> clockHz; ///< of the files written; nothing: that of the source

    /// Why amplitudes would leave full scale with this offset and gain; empty if they don't.
    [[nodiscard]] QString levelProblem() const;
};

/// Splits a waveform into one of constant envelope and one of its magnitude, for instruments with
/// separate phase and amplitude paths. Both carry the markers of the source and the levels that
/// their samples have.
class PolarJob : public EditJob
{
    Q_OBJECT

public:
    explicit PolarJob(PolarRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] QString refusal() const override;
    [[nodiscard]] bool edit() override;
    [[nodiscard]] bool split(PolarLevels &levels);
    [[nodiscard]] bool save(WaveformOutput &file, BufferedIO &data, const LevelSums &levels,
                            const QString &part);

    PolarRequest m_request;
    WaveformOutput m_amplitudeOutput;
    TempStream m_phase;
    TempStream m_amplitude;
};
