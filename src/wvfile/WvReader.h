// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ByteSource.h"
#include "MarkerTrace.h"
#include "SampleCoding.h"
#include "WvTypes.h"

#include "base/SideWorker.h"
#include "streams/levels.h"

#include <QString>

#include <array>
#include <vector>

class ProgressClock;
class QIODevice;

/// Unpacks one waveform file into the streams of its record. HvFileIO opens the file and owns the
/// signals; this class knows the format alone, and so can read from memory too.
class WvReader
{
public:
    /// `info` and its streams are checked and cleared by the caller; all outlive the reader, which
    /// takes the device from its start.
    WvReader(WvFileInfo &info, QIODevice &device, ProgressClock &progress);

    /// Reads all of the device. Logs the reason and returns false on a failure.
    [[nodiscard]] bool read();

private:
    /// What became of one round of the tag loop.
    enum class Round { Tag, SampleBlock, Failed };

    [[nodiscard]] Round readTag(QString &name);
    [[nodiscard]] bool processTag(const QString &name);
    [[nodiscard]] bool processType();
    [[nodiscard]] bool processClock(const QString &text);
    [[nodiscard]] bool processSamples(const QString &text);
    [[nodiscard]] bool processLevels(const QString &text);
    [[nodiscard]] bool processControlLength(const QString &text);
    [[nodiscard]] bool keepUnknownTag(const QString &name);
    [[nodiscard]] bool openSampleBlock(const QString &name);
    [[nodiscard]] bool takeSampleCount(qint64 count);
    [[nodiscard]] bool finalizeMarkers();
    [[nodiscard]] bool readSamples();
    [[nodiscard]] bool readBlocks();
    [[nodiscard]] bool storeBlock(qint64 begin, std::span<const float> values);
    [[nodiscard]] SampleCoding coding() const;
    [[nodiscard]] bool measures() const
    {
        return m_info.reading == SampleReading::Unpacked ||
               m_info.reading == SampleReading::Measured;
    }

    WvFileInfo &m_info;
    ProgressClock &m_progress;
    ByteSource m_source;
    qint64 m_fileLimit = 0; ///< largest position that a marker list may name
    MarkerTrace m_markers;
    bool m_sixteenBit = true;
    qint64 m_statedSamples = 0; ///< by the SAMPLES tag
    LevelSums m_levels;
    std::array<std::vector<float>, 2> m_values; ///< one is measured while the other is filled
    SideWorker m_measuring;                     // last: its work uses the others
};
