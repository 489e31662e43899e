// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/TempStream.h"
#include "wvfile/WvTypes.h"

#include <QString>

class ToolJob;

/// A waveform that a job has read: its record and its streams, whose files vanish with it.
class SourceWaveform
{
public:
    /// Reads the file under the step label "Reading Waveform...". The marker stream is completed to
    /// one byte for each sample. The reason of a failure has been logged.
    [[nodiscard]] bool read(ToolJob &job, const QString &fileName);

    [[nodiscard]] const WvFileInfo &info() const { return m_info; }
    [[nodiscard]] BufferedIO *data() { return m_data.stream(); }
    [[nodiscard]] BufferedIO *markers() { return m_markers.stream(); }

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

    TempStream m_data;
    TempStream m_markers;
    TempStream m_tags;
    bool m_hasTags = false;
    WvFileInfo m_info;
};
