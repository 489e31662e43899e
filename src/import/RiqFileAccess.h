// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "FileAccess.h"

#include <QDateTime>
#include <QList>

class BufferedIO;

/// Consecutive blocks of equal parameters in a recording; the fields hold what the headers state.
struct RiqEntry
{
    bool valid = false;
    qint64 position = 0; ///< file offset of the first block
    qint32 magic = 0;
    qint16 versionFirst = 0;
    qint16 versionSecond = 0;
    qint16 attributeTag = 0;
    qint16 traceLength = 0;         ///< samples of the last block seen
    qint8 optionalHeaderLength = 0; ///< bytes
    qint32 selectorFlags = 0;
    bool littleEndian = false; ///< of optional headers and traces
    qint16 bytesPerSample = 0;
    qint32 sampleRate = 0;  ///< Hz
    double ifFrequency = 0; ///< Hz
    qint32 ifBandwidth = 0; ///< Hz
    qint64 count = 0;       ///< as stored; without a use here
    QDateTime timeStamp;    ///< local time, to the millisecond
    quint32 blocks = 0;
    qint64 samples = 0;

    [[nodiscard]] double playTime() const { return static_cast<double>(samples) / sampleRate; }
};

/// Reads recordings of network streams, blocks with headers of their own one after the other, into
/// sample streams.
class RiqFileAccess : public FileAccess
{
    Q_OBJECT

public:
    explicit RiqFileAccess(QObject *parent = nullptr);

    /// Walks through the headers of the open file. A block that the end of the file cuts is left
    /// out; any other fault makes the file unusable.
    [[nodiscard]] bool readDirectory();

    [[nodiscard]] const QList<RiqEntry> &entries() const { return m_entries; }

    /// An entry, counted from 0; a default one without a valid directory or outside of it.
    [[nodiscard]] RiqEntry entry(qsizetype index) const;

    /// Writes "IQF" and the samples of an entry, at most `limit` if that is above 0, into the
    /// stream.
    [[nodiscard]] bool readSamples(qsizetype index, BufferedIO *stream, qint64 limit);

protected:
    void forget() override;

private:
    [[nodiscard]] bool walk();
    void addBlock(const RiqEntry &block);

    QList<RiqEntry> m_entries;
    bool m_directoryValid = false;
};
