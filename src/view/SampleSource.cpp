// SPDX-License-Identifier: Apache-2.0
#include "SampleSource.h"

#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <utility>

MemorySource::MemorySource(std::span<const IqSample> samples, std::span<const quint8> markers,
                           qint64 first)
    : m_samples(samples)
    , m_markers(markers)
    , m_first(first)
{
}

bool MemorySource::restart()
{
    m_done = 0;
    return true;
}

bool MemorySource::next(std::span<IqSample> samples, std::span<quint8> markers)
{
    if (samples.size() > m_samples.size() - m_done) {
        return Tracer::fail("Internal error. Invalid buffer length.");
    }
    std::copy_n(m_samples.begin() + static_cast<std::ptrdiff_t>(m_done), samples.size(),
                samples.begin());
    for (std::size_t k = 0; k < markers.size(); ++k) {
        markers[k] = m_done + k < m_markers.size() ? m_markers[m_done + k] : quint8{0};
    }
    m_done += samples.size();
    return true;
}

StreamSource::StreamSource(BufferedIO &data, BufferedIO &markers, qint64 first, qint64 count,
                           Proceed proceed)
    : m_data(data)
    , m_markers(markers)
    , m_first(first)
    , m_count(count)
    , m_proceed(std::move(proceed))
{
}

bool StreamSource::restart()
{
    if (!m_data.restartAtPosition(BufferedIO::HeaderSize + BufferedIO::RecordSize * m_first)) {
        return Tracer::fail("Cannot read I/Q data from temporary file.");
    }
    if (!m_markers.restartAtPosition(m_first)) {
        return Tracer::fail("Cannot read marker data from temporary file.");
    }
    m_done = 0;
    return true;
}

bool StreamSource::next(std::span<IqSample> samples, std::span<quint8> markers)
{
    if (m_proceed && !m_proceed(m_done)) {
        return false;
    }
    m_block.resize(2 * samples.size());
    if (readSamples(m_data, m_block) != static_cast<int>(samples.size())) {
        return Tracer::fail("Cannot read I/Q data from temporary file.");
    }
    for (std::size_t k = 0; k < samples.size(); ++k) {
        samples[k] = {m_block[2 * k], m_block[2 * k + 1]};
    }
    const int markerCount = static_cast<int>(markers.size());
    if (markerCount > 0 && m_markers.readBlock(markerCount, markers.data()) != markerCount) {
        return Tracer::fail("Cannot read marker data from temporary file.");
    }
    m_done += static_cast<qint64>(samples.size());
    return true;
}
