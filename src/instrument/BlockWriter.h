// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OperationControl.h"
#include "VisaSession.h"

#include <QByteArray>
#include <QString>

class InstrumentFiles;
class QFile;

/// Sends a local file as one block. Its end is marked by END with the last piece and by nothing
/// else, so that the data may hold any byte. Lives for one transfer of a session.
class BlockWriter
{
public:
    BlockWriter(VisaSession &session, InstrumentFiles &files, OperationControl &control);

    /// See VisaDevice::writeRemoteFile.
    [[nodiscard]] bool writeFile(const QString &localPath, const QString &remotePath);

    /// The command with the head of the block for that many bytes.
    [[nodiscard]] static QString header(const QString &remotePath, qint64 size);

    /// See VisaDevice::recoverAfterTransferError.
    static void recover(VisaSession &session, ViBoolean previousEnd, quint16 interfaceKind);

private:
    [[nodiscard]] bool removeOldFile(const QString &remotePath);
    [[nodiscard]] bool prepareSession();
    [[nodiscard]] bool sendFile(QFile &file, qint64 size);
    [[nodiscard]] bool failOnSource(qint64 wanted, qint64 count, qint64 remaining) const;
    [[nodiscard]] bool setSendEnd(ViAttrState value) const;
    void abandon(const QString &remotePath);

    VisaSession &m_session;
    InstrumentFiles &m_files;
    OperationControl &m_control;
    quint16 m_interface = 0;
    ViBoolean m_previousEnd = VI_TRUE;
    QByteArray m_buffer;
    bool m_wasCancelled = false;
};
