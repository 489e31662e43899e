// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/RunLengthDevice.h"
#include "streams/TempStream.h"
#include "wvfile/SampleDevice.h"
#include "wvfile/WvTypes.h"

#include <QString>

class ToolJob;

/// A waveform that a job has read: its record and its streams, whose files vanish with it.
class SourceWaveform
{
public:
    /// Reads the file under the step label "Reading Waveform...". The marker stream is completed to
    /// one byte for each sample. The reason of a failure has been logged.
    ///
    /// Samples that aren't unpacked are decoded whenever data() is read, which takes no room on the
    /// disk; the file must stay as it is meanwhile, and data() can't be written.
    [[nodiscard]] bool read(ToolJob &job, const QString &fileName,
                            SampleReading reading = SampleReading::Unpacked);

    [[nodiscard]] const WvFileInfo &info() const { return m_info; }
    [[nodiscard]] BufferedIO *data()
    {
        return m_info.reading == SampleReading::Unpacked ? m_data.stream() : &m_decoded;
    }
    [[nodiscard]] BufferedIO *markers() { return &m_markers; }

    /// The unknown tags, for a result with the same length and clock; null if there are none.
    /// Tags that the writer writes by itself aren't among them.
    [[nodiscard]] BufferedIO *tags() { return m_hasTags ? m_tags.stream() : nullptr; }

    /// For a result with another length or clock, to which unknown tags may no longer apply: says
    /// once that they don't come along.
    void dropTags();

    /// Says which known tags of the source no result carries on.
    void tellDroppedTags() const;

    /// A write job with the clock, count, comment, copyright and type of the source; the offsets
    /// are those measured.
    [[nodiscard]] WvWriteJob writeJob() const;

private:
    [[nodiscard]] bool filterTags(TempStream &unknownTags);

    /// For what is read from a file or from memory, which needs no large buffers.
    static constexpr int SmallBuffer = 1024 * 1024;

    TempStream m_data;
    SampleDevice m_samples;
    BufferedIO m_decoded{SmallBuffer}; // destroyed before its device, as those below
    RunLengthDevice m_markerBytes;
    BufferedIO m_markers{SmallBuffer};
    TempStream m_tags;
    bool m_hasTags = false;
    WvFileInfo m_info;
};
