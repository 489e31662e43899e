// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>

#include <optional>

// Messages of the RPC port mapper (RFC 1833), by which a host tells on which port it serves the
// VXI-11 core channel.

/// The call that asks for the port, without a record mark.
[[nodiscard]] QByteArray coreChannelCall(quint32 id);

/// The port in the answer to the call of that id, 0 if the host has no such channel; nothing if it
/// is no such answer.
[[nodiscard]] std::optional<quint16> coreChannelPort(const QByteArray &reply, quint32 id);
