// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "WvTypes.h"

#include <QObject>
#include <QString>

#include <atomic>

class BufferedIO;

/// One file job on a .wv waveform file: reading it into sample streams, writing it from them, or
/// scanning its tags.
///
/// An object serves one call at a time, in the thread that owns the streams. Calls are synchronous;
/// every 100 ms they report their progress and let the event loop run, which is how cancel() comes
/// through. Every failure is logged where it is seen, and the call returns false.
class HvFileIO : public QObject
{
    Q_OBJECT

public:
    explicit HvFileIO(QObject *parent = nullptr);

    /// Unpacks a file into the streams of `info`: the samples into the data stream, the marker
    /// lists into the marker stream, and unknown tags, if wanted, into the tags stream; measures
    /// RMS and peak on the way. On success both streams stand at their start, with info->samples
    /// records and at least info->controlLength marker bytes; on failure the record and the
    /// streams are partly filled and to be discarded.
    [[nodiscard]] bool readWaveform(WvFileInfo *info);

    /// Writes a file from lists in memory or from a data stream, with markers from a list or from a
    /// marker stream, and the text of a tags stream. Each stream may be null. Samples beyond full
    /// scale are clipped and counted in the record. A file that stands is replaced
    /// once the new one is complete; after a failure or a cancel everything is as it was.
    [[nodiscard]] bool writeWaveform(WvWriteJob &job, const QString &fileName,
                                     BufferedIO *dataStream, BufferedIO *markerStream,
                                     BufferedIO *tagsStream);

    /// Reads all tags of a file without touching its samples.
    [[nodiscard]] bool readWaveformInfo(const QString &fileName, WvFileSummary *summary);

public slots:
    /// Requests the end of the running read or write.
    void cancel();

signals:
    /// Progress of the running job, 0 to 100.
    void ProgressUpdate(int iPercentage);

private:
    std::atomic<bool> m_abort{false};
};
