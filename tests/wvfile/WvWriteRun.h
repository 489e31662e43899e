// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TestDevice.h"

#include "log/CapturedLog.h"
#include "streams/BufferedIO.h"
#include "wvfile/HvFileIO.h"
#include "wvfile/WvTypes.h"

#include <QDateTime>
#include <QFile>
#include <QRegularExpression>
#include <QTemporaryDir>

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
        path = m_folder.filePath("out.wv");
        CapturedLog captured;
        const QDateTime before = QDateTime::currentDateTime().addSecs(-1);
        HvFileIO io;
        const bool ok = io.writeWaveform(job, path, data, markers, tags);
        log = captured.take();
        QFile file(path);
        bytes = file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray("no file");
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
    QTemporaryDir m_folder;
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
