// SPDX-License-Identifier: Apache-2.0
#include "Composition.h"

#include "wholenumbers.h"

#include "log/Tracer.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <utility>

namespace {

/// Below this two clocks (Hz), or an offset and none, are the same.
constexpr double Tolerance = 1e-6;

void inform(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

/// A failure that the log counts as information only: the caller says what it means.
bool failQuietly(const char *text)
{
    Tracer::Trace(Tracer::Information, text);
    return false;
}

} // namespace

bool ComposerSegment::hasFrequencyOffset() const
{
    return std::fabs(dFOfs) > Tolerance;
}

bool ComposerSegment::hasLevelOffset() const
{
    return std::fabs(dLOfs) > Tolerance;
}

bool ComposerSegment::isTruncatedAtEnd() const
{
    return boundedSum(lStart, lUsed) < lSamples;
}

qint64 SegmentBorders::count() const
{
    return boundedSum(boundedDifference(last, first), 1);
}

void ComposerTarget::reset()
{
    const QString name = sName;
    *this = ComposerTarget();
    sName = name;
}

int Composition::segmentCount(int track) const
{
    return track >= 0 && track < trackCount()
               ? static_cast<int>(m_tracks[static_cast<std::size_t>(track)].segments.size())
               : 0;
}

ComposerTrack *Composition::track(int track)
{
    return track >= 0 && track < trackCount() ? &m_tracks[static_cast<std::size_t>(track)]
                                              : nullptr;
}

const ComposerSegment *Composition::segment(int track, int index) const
{
    return index >= 0 && index < segmentCount(track)
               ? &m_tracks[static_cast<std::size_t>(track)]
                      .segments[static_cast<std::size_t>(index)]
               : nullptr;
}

ComposerSegment *Composition::segment(int track, int index)
{
    return const_cast<ComposerSegment *>(std::as_const(*this).segment(track, index));
}

bool Composition::needsResampling(const ComposerSegment &segment) const
{
    return std::fabs(segment.dSrcClk - target.dUsrClk) > Tolerance;
}

qint64 Composition::timeToSample(double seconds) const
{
    if (target.dUsrClk < 0) {
        Tracer::Trace(Tracer::Error,
                      "Cannot convert time to sample number. Invalid target clock rate.");
        return -1;
    }
    return wholePart(seconds * target.dUsrClk);
}

double Composition::sampleToTime(qint64 samples) const
{
    if (target.dUsrClk < 0 || samples < 0) {
        Tracer::Trace(Tracer::Error,
                      "Cannot convert sample number to time. Invalid target clock rate.");
        return -1.0;
    }
    return static_cast<double>(samples) / target.dUsrClk;
}

bool Composition::setPlayTime(double seconds)
{
    if (!(seconds >= 0)) {
        return failQuietly("Cannot set target play time. Invalid time specified.");
    }
    if (!(target.dUsrClk > 0)) {
        return failQuietly("Cannot set target play time. Invalid target clock rate.");
    }
    target.lSamples = wholePart(seconds * target.dUsrClk);
    target.dTime = static_cast<double>(target.lSamples) / target.dUsrClk;
    return true;
}

qint64 Composition::scaledLength(const ComposerSegment &segment) const
{
    return wholePart(target.dUsrClk / segment.dSrcClk * static_cast<double>(segment.lUsed) + 0.5);
}

qint64 Composition::targetSamples(const ComposerSegment &segment) const
{
    if (target.dUsrClk < 0) {
        inform("Cannot determine target samples. Target clock rate is invalid.");
        return 0;
    }
    if (!(segment.dSrcClk > 0)) {
        inform("Cannot determine target samples. Segment clock rate is invalid.");
        return 0;
    }
    return scaledLength(segment);
}

std::optional<SegmentBorders> Composition::segmentBorders(const ComposerSegment &segment) const
{
    if (target.dUsrClk < 0) {
        inform("Cannot determine segment borders. Target clock rate is invalid.");
        return std::nullopt;
    }
    if (!(segment.dSrcClk > 0)) {
        inform("Cannot determine segment borders. Segment clock rate is invalid.");
        return std::nullopt;
    }
    return SegmentBorders{segment.lTarget,
                          boundedDifference(boundedSum(segment.lTarget, scaledLength(segment)), 1)};
}

bool Composition::setTargetClock(double clockHz)
{
    if (!(clockHz > 0)) {
        return failQuietly("Cannot set target clock rate. Invalid value specified.");
    }
    if (!(target.dUsrClk > 0)) {
        return failQuietly("Cannot set target clock rate. Current clock rate is invalid.");
    }
    const double ratio = clockHz / target.dUsrClk;
    target.dUsrClk = clockHz;
    target.lSamples = wholePart(clockHz * target.dTime + 0.5);
    for (ComposerTrack &track : m_tracks) {
        for (ComposerSegment &segment : track.segments) {
            segment.lTarget = wholePart(static_cast<double>(segment.lTarget) * ratio);
        }
    }
    return true;
}

double Composition::longestSegmentEnd() const
{
    if (!(target.dUsrClk > 0)) {
        Tracer::Trace(Tracer::Error,
                      "Cannot determine longest segment. Invalid target clock rate.");
        return -1.0;
    }
    double longest = 0;
    double end = 0;
    for (std::size_t i = 0; i < m_tracks.size(); ++i) {
        for (const ComposerSegment &segment : m_tracks[i].segments) {
            if (!(segment.dSrcClk > 0)) {
                Tracer::Trace(
                    Tracer::Error,
                    QStringLiteral("Cannot determine longest segment. Invalid segment clock "
                                   "rate in track %1.")
                        .arg(i + 1));
                return -1.0;
            }
            const double duration = static_cast<double>(segment.lUsed) / segment.dSrcClk;
            if (duration > longest) {
                longest = duration;
                end = static_cast<double>(segment.lTarget) / target.dUsrClk + duration;
            }
        }
    }
    inform(QStringLiteral("Longest segment is %1 s.").arg(end));
    return end;
}

double Composition::longestTrackEnd() const
{
    if (!(target.dUsrClk > 0)) {
        Tracer::Trace(Tracer::Error, "Cannot determine longest track. Invalid target clock rate.");
        return -1.0;
    }
    double longest = 0;
    for (std::size_t i = 0; i < m_tracks.size(); ++i) {
        if (m_tracks[i].segments.empty()) {
            continue;
        }
        const ComposerSegment &last = m_tracks[i].segments.back();
        if (!(last.dSrcClk > 0)) {
            Tracer::Trace(Tracer::Error,
                          QStringLiteral("Cannot determine longest track. Invalid segment clock "
                                         "rate in track %1.")
                              .arg(i + 1));
            return -1.0;
        }
        longest = std::max(longest, static_cast<double>(last.lTarget) / target.dUsrClk +
                                        static_cast<double>(last.lSamples) / last.dSrcClk);
    }
    inform(QStringLiteral("Longest track play time is %1 s.").arg(longest));
    return longest;
}

double Composition::highestClock() const
{
    double highest = 0;
    for (const ComposerTrack &track : m_tracks) {
        for (const ComposerSegment &segment : track.segments) {
            highest = std::max(highest, segment.dSrcClk);
        }
    }
    if (highest > 0) {
        return highest;
    }
    inform("Highest clock rate cannot be determined. Using 1 MHz.");
    return 1000000.0;
}

bool Composition::adjustTarget()
{
    if (target.bClk && !setTargetClock(highestClock())) {
        return false;
    }
    if (target.iLenMode != LongestTrackWins && target.iLenMode != LongestSegmentWins) {
        return true;
    }
    const double end =
        target.iLenMode == LongestTrackWins ? longestTrackEnd() : longestSegmentEnd();
    if (end < 0) {
        return Tracer::fail("Cannot adjust target waveform play time.");
    }
    return setPlayTime(end);
}

qint64 Composition::nearestBorder(qint64 position) const
{
    // Positions are compared by their low 32 bits, which hold all that can be rendered.
    const auto distance = [position](qint64 candidate) {
        return std::abs(static_cast<qint64>(static_cast<qint32>(candidate)) -
                        static_cast<qint64>(static_cast<qint32>(position)));
    };
    qint64 best = 0;
    const auto offer = [&](qint64 candidate) {
        if (distance(candidate) < distance(best)) {
            best = candidate;
        }
    };
    for (const ComposerTrack &track : m_tracks) {
        if (!track.bSelect) {
            continue;
        }
        for (const ComposerSegment &segment : track.segments) {
            const auto borders = segmentBorders(segment);
            if (!borders) {
                return -1;
            }
            if (best == 0) {
                best = borders->first;
            } else {
                offer(borders->first);
            }
            offer(boundedSum(borders->last, 1));
        }
    }
    offer(0);
    offer(target.lSamples);
    return best;
}

std::optional<SegmentPlace> Composition::segmentAt(int track, qint64 sample) const
{
    if (track < 0 || track >= trackCount()) {
        return std::nullopt;
    }
    const auto &segments = m_tracks[static_cast<std::size_t>(track)].segments;
    SegmentPlace place;
    for (std::size_t i = 0; i < segments.size(); ++i) {
        const auto borders = segmentBorders(segments[i]);
        if (!borders) {
            return std::nullopt;
        }
        if (borders->contains(sample)) {
            place.index = static_cast<int>(i);
            place.borders = *borders;
            if (i + 1 < segments.size()) {
                place.gapLast = boundedDifference(segments[i + 1].lTarget, 1);
            }
            return place;
        }
        place.gapFirst = boundedSum(borders->last, 1);
    }
    return std::nullopt;
}

void Composition::markAt(qint64 cursor, int track)
{
    for (int i = 0; i < trackCount(); ++i) {
        ComposerTrack &marked = m_tracks[static_cast<std::size_t>(i)];
        for (ComposerSegment &segment : marked.segments) {
            segment.selected = false;
        }
        if (!marked.bSelect || (track != -1 && track != i)) {
            continue;
        }
        if (const auto place = segmentAt(i, cursor)) {
            marked.segments[static_cast<std::size_t>(place->index)].selected = true;
        }
    }
}

EffectiveOffset Composition::effectiveOffset(const ComposerSegment &segment) const
{
    constexpr double Pi = 3.141592653589793;
    const double offset = segment.dFOfs;
    if (std::fabs(offset) < Tolerance) {
        return {};
    }
    if (!segment.bAdjOfs) {
        return {offset, false};
    }
    const double deviation = std::fabs(offset) * (segment.dAdjLim / 100);
    const double step = offset / target.dUsrClk * 2 * Pi;
    const auto count = static_cast<double>(targetSamples(segment));
    if (count == 0) {
        return {offset, false};
    }
    const double rotations = count * step / (2 * Pi);
    const double fraction = rotations - std::trunc(rotations);
    const double size = std::fabs(fraction);
    const double sign = fraction < 0 ? -1 : 1;
    // Back to the whole number of rotations, or on to the next one, over the whole segment.
    const double phase = (size < 0.5 ? sign * size * -2 : sign * (1 - size) * 2) * Pi;
    EffectiveOffset result{(phase / count + step) / (2 * Pi) * target.dUsrClk, false};
    if (result.hz < offset - deviation) {
        result = {offset - deviation, true};
    }
    if (result.hz > offset + deviation) {
        result = {offset + deviation, true};
    }
    return result;
}
