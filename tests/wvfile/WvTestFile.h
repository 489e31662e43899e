// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/BufferedIO.h"
#include "support/TestDevice.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/wvbytes.h"
#include "wvfile/HvFileIO.h"
#include "wvfile/WvTypes.h"

#include <QByteArray>
#include <QDateTime>
#include <QList>
#include <QRegularExpression>

#include <cstring>

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
        info.fileName = m_folder.path("in.wv");
        ok = m_folder.store("in.wv", bytes) && m_data.initBuf(&dataDevice, BufferedIO::ReadWrite) &&
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
    TestFolder m_folder;
    BufferedIO m_data;
    BufferedIO m_markers;
    BufferedIO m_tags;
};

/// One write to a file in a folder of its own.
class WriteRun
{
public:
    QStringList log;
    QByteArray bytes; ///< with "#DATE#" where the tag DATE stands
    QString path;

    bool write(WvWriteJob &job, BufferedIO *data = nullptr, BufferedIO *markers = nullptr,
               BufferedIO *tags = nullptr)
    {
        path = m_folder.path("out.wv");
        CapturedLog captured;
        const QDateTime before = QDateTime::currentDateTime().addSecs(-1);
        HvFileIO io;
        const bool ok = io.writeWaveform(job, path, data, markers, tags);
        log = captured.take();
        bytes = m_folder.load("out.wv");
        static const QRegularExpression date(
            "\\{DATE:(\\d{4}-\\d\\d-\\d\\d;\\d\\d:\\d\\d:\\d\\d)\\}");
        const auto match = date.match(QString::fromLatin1(bytes));
        if (match.hasMatch()) {
            const auto written = QDateTime::fromString(match.captured(1), "yyyy-MM-dd;HH:mm:ss");
            if (written >= before && written <= QDateTime::currentDateTime()) {
                bytes.replace(match.captured(0).toLatin1(), "#DATE#");
            }
        }
        return ok;
    }

private:
    TestFolder m_folder;
};

/// A stream in memory with some content.
class Filled
{
public:
    explicit Filled(const QByteArray &content)
    {
        m_device.bytes = content;
        m_ready = m_stream.initBuf(&m_device, BufferedIO::ReadWrite);
    }

    BufferedIO *stream() { return m_ready ? &m_stream : nullptr; }
    TestDevice &device() { return m_device; }

private:
    TestDevice m_device;
    BufferedIO m_stream;
    bool m_ready = false;
};
