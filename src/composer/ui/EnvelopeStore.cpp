// SPDX-License-Identifier: Apache-2.0
#include "EnvelopeStore.h"

#include "streams/TempStream.h"
#include "streams/samplestream.h"

#include <QFileInfo>

#include <algorithm>
#include <cmath>

namespace {

/// Longer files would fill the temporary folder for a picture.
constexpr qint64 MaxSourceBytes = 512LL * 1024 * 1024;
constexpr int BufferSize = 1024 * 1024;

} // namespace

float Envelope::peak(double from, double to) const
{
    if (samples < 1) {
        return 0;
    }
    const double scale = BinCount / static_cast<double>(samples);
    const int first = std::clamp(static_cast<int>(from * scale), 0, BinCount - 1);
    const int last = std::clamp(static_cast<int>(std::ceil(to * scale)) - 1, first, BinCount - 1);
    return *std::max_element(peaks.begin() + first, peaks.begin() + last + 1);
}

EnvelopeStore::EnvelopeStore(QObject *parent)
    : QObject(parent)
{
    m_pool.setMaxThreadCount(1);
}

EnvelopeStore::~EnvelopeStore()
{
    m_ending = true;
    m_pool.clear();
    while (!m_pool.waitForDone(20)) {
        m_file.cancel();
    }
}

const Envelope *EnvelopeStore::find(const QString &fileName)
{
    const auto found = m_envelopes.constFind(fileName);
    if (found != m_envelopes.constEnd()) {
        return &*found;
    }
    const QFileInfo file(fileName);
    if (!m_requested.contains(fileName) && file.isFile() && file.size() <= MaxSourceBytes) {
        m_requested.insert(fileName);
        m_pool.start([this, fileName] { read(fileName); });
    }
    return nullptr;
}

void EnvelopeStore::read(const QString &fileName)
{
    TempStream data(BufferSize);
    TempStream markers(BufferSize);
    WvFileInfo info;
    info.fileName = fileName;
    info.dataStream = data.stream();
    info.markerStream = markers.stream();
    if (m_ending || !data.open() || !markers.open() || !m_file.readWaveform(&info) ||
        !data->checkHeader(BufferedIO::DataHeader)) {
        return;
    }
    Envelope envelope;
    envelope.samples = info.samples;
    const auto stop = [this](qint64) { return m_ending.load(); };
    const auto take = [&](std::span<const float> iq, qint64 first) {
        for (std::size_t i = 0; i < iq.size() / 2; ++i) {
            const auto sample = static_cast<double>(first + static_cast<qint64>(i));
            const auto bin = static_cast<std::size_t>(sample / static_cast<double>(info.samples) *
                                                      Envelope::BinCount);
            envelope.peaks[bin] =
                std::max(envelope.peaks[bin], std::hypot(iq[2 * i], iq[2 * i + 1]));
        }
        return true;
    };
    if (forEachBlock(*data.stream(), info.samples, stop, take).end == BlockLoop::Done) {
        QMetaObject::invokeMethod(this, [this, fileName, envelope] {
            m_envelopes.insert(fileName, envelope);
            emit changed();
        });
    }
}
