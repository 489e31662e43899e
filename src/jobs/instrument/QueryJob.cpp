// SPDX-License-Identifier: Apache-2.0
#include "QueryJob.h"

#include "instrument/VisaDevice.h"
#include "log/Tracer.h"

#include <utility>

QueryJob::QueryJob(InstrumentRef instrument, Kind kind, QString text, QObject *parent)
    : InstrumentJob(std::move(instrument), kind == Kind::Query ? "Reading..." : "Sending...",
                    parent)
    , m_kind(kind)
    , m_text(std::move(text))
{
}

bool QueryJob::talk(VisaDevice &device)
{
    if (m_kind == Kind::Query) {
        if (device.queryText(m_text, m_answer)) {
            return true;
        }
        noteReported(device.takeLastError());
        return reported().isEmpty() ? false : Tracer::fail("The instrument reports: " + reported());
    }
    // After a query that nobody reads, the answer to the next one would be that of this one.
    const bool leavesAnswer = m_text.contains('?') && !m_text.contains("*OPC?");
    const bool sent = device.sendCommand(m_text);
    return leavesAnswer ? sent : checked(device, sent);
}
