// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "VisaSession.h"

#include <QByteArray>
#include <QString>

#include <atomic>
#include <optional>

class BufferedIO;
class QFile;
class VisaDevice;

/// Reads one definite-length block of IEEE 488.2: "#", one digit n, n digits with the byte count,
/// the data, and one terminating byte. Lives for one transfer of an open device, whose progress
/// signal it emits and in whose name it logs.
class BlockReader
{
public:
    BlockReader(VisaDevice &device, const VisaSession &session, const std::atomic<bool> &cancelled);

    /// Asks for a remote file and writes it to a local one. See VisaDevice::readRemoteFile.
    [[nodiscard]] bool readFile(const QString &remotePath, const QString &localPath);

    /// Reads a block that was asked for. See VisaDevice::readBinaryBlock.
    [[nodiscard]] bool readStream(BufferedIO &stream, qint64 maximum);

private:
    [[nodiscard]] bool fail(const char *text) const;
    [[nodiscard]] bool fail(const char *text, ViStatus status) const;
    [[nodiscard]] std::optional<qint64> readFileLength() const;
    [[nodiscard]] bool receiveFile(QFile &file, qint64 length);
    [[nodiscard]] bool failIncomplete(qint64 total, qint64 length, const QByteArray &lastBlock,
                                      ViStatus status) const;
    [[nodiscard]] bool writePending(QFile &file);
    [[nodiscard]] bool abandon() const;
    [[nodiscard]] std::optional<qint64> readStreamLength() const;
    [[nodiscard]] std::optional<qint64> receiveStream(BufferedIO &stream, qint64 length,
                                                      qint64 maximum);

    VisaDevice &m_device;
    VisaSession m_session;
    const std::atomic<bool> &m_cancelled;
    QByteArray m_buffer;
    qint64 m_pending = 0; ///< bytes at the front of the buffer that are not in the file yet
};
