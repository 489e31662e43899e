// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"

#include "dsp/wraparound.h"
#include "streams/levels.h"

struct WrapSettings
{
    static constexpr int MinRange = 8;
    static constexpr int MaxRange = 512;

    qint64 start = 0;               ///< first sample used, counted from 0
    std::optional<qint64> end;      ///< sample behind the last one used; nothing: the last sample
    std::optional<double> cutoffHz; ///< one-sided; nothing: a quarter of the clock
    int range = 10;                 ///< samples that are changed on each side

    /// The sample behind the last one used, in a waveform of so many samples.
    [[nodiscard]] qint64 endOf(qint64 samples) const { return end.value_or(samples - 1); }
};

/// Why a waveform of so many samples and this clock (Hz) can't be corrected so; empty if it can.
[[nodiscard]] QString wrapProblem(const WrapSettings &settings, qint64 samples, double clockHz);

/// Reads the joint of the loop that the settings cut out of a data stream. Nothing, with the reason
/// logged, if the stream fails. The settings have no wrapProblem.
[[nodiscard]] std::optional<Joint> readJoint(BufferedIO &data, const WrapSettings &settings,
                                             qint64 samples);

struct WrapRequest
{
    QString inputFile;
    OutputOptions output;
    WrapSettings settings;
    std::optional<double> clockHz; ///< of the file written; nothing: that of the source
};

/// Removes the step that a waveform makes where its end meets its start in a loop. The output
/// begins with the corrected head and ends with the corrected tail; markers come along.
class WrapJob : public EditJob
{
    Q_OBJECT

public:
    explicit WrapJob(WrapRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;
    [[nodiscard]] bool build(const Joint &joint);
    [[nodiscard]] bool writeCorrected(std::span<const std::complex<double>> samples);
    [[nodiscard]] bool copyBody(qint64 samples);
    [[nodiscard]] bool copyMarkers(qint64 count);
    void reportRow(const QString &label, double decibels);

    WrapRequest m_request;
    TempStream m_data;
    TempStream m_markers;
    LevelSums m_levels;
};
