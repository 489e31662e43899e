// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWaveform.h"
#include "ToolJob.h"
#include "WaveformOutput.h"

#include <optional>

/// The road of the tools that make one waveform out of another: source, work, output. Reads the
/// source; the derived job works on it in edit() and saves its output there.
class EditJob : public ToolJob
{
    Q_OBJECT

public:
    /// How the reading shows in the report: not at all, or by a headline.
    enum class Reading { Quiet, Reported };

    EditJob(const QString &inputFile, OutputOptions output, Reading reading,
            QObject *parent = nullptr);

    /// Works on a waveform that a dialog has read already, instead of reading the file again. It
    /// isn't changed and outlives the job; its streams may stand anywhere.
    void useSource(SourceWaveform &loaded) { m_loaded = &loaded; }

protected:
    /// Why the request can't be met whatever the source holds, such as an empty output name; empty
    /// if it may. Asked before the source is read.
    [[nodiscard]] virtual QString refusal() const;

    /// Makes and saves the result. The request has not been refused; the source has been read;
    /// the record of the output holds what the source says: type, clock, sample count, measured
    /// levels, comment, copyright.
    [[nodiscard]] virtual bool edit() = 0;

    /// How far the source is to be read; without its levels the record of the output has none
    /// either.
    [[nodiscard]] virtual SampleReading wantedReading() const { return SampleReading::Measured; }

    [[nodiscard]] SourceWaveform &source() { return m_loaded ? *m_loaded : m_source; }
    [[nodiscard]] WaveformOutput &output() { return m_output; }
    [[nodiscard]] const QString &inputFile() const { return m_inputFile; }

    /// Reports file, clock, samples and levels of the source.
    void reportSource();

    /// Brings `samples` samples of a stream to the peak level of the source, as a step
    /// "Rescaling...", and sets the level offsets of the output. The arguments are the offsets (dB)
    /// that the stream has now.
    [[nodiscard]] bool rescaleToSourcePeak(BufferedIO &data, int samples, double peakOffset,
                                           double rmsOffset);

    /// The clock (Hz) for the file to be written: the one wanted, else that of the source. Nothing,
    /// with the reason logged, if neither is stated.
    [[nodiscard]] std::optional<double> clockOr(std::optional<double> wantedHz);

private:
    [[nodiscard]] bool work() final;
    [[nodiscard]] bool read();
    [[nodiscard]] SampleReading sampleReading() const;

    QString m_inputFile;
    Reading m_reading;
    SourceWaveform m_source;
    SourceWaveform *m_loaded = nullptr;
    WaveformOutput m_output;
};
