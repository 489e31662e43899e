// SPDX-License-Identifier: Apache-2.0
#include "Composition.h"
#include "wholenumbers.h"

#include "log/Tracer.h"

#include <QFileInfo>

#include <utility>

namespace {

using Segments = std::vector<ComposerSegment>;

void detail(const QString &text)
{
    Tracer::Trace(Tracer::Debug, text);
}

void insertAt(Segments &segments, std::size_t index, const ComposerSegment &segment)
{
    segments.insert(segments.begin() + static_cast<std::ptrdiff_t>(index), segment);
}

/// Moves the segments from `index` on.
void shift(Segments &segments, std::size_t index, qint64 samples)
{
    for (std::size_t i = index; i < segments.size(); ++i) {
        segments[i].lTarget = boundedSum(segments[i].lTarget, samples);
    }
}

void clearWraps(ComposerTrack &track)
{
    for (ComposerSegment &segment : track.segments) {
        segment.bWrap = false;
    }
}

/// Target samples as source samples of a segment; what isn't a whole one is cut off.
qint64 sourceSamples(qint64 targetSamples, const ComposerSegment &segment, double clockHz)
{
    return wholePart(static_cast<double>(targetSamples) * (segment.dSrcClk / clockHz));
}

} // namespace

bool Composition::addTrack()
{
    if (trackCount() >= MaxTracks) {
        Tracer::Trace(Tracer::Error, "Cannot add more tracks.");
        return Tracer::fail("Maxumum number is 16 tracks.");
    }
    m_tracks.emplace_back();
    return true;
}

void Composition::deleteSelectedTracks()
{
    int removed = 0;
    for (std::size_t i = 0; i < m_tracks.size(); ++i) {
        if (m_tracks[i].bSelect) {
            m_tracks.erase(m_tracks.begin() + static_cast<std::ptrdiff_t>(i));
            ++removed;
            i = 0; // goes on at the second track: what slid into the first place stays
        }
    }
    Tracer::Trace(Tracer::Information, QStringLiteral("%1 tracks deleted.").arg(removed));
}

void Composition::clear()
{
    target.reset();
    m_tracks.clear();
}

bool Composition::mayPlace(const ComposerSegment &segment, const QString &what) const
{
    if (target.dUsrClk < 0) {
        return Tracer::fail(what + QStringLiteral(" Target clock rate is invalid."));
    }
    if (!(segment.dSrcClk > 0)) {
        return Tracer::fail(what + QStringLiteral(" Clock rate is invalid."));
    }
    return (segment.lUsed == segment.lSamples && segment.lUsed > 0) ||
           Tracer::fail(what + QStringLiteral(" Invalid sample count."));
}

bool Composition::insertSegment(const ComposerSegment &segment)
{
    if (!mayPlace(segment, QStringLiteral("Cannot insert segment."))) {
        return false;
    }
    const qint64 length = targetSamples(segment);
    for (ComposerTrack &track : m_tracks) {
        if (track.bSelect) {
            if (!insertInto(track, segment, length)) {
                return false;
            }
            clearWraps(track);
        }
    }
    return true;
}

bool Composition::insertInto(ComposerTrack &track, const ComposerSegment &segment,
                             qint64 length) const
{
    Segments &segments = track.segments;
    const qint64 position = segment.lTarget;
    for (std::size_t i = 0; i < segments.size(); ++i) {
        const auto borders = segmentBorders(segments[i]);
        if (!borders) {
            return false;
        }
        if (position <= borders->first) {
            insertAt(segments, i, segment);
            shift(segments, i + 1, length);
            return true;
        }
        if (position <= borders->last) {
            ComposerSegment rest = segments[i];
            const qint64 kept =
                sourceSamples(boundedDifference(position, rest.lTarget), rest, target.dUsrClk);
            segments[i].lUsed = kept;
            rest.lUsed = boundedDifference(rest.lUsed, kept);
            rest.lStart = boundedSum(rest.lStart, kept);
            rest.lTarget = boundedSum(position, length);
            insertAt(segments, i + 1, segment);
            insertAt(segments, i + 2, rest);
            shift(segments, i + 3, length);
            return true;
        }
    }
    segments.push_back(segment);
    return true;
}

bool Composition::overwriteSegment(const ComposerSegment &segment)
{
    if (!mayPlace(segment, QStringLiteral("Cannot overwrite with segment."))) {
        return false;
    }
    // Cut off here, and not rounded as the length of a segment is elsewhere.
    const qint64 length =
        wholePart(target.dUsrClk * static_cast<double>(segment.lSamples) / segment.dSrcClk);
    for (int i = 0; i < trackCount(); ++i) {
        ComposerTrack &track = m_tracks[static_cast<std::size_t>(i)];
        if (track.bSelect) {
            if (!overwriteInto(i, segment, length)) {
                return false;
            }
            clearWraps(track);
        }
    }
    return true;
}

