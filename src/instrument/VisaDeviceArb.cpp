// SPDX-License-Identifier: Apache-2.0
// Playing a waveform file on the instrument.
#include "VisaDevice.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QThread>

namespace {

constexpr unsigned long settleMs = 250;
constexpr unsigned long idleMs = 5;
constexpr qint64 pollIntervalMs = 1000;
/// Bit of the operation condition register that is set while the ARB loads.
constexpr int arbBusy = 2;

} // namespace

bool VisaDevice::startArb(const QString &path, int seconds)
{
    // Old errors would be taken for errors of this start.
    checkErrorQueue();
    const bool hasCoder = hasBasebandCoder();
    const QString select = hasCoder ? "SOUR:BB:ARB:WAV:SEL '" : "SOUR:WAV:SEL '";
    const QString switchOn = hasCoder ? "SOUR:BB:ARB:STAT ON; *OPC?" : "SOUR:STAT ON; *OPC?";
    if (!sendCommand(select + path + "'")) {
        checkErrorQueue();
        return false;
    }
    if (!waitForArbReady(seconds)) {
        return false;
    }
    QThread::msleep(settleMs);
    if (!sendCommand(switchOn)) {
        checkErrorQueue();
        return false;
    }
    return checkErrorQueue();
}

bool VisaDevice::waitForArbReady(int seconds)
{
    if (seconds <= 0) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Waiting for ARB...");
    QElapsedTimer total;
    total.start();
    emit ProgressUpdate(0);
    ProgressClock display([this](int percent) { emit ProgressUpdate(percent); }, m_cancelRequested);
    QElapsedTimer poll;
    poll.start();
    int progress = 0;
    while (total.elapsed() < qint64{seconds} * 1000) {
        if (display.shouldStop(progress)) {
            return Tracer::fail("*** User break.");
        }
        if (poll.elapsed() <= pollIntervalMs) {
            QThread::msleep(idleMs);
            continue;
        }
        // An instrument that tells no progress is taken to need 100 s.
        progress = static_cast<int>(total.elapsed() / 1000);
        QString answer;
        if (hasBasebandCoder()) {
            if (!queryText("SOUR:BB:PROG:MCOD?", answer)) {
                Tracer::Trace(Tracer::Error, "Cannot read MCOD progress.");
                checkErrorQueue();
                return false;
            }
            progress = answer.toInt();
        }
        if (!queryText("STAT:OPER:COND?", answer)) {
            Tracer::Trace(Tracer::Error, "Cannot read instrument status.");
            checkErrorQueue();
            return false;
        }
        bool isNumber = false;
        const int condition = answer.toInt(&isNumber);
        if (!isNumber) {
            return Tracer::fail("Invalid instrument response.");
        }
        if ((condition & arbBusy) == 0) {
            emit ProgressUpdate(100);
            return true;
        }
        poll.restart();
    }
    return Tracer::fail("ARB did not get ready in time.");
}
