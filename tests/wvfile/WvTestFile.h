// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TestDevice.h"

#include "log/CapturedLog.h"
#include "streams/BufferedIO.h"
#include "wvfile/HvFileIO.h"
#include "wvfile/WvTypes.h"

#include <QByteArray>
#include <QFile>
#include <QList>
#include <QTemporaryDir>

#include <cstring>

/// Bytes of a sample block with these words, I and Q in turn.
inline QByteArray wordBytes(const QList<int> &words)
{
    QByteArray bytes;
    for (const int word : words) {
        bytes += static_cast<char>(word & 0xFF);
        bytes += static_cast<char>(word >> 8 & 0xFF);
    }
    return bytes;
}

/// The sample block as this program writes it.
inline QByteArray sampleBlock(const QList<int> &words)
{
    return "{WAVEFORM-" + QByteArray::number(2 * words.size() + 1) + ": #" + wordBytes(words) + '}';
}

/// The block of `count` samples 0.
inline QByteArray silentBlock(qint64 count)
{
    return "{WAVEFORM-" + QByteArray::number(4 * count + 1) + ": #" + QByteArray(4 * count, '\0') +
           '}';
}

/// Streams in memory and a file on disk for one read.
class ReadRun
{
public:
    TestDevice dataDevice;
    TestDevice markerDevice;
    TestDevice tagsDevice;
    WvFileInfo info;
    bool ok = false;
    QStringList log;

    explicit ReadRun(const QByteArray &bytes, bool keepTags = false)
    {
        info.fileName = m_folder.filePath("in.wv");
        QFile file(info.fileName);
        ok = file.open(QIODevice::WriteOnly) && file.write(bytes) == bytes.size() &&
             m_data.initBuf(&dataDevice, BufferedIO::ReadWrite) &&
             m_markers.initBuf(&markerDevice, BufferedIO::ReadWrite) &&
             m_tags.initBuf(&tagsDevice, BufferedIO::ReadWrite);
        info.dataStream = &m_data;
        info.markerStream = &m_markers;
        info.tagsStream = keepTags ? &m_tags : nullptr;
    }

    /// Reads the file, and collects what is logged meanwhile.
    ReadRun &read(unsigned mask = Tracer::DefaultMask)
    {
        CapturedLog captured(mask);
        HvFileIO io;
        ok = ok && io.readWaveform(&info);
        log = captured.take();
        // The first line holds the temporary folder's name.
        if (log.value(0) == "1|Reading waveform file '" + info.fileName + "'...") {
            log.removeFirst();
        }
        return *this;
    }

    [[nodiscard]] QList<float> values() const
    {
        QList<float> result((dataDevice.bytes.size() - BufferedIO::HeaderSize) /
                            static_cast<qsizetype>(sizeof(float)));
        std::memcpy(result.data(), dataDevice.bytes.constData() + BufferedIO::HeaderSize,
                    static_cast<size_t>(result.size()) * sizeof(float));
        return result;
    }

    [[nodiscard]] QByteArray markers() const { return markerDevice.bytes; }

    /// What reached the tags stream; flushes it.
    [[nodiscard]] QByteArray tags()
    {
        return m_tags.restartAtBegining() ? tagsDevice.bytes : QByteArray("cannot restart");
    }

private:
    QTemporaryDir m_folder;
    BufferedIO m_data;
    BufferedIO m_markers;
    BufferedIO m_tags;
};
