// SPDX-License-Identifier: Apache-2.0
#include "StartJob.h"

#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"

#include <utility>

StartJob::StartJob(InstrumentRef instrument, QString path, int seconds, QObject *parent)
    : InstrumentJob(std::move(instrument), "Starting ARB...", parent)
    , m_path(std::move(path))
    , m_seconds(seconds)
{
}

bool StartJob::talk(VisaDevice &device)
{
    if (!isFit(device)) {
        return false;
    }
    constexpr quint32 AnswerTimeoutMs = 5000;
    const quint32 savedTimeoutMs = device.timeoutMs();
    (void)device.setTimeoutMs(AnswerTimeoutMs);
    const bool started = device.startArb(nativePath(m_path, device.pathSeparator()), m_seconds);
    if (!started) {
        Tracer::Trace(Tracer::Error, "Cannot select ARB waveform.");
    }
    (void)device.setTimeoutMs(savedTimeoutMs);
    m_isOutputOff = started && device.readOutput() == false;
    if (m_isOutputOff) {
        emit report(ReportLine::warning("The RF output is off."));
    }
    return started;
}

/// By the tags, which stand at the beginning of the file.
bool StartJob::isFit(VisaDevice &device)
{
    if (m_check == WaveformCheck::None) {
        return true;
    }
    constexpr qint64 HeadBytes = 64 * 1024;
    QByteArray head;
    if (!device.readRemoteHead(nativePath(m_path, device.pathSeparator()), HeadBytes, head)) {
        return Tracer::fail("The waveform cannot be checked.");
    }
    if (!isWaveformHead(head)) {
        return m_check != WaveformCheck::Strict ||
               Tracer::fail(QString("The file '%1' is no waveform.").arg(m_path));
    }
    const WaveformNeeds needs = needsOfHead(head);
    // Files of some kinds tell the number of samples by the size of their block alone.
    if (needs.samples == 0 && m_check != WaveformCheck::Strict) {
        return true;
    }
    const InstrumentSummary instrument = summaryOf(device);
    const QStringList certain = waveformProblems(needs, instrument, Doubts::LeftOut);
    if (m_question && m_check == WaveformCheck::Warned) {
        if (!certain.isEmpty() && !m_question(certain)) {
            cancel();
        }
        return !isCancelled();
    }
    return mayPlay(waveformProblems(needs, instrument), m_check);
}
