// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QString>
#include <QTcpSocket>

#include <vxi11.h>

#include <initializer_list>
#include <optional>

/// Numbers as they stand on the wire.
[[nodiscard]] QByteArray words(std::initializer_list<quint32> values);

/// A small VXI-11 controller for one link.
class Vxi11Client
{
public:
    enum Flags : quint32 { WaitLock = DEVICE_FLAG_WAITLOCK, End = DEVICE_FLAG_END };
    enum Reasons : quint32 {
        RequestCount = DEVICE_REASON_REQCNT,
        TermCharSeen = DEVICE_REASON_CHR,
        EndSeen = DEVICE_REASON_END
    };
    static constexpr quint32 NoReply = 0xFFFFFFFF; ///< the connection ended instead

    struct ReadResult
    {
        quint32 error = NoReply;
        quint32 reason = 0;
        QByteArray data;
    };

    [[nodiscard]] bool open(quint16 port, const QString &address = "127.0.0.1");

    /// One call; its results as XDR, nothing when the connection ended or RPC refused it.
    [[nodiscard]] std::optional<QByteArray> call(quint32 program, quint32 procedure,
                                                 const QByteArray &arguments, quint32 version = 1);

    /// The parts of `call`, for a reply that comes later.
    void sendCall(quint32 program, quint32 procedure, const QByteArray &arguments,
                  quint32 version = 1);
    [[nodiscard]] std::optional<QByteArray> takeReply();

    /// These return the VXI-11 error.
    quint32 link(const QString &device, bool lock = false, quint32 lockTimeoutMs = 0);
    quint32 write(const QByteArray &data, quint32 flags = End);
    quint32 generic(quint32 procedure, quint32 flags = 0, quint32 lockTimeoutMs = 0);
    quint32 lock();
    quint32 linkOnly(quint32 procedure);

    [[nodiscard]] int statusByte(); ///< -1 when it could not be had

    [[nodiscard]] ReadResult read(quint32 count, quint32 timeoutMs = 5000,
                                  std::optional<char> termChar = std::nullopt);
    /// The same in two steps; the second takes the reply.
    void sendRead(quint32 count, quint32 timeoutMs, std::optional<char> termChar = std::nullopt);
    [[nodiscard]] ReadResult takeRead();

    /// Sends a command and reads its answer up to END; null when there is none.
    [[nodiscard]] QByteArray ask(const QByteArray &command, quint32 timeoutMs = 5000);

    [[nodiscard]] quint32 linkId() const { return static_cast<quint32>(m_link.lid); }
    [[nodiscard]] quint16 abortPort() const { return m_link.abortPort; }
    [[nodiscard]] quint32 maxReceiveSize() const { return m_link.maxRecvSize; }
    [[nodiscard]] QTcpSocket &socket() { return m_socket; }

private:
    [[nodiscard]] bool fill(qsizetype size);

    QTcpSocket m_socket;
    QByteArray m_buffer;
    quint32 m_transaction = 1;
    Create_LinkResp m_link{};
};
