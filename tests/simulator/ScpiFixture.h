// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SimulatorProcess.h"
#include "Vxi11Client.h"

#include <memory>

/// Simulated instruments behind a gateway and a conversation with one of them.
class ScpiFixture
{
protected:
    /// A new connection to the instrument with this GPIB address.
    [[nodiscard]] bool open(int gpib)
    {
        m_client = std::make_unique<Vxi11Client>();
        return m_client->open(m_program.gatewayPort()) &&
               m_client->link(QString("gpib0,%1").arg(gpib)) == 0;
    }

    /// As above, with the instrument brought to its start and without faults.
    [[nodiscard]] bool connectTo(int gpib)
    {
        return open(gpib) && m_client->write("SYST:FAUL:CLE;*RST;*CLS") == 0;
    }

    [[nodiscard]] QByteArray ask(const QByteArray &command) { return m_client->ask(command); }

    /// The numbers of all waiting errors.
    [[nodiscard]] QByteArray errors()
    {
        QByteArray numbers;
        for (;;) {
            const QByteArray number = ask(":SYST:ERR?").split(',').first();
            if (number == "0" || number.isEmpty()) {
                return numbers.trimmed();
            }
            numbers += number + ' ';
        }
    }

    SimulatorProcess m_program;
    std::unique_ptr<Vxi11Client> m_client;
};
