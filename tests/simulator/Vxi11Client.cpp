// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Client.h"

#include <QtEndian>

namespace {

constexpr int WaitMilliseconds = 20000;
constexpr quint32 LastFragment = 0x80000000U;
constexpr qsizetype ReplyHeadSize = 24; // xid, REPLY, accepted, empty verifier, status

quint32 numberAt(const QByteArray &bytes, qsizetype place)
{
    return place + 4 <= bytes.size() ? qFromBigEndian<quint32>(bytes.constData() + place) : 0;
}

quint32 firstNumber(const std::optional<QByteArray> &reply)
{
    return reply && reply->size() >= 4 ? numberAt(*reply, 0) : Vxi11Client::NoReply;
}

} // namespace

XdrArguments &XdrArguments::number(quint32 value)
{
    const quint32 big = qToBigEndian(value);
    m_bytes.append(reinterpret_cast<const char *>(&big), sizeof(big));
    return *this;
}

XdrArguments &XdrArguments::opaque(const QByteArray &data)
{
    number(static_cast<quint32>(data.size()));
    m_bytes.append(data);
    m_bytes.append((4 - data.size() % 4) % 4, '\0');
    return *this;
}

bool Vxi11Client::open(quint16 port, const QString &address)
{
    m_socket.setSocketOption(QAbstractSocket::LowDelayOption, 1);
    m_socket.connectToHost(address, port);
    return m_socket.waitForConnected(WaitMilliseconds);
}

void Vxi11Client::sendCall(quint32 program, quint32 procedure, const QByteArray &arguments,
                           quint32 version)
{
    XdrArguments head;
    head.number(m_transaction++).number(0).number(2).number(program).number(version);
    head.number(procedure).number(0).number(0).number(0).number(0);
    const auto size = static_cast<quint32>(head.bytes().size() + arguments.size());
    m_socket.write(XdrArguments().number(LastFragment | size).bytes() + head.bytes() + arguments);
}

std::optional<QByteArray> Vxi11Client::takeReply()
{
    if (!fill(4))
        return std::nullopt;
    const auto size = static_cast<qsizetype>(numberAt(m_buffer, 0) & ~LastFragment);
    if (!fill(4 + size))
        return std::nullopt;
    const QByteArray record = m_buffer.mid(4, size);
    m_buffer.remove(0, 4 + size);
    const bool accepted = numberAt(record, 0) == m_transaction - 1 && numberAt(record, 4) == 1 &&
                          numberAt(record, 8) == 0 && numberAt(record, 20) == 0;
    if (!accepted || size < ReplyHeadSize)
        return std::nullopt;
    return record.mid(ReplyHeadSize);
}

std::optional<QByteArray> Vxi11Client::call(quint32 program, quint32 procedure,
                                            const QByteArray &arguments, quint32 version)
{
    sendCall(program, procedure, arguments, version);
    return takeReply();
}

bool Vxi11Client::fill(qsizetype size)
{
    while (m_buffer.size() < size) {
        if (m_socket.bytesAvailable() == 0 && !m_socket.waitForReadyRead(WaitMilliseconds))
            return false;
        m_buffer += m_socket.readAll();
    }
    return true;
}

quint32 Vxi11Client::link(const QString &device, bool lock, quint32 lockTimeoutMs)
{
    XdrArguments arguments;
    arguments.number(1).number(lock ? 1 : 0).number(lockTimeoutMs).opaque(device.toLatin1());
    const auto reply = call(CoreProgram, CreateLink, arguments.bytes());
    if (reply) {
        m_link = numberAt(*reply, 4);
        m_abortPort = static_cast<quint16>(numberAt(*reply, 8));
        m_maxReceiveSize = numberAt(*reply, 12);
    }
    return firstNumber(reply);
}

quint32 Vxi11Client::write(const QByteArray &data, quint32 flags)
{
    XdrArguments arguments;
    arguments.number(m_link).number(5000).number(0).number(flags).opaque(data);
    const auto reply = call(CoreProgram, DeviceWrite, arguments.bytes());
    if (firstNumber(reply) == 0 && numberAt(*reply, 4) != static_cast<quint32>(data.size()))
        return NoReply;
    return firstNumber(reply);
}

quint32 Vxi11Client::generic(quint32 procedure, quint32 flags, quint32 lockTimeoutMs)
{
    XdrArguments arguments;
    arguments.number(m_link).number(flags).number(lockTimeoutMs).number(5000);
    return firstNumber(call(CoreProgram, procedure, arguments.bytes()));
}

quint32 Vxi11Client::lock(quint32 flags, quint32 timeoutMs)
{
    XdrArguments arguments;
    arguments.number(m_link).number(flags).number(timeoutMs);
    return firstNumber(call(CoreProgram, DeviceLock, arguments.bytes()));
}

quint32 Vxi11Client::linkOnly(quint32 procedure)
{
    return firstNumber(call(CoreProgram, procedure, XdrArguments().number(m_link).bytes()));
}

int Vxi11Client::statusByte()
{
    XdrArguments arguments;
    arguments.number(m_link).number(0).number(0).number(0);
    const auto reply = call(CoreProgram, DeviceReadStb, arguments.bytes());
    return firstNumber(reply) == 0 ? static_cast<int>(numberAt(*reply, 4)) : -1;
}

QByteArray Vxi11Client::readArguments(quint32 link, quint32 count, quint32 timeoutMs)
{
    XdrArguments arguments;
    arguments.number(link).number(count).number(timeoutMs).number(0).number(0).number(0);
    return arguments.bytes();
}

Vxi11Client::ReadResult Vxi11Client::readResult(const std::optional<QByteArray> &reply)
{
    ReadResult result;
    result.error = firstNumber(reply);
    if (reply) {
        result.reason = numberAt(*reply, 4);
        result.data = reply->mid(12, numberAt(*reply, 8));
    }
    return result;
}

Vxi11Client::ReadResult Vxi11Client::read(quint32 count, quint32 timeoutMs,
                                          std::optional<char> termChar)
{
    XdrArguments arguments;
    arguments.number(m_link).number(count).number(timeoutMs).number(0);
    arguments.number(termChar ? quint32{TermCharSet} : 0);
    arguments.number(static_cast<unsigned char>(termChar.value_or(0)));
    return readResult(call(CoreProgram, DeviceRead, arguments.bytes()));
}

QByteArray Vxi11Client::ask(const QByteArray &command, quint32 timeoutMs)
{
    if (write(command) != 0)
        return {};
    QByteArray answer("");
    for (;;) {
        const ReadResult part = read(1024 * 1024, timeoutMs);
        if (part.error != 0)
            return {};
        answer += part.data;
        if ((part.reason & EndSeen) != 0)
            return answer;
    }
}
