// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputOptions.h"
#include "ToolJob.h"
#include "WaveformOutput.h"

#include "import/importdata.h"
#include "view/IqSample.h"

#include <optional>

class TempStream;
struct LevelSums;

/// What becomes of imported samples.
struct ImportTarget
{
    static constexpr double MinClockHz = 1000;
    static constexpr double MaxClockHz = ::MaxClockHz;

    OutputOptions output;
    double clockHz = 100e6;
    ImportScaling scaling = ImportScaling::Down;
};

/// The road that the imports share: read the samples into a stream, measure, scale, save. A job can
/// make a preview instead, which reads the first samples and writes nothing.
class ImportJob : public ToolJob
{
    Q_OBJECT

public:
    explicit ImportJob(ImportTarget target, QObject *parent = nullptr);

    /// To be called before run(): makes a preview of this many samples, above 0.
    void setPreview(qint64 samples) { m_previewSamples = samples; }

    /// The preview, on the 16-bit grid and within the full scale of a file.
    [[nodiscard]] const IqList &preview() const { return m_preview; }

    /// Clock that the input has led to, in Hz.
    [[nodiscard]] double clockHz() const { return m_clockHz; }

protected:
    [[nodiscard]] const ImportTarget &target() const { return m_target; }
    [[nodiscard]] WaveformOutput &output() { return m_output; }

    /// Reads the input, at most `limit` samples if that is above 0, into the stream, which is
    /// empty, and reports the steps. Returns the number of samples; nothing, with the reason
    /// logged, on a failure.
    [[nodiscard]] virtual std::optional<qint64> readInput(TempStream &data, qint64 limit) = 0;

    /// Brings the samples to their final level, sets the levels of the output and reports them.
    [[nodiscard]] virtual bool scale(TempStream &data, qint64 samples);

    /// Markers and unknown tags that readInput() has found beside the samples; null without any.
    [[nodiscard]] virtual BufferedIO *foundMarkers() { return nullptr; }
    [[nodiscard]] virtual BufferedIO *unknownTags() { return nullptr; }

    /// The samples fit as they stand: only a scaling to full scale that was asked for is done.
    void keepLevelUnlessAuto();

    /// Reports what comes before the file is written.
    virtual void reportSaving();

    void setClock(double clockHz) { m_clockHz = clockHz; }

    /// Holds a sample rate of a file to the permitted clocks, with a warning.
    [[nodiscard]] static double permittedClock(double sampleRate);

private:
    [[nodiscard]] bool work() final;
    [[nodiscard]] bool measureClipped(TempStream &data, qint64 samples, LevelSums &sums);
    [[nodiscard]] bool collectPreview(TempStream &data, qint64 samples);

    ImportTarget m_target;
    WaveformOutput m_output;
    double m_clockHz;
    qint64 m_previewSamples = 0;
    IqList m_preview;
};
