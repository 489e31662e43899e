// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputOptions.h"

#include "wvfile/SampleCoding.h"
#include "wvfile/WvTypes.h"

class ToolJob;

/// The waveform file that a job writes: its name, its record with the texts of the tags, the report
/// lines about it, and the writing itself. A job with several results has several of these.
class WaveformOutput
{
public:
    /// `job` outlives the output: it carries the report and is asked for cancels.
    WaveformOutput(ToolJob &job, OutputOptions options);

    [[nodiscard]] const QString &fileName() const { return m_options.fileName; }

    /// What is to be written. A job fills clock, sample count and level offsets; comment and
    /// copyright hold those of the source, if any, for the case that no others are wanted.
    [[nodiscard]] WvWriteJob &record() { return m_record; }

    /// Sets both clocks (Hz) and the sample count of the record.
    void setLength(double clockHz, qint64 samples);

    /// Sets the level offsets of the record from linear levels of full scale 1.
    void setLevels(double peak, double rms);

    /// The level offsets are what the user wants them to be, whatever the samples have.
    void keepLevelsAsStated() { m_levelsAsStated = true; }

    /// States a crest of 0 dB: the RMS offset is that of the peak.
    void stateZeroCrest();

    /// Reports the row with the file name.
    void reportFile();

    /// Reports the rows on samples and levels.
    void reportLevels();

    /// Reports the rows on file, clock, samples and levels.
    void reportWaveform();

    /// Adds values that were clipped before the file is written to those that save() tells of.
    void addClipped(const ClipCount &clipped) { m_clipped = clipped; }

    /// Writes the file as a step of this label. Tells in the report how many values lay beyond full
    /// scale; the level tags are then those of the samples as they were written. Tells, too, what
    /// happens at the loop point, with a warning of a step. False, with the
    /// reason logged, if it fails or the job is cancelled; a file that stood there is then left as
    /// it was.
    [[nodiscard]] bool save(const WvStreams &streams, const QString &stepLabel);

private:
    [[nodiscard]] bool write(const WvStreams &streams, const QString &stepLabel);
    [[nodiscard]] bool measureClipped(BufferedIO &data);
    void reportLoop();

    ToolJob &m_job;
    bool m_levelsAsStated = false;
    bool m_zeroCrest = false;
    OutputOptions m_options;
    WvWriteJob m_record;
    ClipCount m_clipped; ///< before the writing
};

/// The reason that jobs log when no file name was given.
[[nodiscard]] QString emptyFileNameText();
