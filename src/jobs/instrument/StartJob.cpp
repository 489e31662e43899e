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
    constexpr quint32 AnswerTimeoutMs = 5000;
    const quint32 savedTimeoutMs = device.timeoutMs();
    (void)device.setTimeoutMs(AnswerTimeoutMs);
    const bool started = device.startArb(nativePath(m_path, device.pathSeparator()), m_seconds);
    if (!started) {
        Tracer::Trace(Tracer::Error, "Cannot select ARB waveform.");
    }
    (void)device.setTimeoutMs(savedTimeoutMs);
    return started;
}
