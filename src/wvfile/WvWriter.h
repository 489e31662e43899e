// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "WvTypes.h"

#include <QByteArray>
#include <QString>

#include <functional>
#include <span>

class BufferedIO;
class OutputFile;
class ProgressClock;

/// Writes one waveform file. HvFileIO checks the job, opens the file and owns the signals; this
/// class knows the format alone.
class WvWriter
{
public:
    /// `report` gets progress in percent; everything outlives the writer.
    WvWriter(WvWriteJob &job, const WvStreams &streams, ProgressClock &progress,
             std::function<void(int)> report);

    /// Computes the level offsets of samples in memory, if wanted, and logs the statistics.
    void prepareLevels();

    /// Writes the whole file, without its last progress. Logs the reason and returns false on a
    /// failure.
    [[nodiscard]] bool write(OutputFile &file);

private:
    [[nodiscard]] static bool put(OutputFile &file, std::span<const char> bytes);
    [[nodiscard]] bool writeTags(OutputFile &file);
    [[nodiscard]] bool copyTagsStream(OutputFile &file);
    [[nodiscard]] bool writeMarkers(OutputFile &file);
    [[nodiscard]] bool writeMarkerList(OutputFile &file, int marker);
    [[nodiscard]] bool fetchMarkers(int begin, std::span<quint8> bytes);
    [[nodiscard]] bool writeSamples(OutputFile &file);
    [[nodiscard]] int fetchSamples(int begin, std::span<float> values);

    WvWriteJob &m_job;
    WvStreams m_streams;
    ProgressClock &m_progress;
    std::function<void(int)> m_report;
    bool m_markersFromMemory = false;
    bool m_markersFromStream = false;
};
