// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "visa/visa.h"

#include <QByteArray>
#include <QTemporaryDir>

#include <utility>

class Vxi11Peer;

/// What a call may take beyond its time-out: the grace for the reply, the abort, a busy machine.
constexpr qint64 SlackMs = 1200;

/// A manager with a configuration file of its own, and the calls that each test needs.
class VisaFixture
{
protected:
    using Result = std::pair<ViStatus, QByteArray>;

    VisaFixture() = default;
    ~VisaFixture();

    /// Opens the manager with this text as configuration file.
    void configure(const QByteArray &text);
    void closeManager();

    /// A session to the peer as "TCPIP0::127.0.0.1::inst0::INSTR", which is then configured.
    ViSession open(const Vxi11Peer &peer, ViUInt32 timeoutMs = 5000);

    static Result read(ViSession session, ViUInt32 size);
    static ViStatus write(ViSession session, const QByteArray &data, ViUInt32 *count = nullptr);

    QTemporaryDir m_folder;
    ViSession m_manager = VI_NULL;
};
