// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QString>
#include <QTcpSocket>

#include <optional>

/// The arguments of a call as XDR.
class XdrArguments
{
public:
    XdrArguments &number(quint32 value);
    XdrArguments &opaque(const QByteArray &data);
    [[nodiscard]] const QByteArray &bytes() const { return m_bytes; }

private:
    QByteArray m_bytes;
};

/// A small VXI-11 controller, written from the protocol alone so that it shares no mistake with the
/// programs under test.
class Vxi11Client
{
public:
    enum Flags : quint32 { WaitLock = 1, End = 8, TermCharSet = 128 };
    enum Reasons : quint32 { RequestCount = 1, TermCharSeen = 2, EndSeen = 4 };
    enum Procedures : quint32 {
        CreateLink = 10,
        DeviceWrite = 11,
        DeviceRead = 12,
        DeviceReadStb = 13,
        DeviceTrigger = 14,
        DeviceClear = 15,
        DeviceLock = 18,
        DeviceUnlock = 19,
        DestroyLink = 23,
    };
    static constexpr quint32 CoreProgram = 0x0607AF;
    static constexpr quint32 AbortProgram = 0x0607B0;
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
    quint32 lock(quint32 flags = 0, quint32 timeoutMs = 0);
    quint32 linkOnly(quint32 procedure);

    /// The status byte; -1 when it could not be had.
    [[nodiscard]] int statusByte();

    [[nodiscard]] ReadResult read(quint32 count, quint32 timeoutMs = 5000,
                                  std::optional<char> termChar = std::nullopt);
    [[nodiscard]] static QByteArray readArguments(quint32 link, quint32 count, quint32 timeoutMs);
    [[nodiscard]] static ReadResult readResult(const std::optional<QByteArray> &reply);

    /// Sends a command and reads its answer up to END; null when there is none.
    [[nodiscard]] QByteArray ask(const QByteArray &command, quint32 timeoutMs = 5000);

    [[nodiscard]] quint32 linkId() const { return m_link; }
    [[nodiscard]] quint16 abortPort() const { return m_abortPort; }
    [[nodiscard]] quint32 maxReceiveSize() const { return m_maxReceiveSize; }
    [[nodiscard]] QTcpSocket &socket() { return m_socket; }

private:
    [[nodiscard]] bool fill(qsizetype size);

    QTcpSocket m_socket;
    QByteArray m_buffer;
    quint32 m_transaction = 1;
    quint32 m_link = 0;
    quint16 m_abortPort = 0;
    quint32 m_maxReceiveSize = 0;
};
