// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OperationControl.h"
#include "VisaSession.h"

#include <QByteArray>
#include <QString>

#include <optional>

class BufferedIO;
class OutputFile;
class WriteBehind;

/// Reads one definite-length block of IEEE 488.2: "#", one digit n, n digits with the byte count,
/// the data, and one terminating byte; of a file also "#(", the byte count and ")". Lives for one
/// transfer of a session.
class BlockReader
{
public:
    BlockReader(VisaSession &session, OperationControl &control);

    /// Asks for a remote file and writes it to a local one, which is opened and committed here.
    /// `localPath` is its name for the log. See VisaDevice::readRemoteFile.
    [[nodiscard]] bool readFile(const QString &remotePath, const QString &localPath,
                                OutputFile &file);

    /// Asks for a remote file and reads at most the first `maximum` bytes of it.
    [[nodiscard]] bool readHead(const QString &remotePath, qint64 maximum, QByteArray &head);

    /// Reads a block that was asked for. See VisaDevice::readBinaryBlock.
    [[nodiscard]] bool readStream(BufferedIO &stream, qint64 maximum);

private:
    [[nodiscard]] bool fail(const char *text) const;
    [[nodiscard]] bool fail(const char *text, ViStatus status) const;
    [[nodiscard]] std::optional<qint64> readFileLength() const;
    [[nodiscard]] std::optional<qint64> readBracketLength() const;
    [[nodiscard]] std::optional<qint64> lengthIn(const QByteArray &digits) const;
    [[nodiscard]] bool readTerminator(qint64 length) const;
    [[nodiscard]] bool receiveFile(WriteBehind &file, qint64 length);
    [[nodiscard]] bool failIncomplete(qint64 total, qint64 length, const QByteArray &lastBlock,
                                      ViStatus status) const;
    [[nodiscard]] bool abandon();
    [[nodiscard]] std::optional<qint64> readStreamLength() const;
    [[nodiscard]] std::optional<qint64> receiveStream(BufferedIO &stream, qint64 length,
                                                      qint64 maximum);

    VisaSession &m_session;
    OperationControl &m_control;
};