bool Composition::overwriteInto(int track, const ComposerSegment &segment, qint64 length)
{
    Segments &segments = m_tracks[static_cast<std::size_t>(track)].segments;
    const qint64 position = segment.lTarget;
    for (std::size_t i = 0; i < segments.size(); ++i) {
        const auto borders = segmentBorders(segments[i]);
        if (!borders) {
            return false;
        }
        if (position < borders->first) {
            insertAt(segments, i, segment);
            return removeCovered(track, i + 1, boundedSum(position, length), segment.sName);
        }
        if (position <= borders->last) {
            return overwriteSplit(track, i, segment, length);
        }
    }
    segments.push_back(segment);
    return true;
}

bool Composition::overwriteSplit(int track, std::size_t index, const ComposerSegment &segment,
                                 qint64 length)
{
    Segments &segments = m_tracks[static_cast<std::size_t>(track)].segments;
    const qint64 end = boundedSum(segment.lTarget, length);
    ComposerSegment rest = segments[index];
    const qint64 kept =
        sourceSamples(boundedDifference(segment.lTarget, rest.lTarget), rest, target.dUsrClk);
    segments[index].lUsed = kept;
    detail(QStringLiteral("Segment %1 in track %2 updated.").arg(index + 1).arg(track + 1));
    detail(QStringLiteral(" ( Truncated to %1 samples. )").arg(kept));
    insertAt(segments, index + 1, segment);
    const qint64 covered = sourceSamples(length, rest, target.dUsrClk);
    const qint64 remaining = boundedDifference(boundedDifference(rest.lUsed, kept), covered);
    if (remaining <= 0) {
        detail(QStringLiteral("No remaining data from segment %1 in track %2.")
                   .arg(index + 1)
                   .arg(track + 1));
        return removeCovered(track, index + 2, end, segment.sName);
    }
    detail(QStringLiteral("Remaining fraction from segment %1 in track %2.")
               .arg(index + 1)
               .arg(track + 1));
    detail(QStringLiteral("  ( %1 samples starting at position %2 )").arg(remaining).arg(end));
    // The rest goes on in its source where the new segment began, not where that ends.
    rest.lStart = boundedSum(rest.lStart, kept);
    rest.lUsed = remaining;
    rest.lTarget = end;
    insertAt(segments, index + 2, rest);
    return removeCovered(track, index + 3, end, segment.sName);
}

bool Composition::removeCovered(int track, std::size_t index, qint64 end, const QString &coveredBy)
{
    Segments &segments = m_tracks[static_cast<std::size_t>(track)].segments;
    while (index < segments.size()) {
        ComposerSegment &covered = segments[index];
        const auto borders = segmentBorders(covered);
        if (!borders) {
            return Tracer::fail("Cannot get segment boundaries.");
        }
        if (end >= borders->last) {
            detail(
                QStringLiteral("Removing segment %1 from track %2").arg(index + 1).arg(track + 1));
            detail(QStringLiteral("  because '%1' ends at sample %2.")
                       .arg(coveredBy)
                       .arg(boundedSum(end, 1)));
            segments.erase(segments.begin() + static_cast<std::ptrdiff_t>(index));
            continue;
        }
        if (end >= borders->first) {
            const qint64 cut = sourceSamples(boundedSum(boundedDifference(end, borders->first), 1),
                                             covered, target.dUsrClk);
            covered.lStart = boundedSum(covered.lStart, cut);
            covered.lUsed = boundedDifference(covered.lUsed, cut);
            covered.lTarget = end;
        }
        ++index;
    }
    return true;
}

bool Composition::liftAt(qint64 sample)
{
    return removeAt(sample, false);
}

bool Composition::extractAt(qint64 sample)
{
    return removeAt(sample, true);
}

bool Composition::removeAt(qint64 sample, bool closesGap)
{
    for (ComposerTrack &track : m_tracks) {
        if (!track.bSelect) {
            continue;
        }
        for (std::size_t i = 0; i < track.segments.size(); ++i) {
            const auto borders = segmentBorders(track.segments[i]);
            if (!borders) {
                return false;
            }
            if (borders->contains(sample)) {
                track.segments.erase(track.segments.begin() + static_cast<std::ptrdiff_t>(i));
                if (closesGap) {
                    shift(track.segments, i, boundedDifference(0, borders->count()));
                }
                break;
            }
        }
    }
    return true;
}
