// SPDX-License-Identifier: Apache-2.0
#include "portmapmessage.h"

#include <QtEndian>

#include <array>

namespace {

constexpr quint32 Call = 0;
constexpr quint32 Reply = 1;
constexpr quint32 RpcVersion = 2;
constexpr quint32 PortMapper = 100'000;
constexpr quint32 PortMapperVersion = 2;
constexpr quint32 GetPort = 3;
constexpr quint32 CoreChannel = 0x0607AF;
constexpr quint32 CoreVersion = 1;
constexpr quint32 Tcp = 6;

quint32 wordAt(const QByteArray &bytes, qsizetype index)
{
    return qFromBigEndian<quint32>(bytes.constData() + 4 * index);
}

} // namespace

QByteArray coreChannelCall(quint32 id)
{
    // The four zeros are credentials and verifier, of which there are none.
    const std::array<quint32, 14> words{
        id, Call, RpcVersion, PortMapper,  PortMapperVersion, GetPort, 0,
        0,  0,    0,          CoreChannel, CoreVersion,       Tcp,     0};
    QByteArray message(4 * static_cast<qsizetype>(words.size()), '\0');
    qToBigEndian<quint32>(words.data(), static_cast<qsizetype>(words.size()), message.data());
    return message;
}

std::optional<quint16> coreChannelPort(const QByteArray &reply, quint32 id)
{
    // Accepted, with a verifier that says nothing, and done.
    constexpr qsizetype Words = 7;
    constexpr quint32 MaxPort = 65535;
    if (reply.size() != 4 * Words || wordAt(reply, 0) != id || wordAt(reply, 1) != Reply ||
        wordAt(reply, 2) != 0 || wordAt(reply, 4) != 0 || wordAt(reply, 5) != 0 ||
        wordAt(reply, 6) > MaxPort) {
        return std::nullopt;
    }
    return static_cast<quint16>(wordAt(reply, 6));
}
