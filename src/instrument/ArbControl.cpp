// SPDX-License-Identifier: Apache-2.0
#include "ArbControl.h"

#include "InstrumentIdentity.h"
#include "VisaSession.h"
#include "remotepaths.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QElapsedTimer>
#include <QThread>

#include <algorithm>

namespace {

constexpr int MaxIdleMs = 5;
/// Bit of the operation condition register that is set while the ARB loads.
constexpr int ArbBusy = 2;

} // namespace

ArbControl::ArbControl(VisaSession &session, const InstrumentIdentity &identity,
                       OperationControl &control, const ArbIntervals &intervals)
    : m_session(session)
    , m_identity(identity)
    , m_control(control)
    , m_intervals(intervals)
{
}

bool ArbControl::start(const QString &path, int seconds)
{
    // Old errors would be taken for errors of this start.
    (void)m_session.checkErrorQueue();
    const bool hasCoder = m_identity.hasBasebandCoder();
    const QString select = hasCoder ? "SOUR:BB:ARB:WAV:SEL " : "SOUR:WAV:SEL ";
    const QString switchOn = hasCoder ? "SOUR:BB:ARB:STAT ON; *OPC?" : "SOUR:STAT ON; *OPC?";
    if (!m_session.send(select + commandString(path))) {
        (void)m_session.checkErrorQueue();
        return false;
    }
    if (!waitUntilReady(seconds)) {
        return false;
    }
    QThread::msleep(static_cast<unsigned long>(m_intervals.settle));
    if (!m_session.send(switchOn)) {
        (void)m_session.checkErrorQueue();
        return false;
    }
    return bool(m_session.checkErrorQueue());
}

bool ArbControl::waitUntilReady(int seconds)
{
    if (seconds <= 0) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Waiting for ARB...");
    QElapsedTimer total;
    total.start();
    m_control.report(0);
    ProgressClock display(m_control.report, m_control.cancelled);
    QElapsedTimer poll;
    poll.start();
    int progress = 0;
    while (total.elapsed() < qint64{seconds} * m_intervals.second) {
        if (display.shouldStop(progress) || m_control.cancelled) {
            return Tracer::fail("*** User break.");
        }
        if (poll.elapsed() <= m_intervals.poll) {
            QThread::msleep(static_cast<unsigned long>(std::min(MaxIdleMs, m_intervals.poll)));
            continue;
        }
        // An instrument that tells no progress is taken to need 100 s.
        progress = static_cast<int>(total.elapsed() / m_intervals.second);
        const State state = readState(progress);
        if (state == State::Unknown) {
            return false;
        }
        if (state == State::Ready) {
            m_control.report(100);
            return true;
        }
        poll.restart();
    }
    return Tracer::fail("ARB did not get ready in time.");
}

/// Replaces the progress by the instrument's own if it has one to tell.
ArbControl::State ArbControl::readState(int &progress)
{
    const auto unanswered = [this](const char *text) {
        Tracer::Trace(Tracer::Error, text);
        (void)m_session.checkErrorQueue();
        return State::Unknown;
    };
    QString answer;
    if (m_identity.hasBasebandCoder()) {
        if (!m_session.query("SOUR:BB:PROG:MCOD?", answer)) {
            return unanswered("Cannot read MCOD progress.");
        }
        progress = answer.toInt();
    }
    if (!m_session.query("STAT:OPER:COND?", answer)) {
        return unanswered("Cannot read instrument status.");
    }
    bool isNumber = false;
    const int condition = answer.toInt(&isNumber);
    if (!isNumber) {
        Tracer::Trace(Tracer::Error, "Invalid instrument response.");
        return State::Unknown;
    }
    return (condition & ArbBusy) == 0 ? State::Ready : State::Busy;
}
