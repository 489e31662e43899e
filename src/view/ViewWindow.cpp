// SPDX-License-Identifier: Apache-2.0
#include "ViewWindow.h"

#include "SpectrumLines.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <new>

void ViewWindow::setSource(BufferedIO *data, BufferedIO *markers, qint64 sampleCount)
{
    m_data = data;
    m_markerStream = markers;
    m_sampleCount = std::max<qint64>(sampleCount, 0);
    m_first = 0;
    m_points = static_cast<int>(std::min<qint64>(DefaultPoints, m_sampleCount));
    invalidate();
}

void ViewWindow::setMarkers(BufferedIO *markers)
{
    m_markerStream = markers;
    invalidate();
}

void ViewWindow::invalidate()
{
    m_samples.clear();
    m_markers.clear();
    m_page = {};
}

bool ViewWindow::isShowable(qint64 first) const
{
    if (m_data == nullptr || m_markerStream == nullptr) {
        return Tracer::fail("Internal errors: Buffers not available.");
    }
    if (m_points == 0) {
        return Tracer::fail("No number of display points.");
    }
    if (first < 0 || first >= m_sampleCount) {
        return Tracer::fail("Invalid start sample.");
    }
    return first + m_points <= m_sampleCount;
}

bool ViewWindow::show(qint64 first)
{
    if (!isShowable(first)) {
        return false;
    }
    if (!slide(first)) {
        invalidate();
        return false;
    }
    m_first = first;
    return true;
}

bool ViewWindow::slide(qint64 first)
{
    const qint64 end = first + m_points;
    const qint64 heldEnd = m_heldFirst + m_samples.size();
    const qint64 keptFrom = std::max(first, m_heldFirst);
    const qint64 keptEnd = std::min(end, heldEnd);
    IqList samples;
    QList<quint8> markers;
    if (keptFrom >= keptEnd) {
        if (!read({first, m_points}, samples, markers)) {
            return false;
        }
        m_samples = samples;
        m_markers = markers;
    } else {
        m_samples.remove(keptEnd - m_heldFirst, heldEnd - keptEnd);
        m_samples.remove(0, keptFrom - m_heldFirst);
        m_markers.remove(keptEnd - m_heldFirst, heldEnd - keptEnd);
        m_markers.remove(0, keptFrom - m_heldFirst);
        if (keptFrom > first) {
            if (!read({first, keptFrom - first}, samples, markers)) {
                return false;
            }
            m_samples = samples + m_samples;
            m_markers = markers + m_markers;
        }
        if (end > keptEnd) {
            if (!read({keptEnd, end - keptEnd}, samples, markers)) {
                return false;
            }
            m_samples += samples;
            m_markers += markers;
        }
    }
    m_heldFirst = first;
    if (m_samples.size() != m_points || m_markers.size() != m_points) {
        return Tracer::fail("Internal error. Invalid buffer length.");
    }
    return true;
}

bool ViewWindow::read(const Range &range, IqList &samples, QList<quint8> &markers)
{
    // Nothing else here can run out of memory.
    try {
        samples.resize(range.count);
        markers.resize(range.count);
        if (!loadPage(range)) {
            return false;
        }
    } catch (const std::bad_alloc &) {
        return Tracer::fail("Cannot create memory buffer.");
    }
    const auto offset = static_cast<std::size_t>(range.from - m_page.from);
    for (qint64 k = 0; k < range.count; ++k) {
        const std::size_t at = offset + static_cast<std::size_t>(k);
        samples[k] = {m_page.iq[2 * at], m_page.iq[2 * at + 1]};
        markers[k] = m_page.markers[at];
    }
    return true;
}

bool ViewWindow::loadPage(const Range &range)
{
    const qint64 held = static_cast<qint64>(m_page.markers.size());
    if (range.from >= m_page.from && range.from + range.count <= m_page.from + held) {
        return true;
    }
    m_page = {};
    const qint64 length = std::max(PageSamples, range.count);
    const qint64 centered = range.from + range.count / 2 - length / 2;
    m_page.from = bounded(std::min(centered, m_sampleCount - length));
    const qint64 count = std::min(length, m_sampleCount - m_page.from);
    m_page.iq.resize(2 * static_cast<std::size_t>(count));
    m_page.markers.resize(static_cast<std::size_t>(count));
    const qint64 wanted = range.from + range.count - m_page.from;
    const qint64 start = BufferedIO::HeaderSize + BufferedIO::RecordSize * m_page.from;
    const qint64 dataCount = m_data->restartAtPosition(start) ? readSamples(*m_data, m_page.iq) : 0;
    if (dataCount < wanted) {
        m_page = {};
        return Tracer::fail("Cannot read I/Q data from temporary file.");
    }
    const qint64 markerCount =
        m_markerStream->restartAtPosition(m_page.from)
            ? m_markerStream->readBlock(static_cast<int>(count), m_page.markers.data())
            : 0;
    if (markerCount < wanted) {
        m_page = {};
        return Tracer::fail("Cannot read marker data from temporary file.");
    }
    m_page.markers.resize(static_cast<std::size_t>(std::min(dataCount, markerCount)));
    return true;
}

bool ViewWindow::zoomIn(qint64 kept)
{
    const auto *next = std::lower_bound(ZoomLadder.begin(), ZoomLadder.end(), m_points);
    return setPoints(next == ZoomLadder.begin() ? m_points : *(next - 1), kept);
}

bool ViewWindow::zoomOut(qint64 kept)
{
    const auto *next = std::upper_bound(ZoomLadder.begin(), ZoomLadder.end(), m_points);
    return setPoints(next == ZoomLadder.end() ? m_points : *next, kept);
}

bool ViewWindow::setPoints(int points, qint64 kept)
{
    const int former = m_points;
    const qint64 center = m_first + m_points / 2;
    m_points = static_cast<int>(std::min<qint64>(points, m_sampleCount));
    if (kept < 0 || former < 1) {
        return show(centredOn(center));
    }
    const qint64 before = (kept - m_first) * m_points / former;
    return show(bounded(std::min(kept - before, m_sampleCount - m_points)));
}

IqList ViewWindow::around(qint64 count, qint64 &first)
{
    count = std::min(count, m_sampleCount);
    first = bounded(std::min(m_first + m_points / 2 - count / 2, m_sampleCount - count));
    IqList samples;
    QList<quint8> markers;
    if (count < 1 || !read({first, count}, samples, markers)) {
        return {};
    }
    return samples;
}

qint64 ViewWindow::centredOn(qint64 sample) const
{
    return bounded(std::min(sample - m_points / 2, m_sampleCount - m_points));
}

qint64 ViewWindow::playStep() const
{
    const qint64 step = littleStep();
    return step < SpectrumLines::FrameStep ? step : step - step % SpectrumLines::FrameStep;
}
