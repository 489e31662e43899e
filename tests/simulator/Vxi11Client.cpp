// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Client.h"

#include "protocols/RpcRecord.h"
#include "protocols/XdrReader.h"

#include <QtEndian>

namespace {

constexpr int WaitMilliseconds = 20000;

std::span<const std::uint8_t> bytesOf(const QByteArray &data)
{
    return {reinterpret_cast<const std::uint8_t *>(data.constData()), std::size_t(data.size())};
}

template <typename T>
QByteArray encoded(protocols::XdrCode<T> *code, T value, qsizetype dataSize = 0)
{
    QByteArray bytes(64 + dataSize, '\0');
    const std::span room(reinterpret_cast<std::uint8_t *>(bytes.data()), std::size_t(bytes.size()));
    bytes.truncate(qsizetype(protocols::encodeXdr(code, value, room).value_or(0)));
    return bytes;
}

quint32 errorOf(const std::optional<QByteArray> &reply)
{
    return reply && reply->size() >= 4 ? protocols::XdrReader(bytesOf(*reply)).number()
                                       : Vxi11Client::NoReply;
}

} // namespace

QByteArray words(std::initializer_list<quint32> values)
{
    QByteArray bytes;
    for (const quint32 value : values) {
        const quint32 big = qToBigEndian(value);
        bytes.append(reinterpret_cast<const char *>(&big), sizeof(big));
    }
    return bytes;
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
    QByteArray record =
        words({0, m_transaction++, CALL, RPC_MSG_VERSION, program, version, procedure, 0, 0, 0, 0});
    record += arguments;
    protocols::markRecord(
        {reinterpret_cast<std::uint8_t *>(record.data()), std::size_t(record.size())});
    m_socket.write(record);
}

std::optional<QByteArray> Vxi11Client::takeReply()
{
    if (!fill(4)) {
        return std::nullopt;
    }
    const qsizetype size = qFromBigEndian<quint32>(m_buffer.constData()) & 0x7FFFFFFFU;
    if (!fill(4 + size)) {
        return std::nullopt;
    }
    const QByteArray record = m_buffer.mid(4, size);
    m_buffer.remove(0, 4 + size);
    const QByteArray head = words({m_transaction - 1, REPLY, MSG_ACCEPTED, 0, 0, SUCCESS});
    return record.startsWith(head) ? std::optional(record.mid(head.size())) : std::nullopt;
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
        if (m_socket.bytesAvailable() == 0 && !m_socket.waitForReadyRead(WaitMilliseconds)) {
            return false;
        }
        m_buffer += m_socket.readAll();
    }
    return true;
}

quint32 Vxi11Client::link(const QString &device, bool lock, quint32 lockTimeoutMs)
{
    QByteArray name = device.toLatin1();
    const Create_LinkParms arguments{1, lock, lockTimeoutMs, name.data()};
    const auto reply =
        call(DEVICE_CORE, create_link, encoded(xdr_Create_LinkParms, arguments, name.size()));
    if (reply) {
        m_link = protocols::XdrReader(bytesOf(*reply)).value(xdr_Create_LinkResp);
    }
    return errorOf(reply);
}

quint32 Vxi11Client::write(const QByteArray &data, quint32 flags)
{
    QByteArray copy = data;
    const auto size = static_cast<unsigned>(copy.size());
    const Device_WriteParms arguments{m_link.lid, 5000, 0, int(flags), {size, copy.data()}};
    const auto reply =
        call(DEVICE_CORE, device_write, encoded(xdr_Device_WriteParms, arguments, copy.size()));
    if (errorOf(reply) == 0 && *reply != words({0, size})) {
        return NoReply;
    }
    return errorOf(reply);
}

quint32 Vxi11Client::generic(quint32 procedure, quint32 flags, quint32 lockTimeoutMs)
{
    return errorOf(call(DEVICE_CORE, procedure, words({linkId(), flags, lockTimeoutMs, 5000})));
}

quint32 Vxi11Client::lock()
{
    return errorOf(call(DEVICE_CORE, device_lock, words({linkId(), 0, 0})));
}

quint32 Vxi11Client::linkOnly(quint32 procedure)
{
    return errorOf(call(DEVICE_CORE, procedure, words({linkId()})));
}

int Vxi11Client::statusByte()
{
    const auto reply = call(DEVICE_CORE, device_readstb, words({linkId(), 0, 0, 0}));
    return errorOf(reply) == 0 ? static_cast<quint8>(reply->back()) : -1;
}

Vxi11Client::ReadResult Vxi11Client::read(quint32 count, quint32 timeoutMs,
                                          std::optional<char> termChar)
{
    sendRead(count, timeoutMs, termChar);
    return takeRead();
}

void Vxi11Client::sendRead(quint32 count, quint32 timeoutMs, std::optional<char> termChar)
{
    const int flags = termChar ? DEVICE_FLAG_TERMCHRSET : 0;
    const Device_ReadParms arguments{m_link.lid, count, timeoutMs,
                                     0,          flags, termChar.value_or('\0')};
    sendCall(DEVICE_CORE, device_read, encoded(xdr_Device_ReadParms, arguments));
}

Vxi11Client::ReadResult Vxi11Client::takeRead()
{
    const auto reply = takeReply();
    if (!reply) {
        return {};
    }
    protocols::XdrReader reader(bytesOf(*reply));
    const quint32 error = reader.number();
    const quint32 reason = reader.number();
    const auto data = reader.opaque();
    return {error, reason,
            QByteArray(reinterpret_cast<const char *>(data.data()), qsizetype(data.size()))};
}

QByteArray Vxi11Client::ask(const QByteArray &command, quint32 timeoutMs)
{
    if (write(command) != 0) {
        return {};
    }
    QByteArray answer("");
    for (;;) {
        const ReadResult part = read(1024 * 1024, timeoutMs);
        if (part.error != 0) {
            return {};
        }
        answer += part.data;
        if ((part.reason & EndSeen) != 0) {
            return answer;
        }
    }
}
