// SPDX-License-Identifier: Apache-2.0
#include "TrackPlay.h"

#include "SegmentBuffers.h"
#include "wholenumbers.h"

#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <cmath>
#include <limits>

namespace {

/// Shorter than the true one; the fades are defined with it.
constexpr double FadePi = 3.1415926535;

double fadeIn(int shape, double share)
{
    switch (shape) {
    case FadeLinear:
        return share;
    case FadeRaisedCosine:
        return 1 - (std::cos(FadePi * share) + 1) * 0.5;
    case FadeSquareRoot:
        return std::sqrt(share);
    case FadeBlank:
        return 0;
    default:
        return 1;
    }
}

/// Of a square root no mirror of the fade-in.
double fadeOut(int shape, double share)
{
    switch (shape) {
    case FadeLinear:
        return 1 - share;
    case FadeRaisedCosine:
        return (std::cos(FadePi * share) + 1) * 0.5;
    case FadeSquareRoot:
        return 1 - std::sqrt(share);
    case FadeBlank:
        return 0;
    default:
        return 1;
    }
}

qint64 fadeLength(double clockHz, double seconds, const char *label)
{
    const auto length = wholePart<qint32>(clockHz * seconds + 0.5);
    if (length > 0) {
        Tracer::Trace(Tracer::Debug,
                      QStringLiteral("%1: %2 samples").arg(QLatin1String(label)).arg(length));
    }
    return std::max(length, 0);
}

} // namespace

TrackPlay::TrackPlay(const Composition &composition, int track, int index,
                     const SegmentBorders &borders, qint64 sourceStart, SegmentBuffers &buffers)
    : m_track(track)
    , m_index(index)
    , m_borders(borders)
    , m_sourceStart(sourceStart)
    , m_buffers(buffers)
{
    const ComposerSegment &segment = *composition.segment(track, index);
    const double clockHz = composition.target.dUsrClk;
    m_usesMarkers = segment.bMkr;
    m_gain = std::pow(10.0, segment.dLOfs / -20);
    m_fadeIn.length = fadeLength(clockHz, segment.dFadeIn, "Fade-In  ");
    m_fadeIn.start = borders.first;
    m_fadeIn.shape = segment.iFadeIn;
    m_fadeOut.length = fadeLength(clockHz, segment.dFadeOut, "Fade-Out ");
    m_fadeOut.start = borders.last - m_fadeOut.length + 1;
    m_fadeOut.shape = segment.iFadeOut;
}

std::unique_ptr<TrackPlay> TrackPlay::start(const Composition &composition, int track, int index,
                                            const SegmentBorders &borders, SegmentBuffers &buffers)
{
    const ComposerSegment &segment = *composition.segment(track, index);
    return std::unique_ptr<TrackPlay>(
        new TrackPlay(composition, track, index, borders, segment.lStart, buffers));
}

std::unique_ptr<TrackPlay> TrackPlay::startWrapped(const Composition &composition, int track,
                                                   int index, const SegmentBorders &borders,
                                                   SegmentBuffers &buffers)
{
    const ComposerSegment &segment = *composition.segment(track, index);
    const qint64 length = composition.target.lSamples;
    const SegmentBorders wrapped{std::max<qint64>(borders.first - length, 0),
                                 borders.last - length};
    const qint64 played = length - segment.lTarget;
    qint64 sourceStart = segment.lStart;
    if (played > 0) {
        const double ratio = segment.dSrcClk / composition.target.dUsrClk;
        sourceStart = boundedSum(sourceStart, wholePart(static_cast<double>(played) * ratio));
    }
    return std::unique_ptr<TrackPlay>(
        new TrackPlay(composition, track, index, wrapped, sourceStart, buffers));
}

TrackPlay::~TrackPlay()
{
    close();
}

void TrackPlay::close()
{
    if (m_open) {
        static_cast<void>(m_buffers.release());
        m_open = false;
    }
}

QString TrackPlay::place() const
{
    return QStringLiteral("track %1, segment %2.").arg(m_track + 1).arg(m_index + 1);
}

bool TrackPlay::open()
{
    if (m_open) {
        return true;
    }
    BufferedIO &data = *m_buffers.data->stream();
    BufferedIO &markers = *m_buffers.markers->stream();
    if (!data.reinitBuf()) {
        return Tracer::fail(QStringLiteral("Cannot create buffer for data stream for ") + place());
    }
    if (!markers.reinitBuf()) {
        return Tracer::fail(QStringLiteral("Cannot create buffer for marker stream for ") +
                            place());
    }
    m_open = true;
    // No file holds more; a stream is at its end from there on.
    constexpr qint64 Farthest = std::numeric_limits<qint32>::max();
    const qint64 start = std::min(m_sourceStart, Farthest);
    if (!data.restartAtPosition(BufferedIO::RecordSize * start + BufferedIO::HeaderSize)) {
        return Tracer::fail(QStringLiteral("Cannot initialize data stream for ") + place());
    }
    return markers.restartAtPosition(start) ||
           Tracer::fail(QStringLiteral("Cannot initialize marker stream for ") + place());
}

bool TrackPlay::read(std::span<float> samples, std::atomic<bool> &warned)
{
    if (!open()) {
        return false;
    }
    const int bytes =
        m_buffers.data->stream()->readBlock(static_cast<int>(samples.size_bytes()), samples.data());
    if (bytes < 0) {
        return Tracer::fail(QStringLiteral("Cannot read data stream for ") + place());
    }
    const std::size_t got = 2 * static_cast<std::size_t>(bytes / BufferedIO::RecordSize);
    if (got < samples.size()) {
        std::fill(samples.begin() + static_cast<std::ptrdiff_t>(got), samples.end(), 0.0F);
        if (!warned.exchange(true)) {
            Tracer::Trace(Tracer::Warning,
                          QStringLiteral("The samples end before the segment does, which is silent "
                                         "from there on: ") +
                              place());
        }
    }
    return true;
}

bool TrackPlay::readMarkers(std::span<quint8> markers)
{
    if (!open()) {
        return false;
    }
    const int got =
        m_buffers.markers->stream()->readBlock(static_cast<int>(markers.size()), markers.data());
    if (got < 0) {
        return Tracer::fail(QStringLiteral("Cannot read marker stream for ") + place());
    }
    std::fill(markers.begin() + got, markers.end(), quint8{0});
    return true;
}

qint64 TrackPlay::nextFadeBorder(qint64 from) const
{
    qint64 next = std::numeric_limits<qint64>::max();
    for (const Fade &fade : {m_fadeIn, m_fadeOut}) {
        for (const qint64 border : {fade.start, fade.start + fade.length}) {
            next = border > from ? std::min(next, border) : next;
        }
    }
    return next;
}

bool TrackPlay::isFading(qint64 sample) const
{
    return m_fadeIn.contains(sample) || m_fadeOut.contains(sample);
}

void TrackPlay::weigh(qint64 first, std::span<double> factors) const
{
    for (std::size_t i = 0; i < factors.size(); ++i) {
        const qint64 sample = first + static_cast<qint64>(i);
        double factor = 1;
        if (m_fadeIn.contains(sample)) {
            factor = fadeIn(m_fadeIn.shape, m_fadeIn.share(sample));
        }
        if (m_fadeOut.contains(sample)) {
            factor *= fadeOut(m_fadeOut.shape, m_fadeOut.share(sample));
        }
        factors[i] = factor * m_gain;
    }
}
